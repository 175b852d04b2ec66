#include "orvo/colour_engine/VantleProcedures.h"
#include "orvo/colour_engine/VantleShaderParameterData.h"
#include "orvo/colour_engine/internal/EngineFailure.h"
#include "orvo/colour_engine/internal/EngineProcedures.h"
#include "orvo/colour_engine/internal/HandleTable.h"
#include "orvo/colour_engine/internal/ShaderDescription.h"
#include "orvo/colour_engine/internal/Transform.h"

#include <atomic>
#include <cstring>
#include <iterator>
#include <memory>
#include <stdexcept>
#include <string>

namespace ORVO::ColourEngine::Internal {

namespace {

using Parameter = ShaderDescription::Parameter;

std::atomic<std::uint64_t> nDescribed{0};

std::shared_ptr<ShaderDescription const> findShader(VantleShader* pShader) {
    return HandleTable::instance().find<ShaderDescription>(pShader, HandleKind::Shader);
}

VantleString* newString(std::string const& sText) {
    return static_cast<VantleString*>(
        HandleTable::instance().add(HandleKind::String, std::make_shared<std::string const>(sText)));
}

VantleResult newShaderProc(std::uint32_t family, VantleTransform* pTransform,
                           _t_Vantle_Options const* /*pOptions*/, VantleShader** pOut) {
    return runProcedure([&] {
        auto const spTransform = HandleTable::instance().find<Transform>(pTransform, HandleKind::Transform);
        if (spTransform == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        if (pOut == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        if (family != VANTLE_SHADER_FAMILY) {
            return engineFailure(EngineFailure::UnknownShaderFamily);
        }
        try {
            auto spShader = std::make_shared<ShaderDescription const>(*spTransform->resolved());
            ++nDescribed;
            *pOut = static_cast<VantleShader*>(
                HandleTable::instance().add(HandleKind::Shader, std::move(spShader)));
        } catch (std::runtime_error const&) {
            return engineFailure(EngineFailure::NoTransform);
        }
        return VantleResult{0};
    });
}

VantleResult familyProc(VantleShader* pShader, std::uint32_t* pFamily) {
    return runProcedure([&] {
        if (findShader(pShader) == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        if (pFamily == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        *pFamily = VANTLE_SHADER_FAMILY;
        return VantleResult{0};
    });
}

VantleResult stringsProc(VantleShader* pShader, VantleString** pEntryPoint, VantleString** pCode) {
    return runProcedure([&] {
        auto const spShader = findShader(pShader);
        if (spShader == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        if (pEntryPoint == nullptr || pCode == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        VantleString* const pName = newString(spShader->entryPoint());
        try {
            *pCode = newString(spShader->code());
        } catch (...) {
            HandleTable::instance().release(pName, HandleKind::String);
            throw;
        }
        *pEntryPoint = pName;
        return VantleResult{0};
    });
}

VantleResult numParametersProc(VantleShader* pShader, std::uint32_t* pCount) {
    return runProcedure([&] {
        auto const spShader = findShader(pShader);
        if (spShader == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        if (pCount == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        *pCount = static_cast<std::uint32_t>(spShader->parameters().size());
        return VantleResult{0};
    });
}

bool isMatrix(Parameter const& parameter) {
    return parameter.record_.kind == _t_Vantle_ShaderParameterData::KIND_MATRIX_3X3 ||
           parameter.record_.kind == _t_Vantle_ShaderParameterData::KIND_MATRIX_4X4;
}

VantleResult parameterProc(VantleShader* pShader, std::uint32_t index, _t_Vantle_ShaderParameterData* pOut) {
    return runProcedure([&] {
        auto const spShader = findShader(pShader);
        if (spShader == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        if (pOut == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        if (index >= spShader->parameters().size()) {
            return engineFailure(EngineFailure::InvalidIndex);
        }
        Parameter const& parameter = spShader->parameters()[index];
        VantleString* const pName = newString(parameter.sName_);
        *pOut = parameter.record_;
        pOut->name = pName;
        pOut->data = isMatrix(parameter) ? nullptr : parameter.aData_.data();
        return VantleResult{0};
    });
}

VantleResult copyDataProc(VantleShader* pShader, std::uint32_t index, void* pTarget, std::uint32_t* pSize) {
    return runProcedure([&] {
        auto const spShader = findShader(pShader);
        if (spShader == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        if (pSize == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        if (index >= spShader->parameters().size()) {
            return engineFailure(EngineFailure::InvalidIndex);
        }
        auto const& aData = spShader->parameters()[index].aData_;
        *pSize = static_cast<std::uint32_t>(aData.size() * sizeof(float));
        if (pTarget != nullptr) {
            std::memcpy(pTarget, aData.data(), *pSize);
        }
        return VantleResult{0};
    });
}

constexpr char const* pShaderInterface = "VantleShaderInterface";

} // namespace

std::uint64_t nShadersDescribed() noexcept { return nDescribed; }

ProcedureSpan shaderProcedures() noexcept {
    static ProcedureEntry const aEntries[] = {
        {pShaderInterface, "NewShader", "VantleNewShaderProc", asAddress(&newShaderProc)},
        {pShaderInterface, "Family", "VantleFamilyProc", asAddress(&familyProc)},
        {pShaderInterface, "Strings", "VantleStringsProc", asAddress(&stringsProc)},
        {pShaderInterface, "NumParameters", "VantleNumParametersProc", asAddress(&numParametersProc)},
        {pShaderInterface, "Parameter", "VantleParameterProc", asAddress(&parameterProc)},
        {pShaderInterface, "CopyData", "VantleCopyDataProc", asAddress(&copyDataProc)},
    };
    return {aEntries, std::size(aEntries)};
}

} // namespace ORVO::ColourEngine::Internal
