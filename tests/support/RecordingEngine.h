/// A colour engine that stands before the embedded one: it hands every call on, counts it, and can make any
/// operation fail. It can also serve one shader of a test's own, with a record of the calls.
#pragma once

#include <algorithm>
#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "orvo/colour_engine/EmbeddedEngine.h"
#include "orvo/colour_engine/QuorProcedures.h"
#include "orvo/colour_engine/VantleProcedures.h"
#include "orvo/colour_engine/VantleShaderParameterData.h"
#include "orvo/core/CoreLibrary.h"

namespace ORVO::Test {

/// A table or matrix of a shader; the record's name and data are filled in by the engine.
struct ShaderTable {
    std::string sName_;
    _t_Vantle_ShaderParameterData record_{};
    std::vector<float> aData_;
};

/// What an engine says of a transform.
struct ShaderText {
    std::string sEntryPoint_;
    std::string sCode_;
    std::vector<ShaderTable> aTables_;
};

/// Threads: calls come from any; the rest is for the thread of the test.
class RecordingEngine {
public:
    RecordingEngine() = delete;

    /// Puts this engine before the embedded one, with nothing recorded. Between the start of the core and
    /// that of image flow.
    static void install() {
        reset();
        Core::Library::setQuorGetAddressProc(&address);
    }
    static void reset() {
        for (auto& nCalls : aCalls_)
            nCalls = 0;
        failing_ = 0;
        aLog_.clear();
        shader_ = {};
    }

    /// The engine's end: it no longer knows what it gave out, and nobody is to drop it.
    static void loseAll() {
        nTransforms_ = 0;
        nShaders_ = 0;
    }

    /// How often an operation was called, by its selector.
    static std::uint64_t calls(std::string const& sSelector) { return aCalls_[rowOf(sSelector)]; }
    /// All calls of the interface of shaders.
    static std::uint64_t shaderCalls() {
        return calls("NewShader") + calls("Strings") + calls("NumParameters") + calls("Parameter") +
               calls("CopyData");
    }
    /// From now on the operation answers with an error, "refused".
    static void fail(std::string const& sSelector) { failing_ |= 1U << rowOf(sSelector); }
    static void failNothing() { failing_ = 0; }

    /// The shader that ownTransform() has. May be changed between calls.
    static ShaderText& shader() { return shader_; }
    /// A transform that the embedded engine does not know.
    static VantleTransform* ownTransform() { return reinterpret_cast<VantleTransform*>(&nTransforms_); }
    /// References on it, shaders, and strings that were given out and not dropped.
    static int transforms() { return nTransforms_; }
    static int shaders() { return nShaders_; }
    static int strings() { return static_cast<int>(aStrings_.size()); }
    /// What was called for that shader, in order, with the numbers that were passed.
    static std::vector<std::string> const& log() { return aLog_; }

private:
    struct Text {
        std::string sText_;
    };

    template <std::size_t iRow, class Procedure>
    struct Hand;
    /// Hands a call on.
    template <std::size_t iRow, class... Arguments>
    struct Hand<iRow, VantleResult (*)(Arguments...)> {
        static VantleResult call(Arguments... arguments) {
            ++aCalls_[iRow];
            if ((failing_ & 1U << iRow) != 0)
                return refusal();
            if (auto const* const pOwn = own<iRow>(arguments...))
                return *pOwn;
            return reinterpret_cast<VantleResult (*)(Arguments...)>(aOriginals_[iRow])(arguments...);
        }
    };

    struct Row {
        char const* pInterface_;
        char const* pSelector_;
        char const* pProcName_;
        void* (*pProcedure_)();
    };
    template <std::size_t iRow, class Procedure>
    static void* handed() {
        return reinterpret_cast<void*>(&Hand<iRow, Procedure>::call);
    }

    enum : std::size_t {
        PROFILE_FROM_CODE,
        UN_REFERENCE_PROFILE,
        UN_REFERENCE_STRING,
        STRING_ASCII,
        MAKE_COLOR_TRANSFORM,
        REFERENCE_TRANSFORM,
        UN_REFERENCE_TRANSFORM,
        APPLY_GENERAL,
        OPTIMIZE_TRANSFORM,
        NEW_SHADER,
        STRINGS,
        NUM_PARAMETERS,
        PARAMETER,
        COPY_DATA,
        RELEASE,
        ROWS
    };

    static std::array<Row, ROWS> const& rows() {
        constexpr char const* pEngine = "VantleInterface2";
        constexpr char const* pShaders = "VantleShaderInterface";
        static constexpr std::array<Row, ROWS> aRows{{
            {pEngine, "ProfileFromCode", "Vantle_ProfileFromCodeProc2",
             handed<PROFILE_FROM_CODE, VantleProfileFromCodeProc>},
            {pEngine, "UnReferenceProfile", "Vantle_UnReferenceProfileProc2",
             handed<UN_REFERENCE_PROFILE, VantleUnReferenceProfileProc>},
            {pEngine, "UnReferenceString", "Vantle_UnReferenceStringProc2",
             handed<UN_REFERENCE_STRING, VantleUnReferenceStringProc>},
            {pEngine, "StringASCII", "Vantle_StringASCIIProc2", handed<STRING_ASCII, VantleStringASCIIProc>},
            {pEngine, "MakeColorTransform", "Vantle_MakeColorTransformProc2",
             handed<MAKE_COLOR_TRANSFORM, VantleMakeColorTransformProc>},
            {pEngine, "ReferenceTransform", "Vantle_ReferenceTransformProc2",
             handed<REFERENCE_TRANSFORM, VantleReferenceTransformProc>},
            {pEngine, "UnReferenceTransform", "Vantle_UnReferenceTransformProc2",
             handed<UN_REFERENCE_TRANSFORM, VantleUnReferenceTransformProc>},
            {pEngine, "ApplyGeneral", "Vantle_ApplyGeneralProc2",
             handed<APPLY_GENERAL, VantleApplyGeneralProc>},
            {pEngine, "OptimizeTransform", "Vantle_OptimizeTransformProc2",
             handed<OPTIMIZE_TRANSFORM, VantleOptimizeTransformProc>},
            {pShaders, "NewShader", "VantleNewShaderProc", handed<NEW_SHADER, VantleNewShaderProc>},
            {pShaders, "Strings", "VantleStringsProc", handed<STRINGS, VantleStringsProc>},
            {pShaders, "NumParameters", "VantleNumParametersProc",
             handed<NUM_PARAMETERS, VantleNumParametersProc>},
            {pShaders, "Parameter", "VantleParameterProc", handed<PARAMETER, VantleParameterProc>},
            {pShaders, "CopyData", "VantleCopyDataProc", handed<COPY_DATA, VantleCopyDataProc>},
            {"QuorContainerInterface", "Release", "QuorReleaseProc",
             handed<RELEASE, QuorContainerReleaseProc>},
        }};
        return aRows;
    }

    static std::size_t rowOf(std::string const& sSelector) {
        std::size_t iRow = 0;
        while (sSelector != rows().at(iRow).pSelector_)
            ++iRow;
        return iRow;
    }

    static void* address(char const* pInterface, char const* pSelector, char const* pProcName) {
        void* const pOriginal = ColourEngine::embeddedEngine()(pInterface, pSelector, pProcName);
        for (std::size_t iRow = 0; iRow < ROWS; ++iRow) {
            Row const& row = rows()[iRow];
            if (std::strcmp(row.pInterface_, pInterface) == 0 &&
                std::strcmp(row.pSelector_, pSelector) == 0 && std::strcmp(row.pProcName_, pProcName) == 0) {
                aOriginals_[iRow] = pOriginal;
                return row.pProcedure_();
            }
        }
        return pOriginal;
    }

    static VantleResult refusal() {
        QuorError* pError = nullptr;
        reinterpret_cast<QuorNewErrorProc>(ColourEngine::embeddedEngine()(
            "QuorErrorInterface", "NewError", "QuorNewErrorProc"))(&pError, "refused", "test");
        return reinterpret_cast<VantleResult>(pError);
    }

    // The own shader. Null for what is the embedded engine's.

    static VantleResult const* done() {
        static constexpr VantleResult nDone = 0;
        return &nDone;
    }
    static VantleResult const* done(std::string sLine) {
        aLog_.push_back(std::move(sLine));
        return done();
    }
    static bool isOwn(VantleShader const* pShader) { return static_cast<void const*>(pShader) == &nShaders_; }
    static bool isOwn(VantleTransform const* pTransform) {
        return static_cast<void const*>(pTransform) == &nTransforms_;
    }
    static VantleString* newString(std::string const& sText) {
        auto* const pString = reinterpret_cast<VantleString*>(new Text{sText});
        aStrings_.insert(pString);
        return pString;
    }

    template <std::size_t iRow, class First, class... Arguments>
    static VantleResult const* own(First first, [[maybe_unused]] Arguments... arguments) {
        if constexpr (iRow == REFERENCE_TRANSFORM || iRow == UN_REFERENCE_TRANSFORM) {
            if (!isOwn(first))
                return nullptr;
            nTransforms_ += iRow == REFERENCE_TRANSFORM ? 1 : -1;
            return done(rows()[iRow].pSelector_);
        } else if constexpr (iRow == STRING_ASCII || iRow == UN_REFERENCE_STRING) {
            return aStrings_.count(first) != 0 ? ownString(first, arguments...) : nullptr;
        } else if constexpr (iRow == NEW_SHADER) {
            return ownShader(first, arguments...);
        } else if constexpr (iRow == RELEASE) {
            if (static_cast<void*>(first) != &nShaders_)
                return nullptr;
            --nShaders_;
            return done("Release");
        } else if constexpr (iRow >= STRINGS && iRow <= COPY_DATA) {
            return isOwn(first) ? ownAnswer(Tag<iRow>(), arguments...) : nullptr;
        } else {
            return nullptr;
        }
    }

    template <std::size_t iRow>
    struct Tag {};

    static VantleResult const* ownShader(std::uint32_t family, VantleTransform* pTransform,
                                         _t_Vantle_Options const* pOptions, VantleShader** pOut) {
        if (!isOwn(pTransform))
            return nullptr;
        ++nShaders_;
        *pOut = reinterpret_cast<VantleShader*>(&nShaders_);
        return done("NewShader " + std::to_string(family) + (pOptions != nullptr ? " options" : ""));
    }
    static VantleResult const* ownString(VantleString* pString, char* pBuffer, std::uint32_t* pSize,
                                         std::uint32_t capacity) {
        std::string const& sText = reinterpret_cast<Text*>(pString)->sText_;
        *pSize = static_cast<std::uint32_t>(sText.size());
        if (pBuffer != nullptr)
            std::memcpy(pBuffer, sText.data(), std::min<std::size_t>(capacity, sText.size()));
        return done(std::string("StringASCII ") + (pBuffer != nullptr ? "text " : "size ") +
                    std::to_string(capacity));
    }
    static VantleResult const* ownString(VantleString* pString) {
        aStrings_.erase(pString);
        delete reinterpret_cast<Text*>(pString);
        return done("UnReferenceString");
    }
    static VantleResult const* ownAnswer(Tag<STRINGS>, VantleString** pEntryPoint, VantleString** pCode) {
        *pEntryPoint = newString(shader_.sEntryPoint_);
        *pCode = newString(shader_.sCode_);
        return done("Strings");
    }
    static VantleResult const* ownAnswer(Tag<NUM_PARAMETERS>, std::uint32_t* pCount) {
        *pCount = static_cast<std::uint32_t>(shader_.aTables_.size());
        return done("NumParameters");
    }
    static VantleResult const* ownAnswer(Tag<PARAMETER>, std::uint32_t index,
                                         _t_Vantle_ShaderParameterData* pOut) {
        ShaderTable const& table = shader_.aTables_.at(index);
        void const* const pStated = table.record_.data;
        *pOut = table.record_;
        pOut->name = newString(table.sName_);
        pOut->data = table.aData_.empty() ? pStated : table.aData_.data();
        return done("Parameter " + std::to_string(index));
    }
    static VantleResult const* ownAnswer(Tag<COPY_DATA>, std::uint32_t index, void* pTarget,
                                         std::uint32_t* pSize) {
        std::vector<float> const& aData = shader_.aTables_.at(index).aData_;
        *pSize = static_cast<std::uint32_t>(aData.size() * sizeof(float));
        if (pTarget != nullptr)
            std::memcpy(pTarget, aData.data(), *pSize);
        return done("CopyData " + std::to_string(index) + (pTarget != nullptr ? " data" : " size"));
    }

    static inline std::array<void*, ROWS> aOriginals_{};
    static inline std::array<std::atomic<std::uint64_t>, ROWS> aCalls_{};
    static inline std::atomic<std::uint32_t> failing_{0};
    static inline ShaderText shader_;
    static inline std::vector<std::string> aLog_;
    static inline std::set<VantleString*> aStrings_;
    static inline int nTransforms_ = 0;
    static inline int nShaders_ = 0;
};

} // namespace ORVO::Test
