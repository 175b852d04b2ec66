#include "orvo/image_flow/filters/VantleShaderAdapter.h"

#include "orvo/colour_engine/VantleProcedures.h"
#include "orvo/core/Check.h"
#include "orvo/image_flow/colour/CQuorError.h"
#include "orvo/image_flow/colour/CVantle.h"
#include "orvo/image_flow/colour/CVantleShader.h"
#include "orvo/image_flow/colour/QuorClient.h"
#include "orvo/image_flow/colour/TrelException.h"

#include <algorithm>
#include <cstdint>
#include <utility>

namespace ORVO {

namespace {

using Quor_T_MT::checkQuorResult;

constexpr std::uint32_t nEntryPointCapacity = 1024;
constexpr std::uint32_t nCodeCapacity = 8192;
constexpr std::uint32_t nMaximumMatrixBytes = 16 * sizeof(float);

/// A string of the engine's, dropped at the end of the scope unless it was before.
class EngineString {
public:
    EngineString() = default;
    explicit EngineString(VantleString* pString) : pString_(pString) {}
    EngineString(EngineString const&) = delete;
    EngineString& operator=(EngineString const&) = delete;
    ~EngineString() { drop(); }

    void drop() noexcept {
        VantleString* const pDropped = std::exchange(pString_, nullptr);
        try {
            if (pDropped != nullptr) {
                CVantle::UnReferenceString(pDropped);
            }
        } catch (...) { // The engine is gone, and the string with it.
            return;
        }
    }

    VantleString** out() { return &pString_; }

    /// @param nCapacity what the engine is told that there is room for, when it is asked for the length.
    std::string text(std::uint32_t nCapacity) const {
        std::uint32_t nSize = 0;
        checkQuorResult(CVantle::StringASCII(pString_, nullptr, &nSize, nCapacity));
        std::string sText(nSize, '\0');
        if (nSize > 0) {
            checkQuorResult(CVantle::StringASCII(pString_, sText.data(), &nSize, nSize));
        }
        // An engine may count an end mark.
        sText.resize(std::min<std::size_t>(nSize, sText.size()));
        sText.resize(std::min(sText.find('\0'), sText.size()));
        return sText;
    }

private:
    VantleString* pString_ = nullptr;
};

} // namespace

VantleShaderAdapter::VantleShaderAdapter() : iGeneration_(ImageFlow::QuorClient::generation()) {}

VantleShaderAdapter::VantleShaderAdapter(VantleTransform* transform, _t_Vantle_Options const* options)
    : iGeneration_(ImageFlow::QuorClient::generation()) {
    if (transform == nullptr) {
        return;
    }
    try {
        checkQuorResult(CVantle::ReferenceTransform(transform));
        vantleTransform_ = transform;
        checkQuorResult(CVantleShader::NewShader(VANTLE_SHADER_FAMILY, transform, options, &vantleShader_));
    } catch (Quor_T_MT::CQuorError const&) {
        vantleShader_ = nullptr;
    } catch (TrelException const&) {
        vantleShader_ = nullptr;
    } catch (...) {
        release();
        throw;
    }
    if (vantleShader_ == nullptr) {
        release();
    }
}

VantleShaderAdapter::~VantleShaderAdapter() { release(); }

void VantleShaderAdapter::release() noexcept {
    VantleShader* const pShader = std::exchange(vantleShader_, nullptr);
    VantleTransform* const pTransform = std::exchange(vantleTransform_, nullptr);
    if (iGeneration_ != ImageFlow::QuorClient::generation()) {
        return; // The handles of one engine say nothing to another one.
    }
    CVantleShader::release(pShader);
    try {
        if (pTransform != nullptr) {
            CVantle::UnReferenceTransform(pTransform);
        }
    } catch (...) { // The engine is gone, and the transform with it.
        return;
    }
}

bool VantleShaderAdapter::isBound() const noexcept {
    return vantleShader_ != nullptr && iGeneration_ == ImageFlow::QuorClient::generation();
}

bool VantleShaderAdapter::isValid() { return isBound(); }

void VantleShaderAdapter::getShaderInfo(std::string& entryPoint, std::string& code) {
    ORVO_CHECK(isBound(), "vantleShader_ != NULL");
    EngineString entryPointString;
    EngineString codeString;
    checkQuorResult(CVantleShader::Strings(vantleShader_, entryPointString.out(), codeString.out()));
    std::string sEntryPoint = entryPointString.text(nEntryPointCapacity);
    entryPointString.drop();
    code = codeString.text(nCodeCapacity);
    entryPoint.swap(sEntryPoint);
}

_t_Vantle_ShaderParameterData VantleShaderAdapter::getParameter(unsigned index, std::string& name) {
    ORVO_CHECK(isBound(), "vantleShader_ != NULL");
    _t_Vantle_ShaderParameterData parameter{};
    checkQuorResult(CVantleShader::Parameter(vantleShader_, index, &parameter));
    EngineString const nameString(parameter.name);
    parameter.name = nullptr;
    name = nameString.text(nEntryPointCapacity);
    return parameter;
}

void VantleShaderAdapter::copyMatrixData(float* target, unsigned index, unsigned& size) {
    ORVO_CHECK(isBound(), "vantleShader_ != NULL");
    std::uint32_t nBytes = 0;
    checkQuorResult(CVantleShader::CopyData(vantleShader_, index, nullptr, &nBytes));
    if (nBytes <= nMaximumMatrixBytes) {
        checkQuorResult(CVantleShader::CopyData(vantleShader_, index, target, &nBytes));
    }
    size = nBytes;
}

unsigned VantleShaderAdapter::numParameters() {
    ORVO_CHECK(isBound(), "vantleShader_ != NULL");
    std::uint32_t nCount = 0;
    checkQuorResult(CVantleShader::NumParameters(vantleShader_, &nCount));
    return nCount;
}

} // namespace ORVO
