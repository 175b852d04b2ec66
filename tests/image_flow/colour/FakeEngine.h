/// A colour engine that computes nothing: it records what it is asked for, by name and by call, and answers
/// as told.
#pragma once

#include "orvo/colour_engine/QuorProcedures.h"
#include "orvo/colour_engine/VantleProcedures.h"

#include <cstdint>
#include <map>
#include <set>
#include <sstream>
#include <string>
#include <vector>

namespace ORVO::Test {

/// An error object of the fake engine.
struct FakeError {
    std::string sText_;
    std::string sComponent_;
    int nReferences_ = 1;
};

/// Threads: the thread of the test.
class FakeEngine {
public:
    FakeEngine() = delete;

    /// Forgets everything that was recorded and told.
    static void reset() {
        aAsked_.clear();
        aCalls_.clear();
        aMissing_.clear();
        aResults_.clear();
        nUnregistered_ = 7;
        bNewVersion_ = false;
        nAtoms_ = 0;
        methodResult_ = nullptr;
        bCountRefused_ = false;
        pWhenAsked_ = nullptr;
        pWhenCalled_ = nullptr;
        nReferences_ = 0;
        error_ = FakeError{"no such thing", "Fake"};
    }

    /// What was asked for, as "interface/selector/procedure".
    static std::vector<std::string>& asked() { return aAsked_; }
    /// What was called, as "selector argument argument...", pointers as numbers.
    static std::vector<std::string>& calls() { return aCalls_; }
    /// The selectors (of the interface) that are not served, as "interface/selector".
    static std::set<std::string>& missing() { return aMissing_; }
    /// What an operation answers, by selector, instead of 0.
    static std::map<std::string, VantleResult>& results() { return aResults_; }
    /// The error object of the engine, and the result that stands for it.
    static FakeError& error() { return error_; }
    static VantleResult failure() { return reinterpret_cast<VantleResult>(&error_); }
    /// The counter, which an engine raises when an interface goes.
    static void unregister() { ++nUnregistered_; }
    static std::uint32_t unregistered() { return nUnregistered_; }
    /// From now on "ReferenceTransform" is another procedure, which calls itself "ReferenceTransformAnew".
    static void serveNewVersion() { bNewVersion_ = true; }
    static int atoms() { return nAtoms_; }
    static void setMethod(void* pMethod) { methodResult_ = pMethod; }
    static void refuseCount() { bCountRefused_ = true; }
    /// Runs before each answer, with the "interface/selector" that is asked for.
    static void whenAsked(void (*pHook)(std::string const&)) { pWhenAsked_ = pHook; }
    /// Runs behind each operation, with its selector.
    static void whenCalled(void (*pHook)(std::string const&)) { pWhenCalled_ = pHook; }
    /// How many references on profiles, transforms and shaders are out.
    static int references() { return nReferences_; }

    static void* address(char const* pInterface, char const* pSelector, char const* pProcName) {
        std::string const sName = std::string(pInterface) + "/" + pSelector;
        aAsked_.push_back(sName + "/" + pProcName);
        if (pWhenAsked_ != nullptr) {
            pWhenAsked_(sName);
        }
        if (aMissing_.count(sName) != 0) {
            return nullptr;
        }
        if (bNewVersion_ && sName == "VantleInterface2/ReferenceTransform") {
            return of<VantleReferenceTransformProc>(
                [](auto* p) { return record("ReferenceTransformAnew", p); });
        }
        auto const found = procedures().find(sName + "/" + pProcName);
        return found != procedures().end() ? found->second : nullptr;
    }

    template <typename Handle>
    static Handle* handle(std::uintptr_t number) {
        return reinterpret_cast<Handle*>(number);
    }

private:
    template <typename Value>
    static void say(std::ostringstream& text, Value const& value) {
        text << ' ' << value;
    }
    template <typename Value>
    static void say(std::ostringstream& text, Value* pValue) {
        text << ' ' << reinterpret_cast<std::uintptr_t>(pValue);
    }

    template <typename... Arguments>
    static VantleResult record(char const* pSelector, Arguments... arguments) {
        std::ostringstream text;
        text << pSelector;
        (say(text, arguments), ...);
        aCalls_.push_back(text.str());
        if (pWhenCalled_ != nullptr) {
            pWhenCalled_(pSelector);
        }
        auto const found = aResults_.find(pSelector);
        return found != aResults_.end() ? found->second : 0;
    }

    /// Gives the number out where the operation succeeds.
    template <typename Handle>
    static VantleResult give(Handle** pOut, std::uintptr_t number, VantleResult result) {
        if (result == 0) {
            *pOut = handle<Handle>(number);
            ++nReferences_;
        }
        return result;
    }

    template <typename Procedure>
    static void* of(Procedure pProcedure) {
        return reinterpret_cast<void*>(pProcedure);
    }

    static void addLayer(std::map<std::string, void*>& a) {
        a["Quor/QuorRegisterProcAddress/QuorRegisterProcAddress"] =
            of<QuorRegisterProcAddressProc>([](auto, auto, auto, auto) { return VantleResult{0}; });
        a["Quor/QuorReportError/QuorReportError"] =
            of<QuorReportErrorProc>([](auto) { return VantleResult{0}; });
        a["Quor/QuorUnregisterInterface/QuorUnregisterInterface"] =
            of<QuorUnregisterInterfaceProc>([](auto) { return VantleResult{0}; });
        a["Quor/QuorGetUnregisterCountAddr/QuorGetUnregisterCountAddr"] =
            of<QuorGetUnregisterCountAddrProc>([](std::uint32_t** pOut) {
                *pOut = &nUnregistered_;
                return VantleResult{bCountRefused_ ? 1U : 0U};
            });
        a["Quor/QuorIsMultiThreaded/QuorIsMultiThreaded"] = of<QuorIsMultiThreadedProc>([] { return 1U; });
    }

    static void addContainers(std::map<std::string, void*>& a) {
        std::string const s = "QuorContainerInterface/";
        a[s + "AddRef/QuorAddRefProc"] =
            of<QuorContainerAddRefProc>([](auto* p) { return record("AddRef", p); });
        a[s + "Release/QuorReleaseProc"] = of<QuorContainerReleaseProc>([](auto* p) {
            --nReferences_;
            return record("Release", p);
        });
        a[s + "GetMethod/QuorGetMethodV3Proc"] = of<QuorContainerGetMethodProc>(
            [](void** pOut, auto* pObject, auto* pSelector, auto* pProcName, std::uint32_t notRequired) {
                *pOut = methodResult_;
                return record("GetMethod", pObject, atomText(pSelector), atomText(pProcName), notRequired);
            });
    }

    static void addErrors(std::map<std::string, void*>& a) {
        std::string const s = "QuorErrorInterface/";
        a[s + "NewError/QuorNewErrorProc"] =
            of<QuorNewErrorProc>([](QuorError** pOut, char const* pText, char const* pComponent) {
                error_ = FakeError{pText, pComponent, 1};
                *pOut = reinterpret_cast<QuorError*>(&error_);
                return record("NewError", "'" + std::string(pText) + "'", std::string(pComponent));
            });
        a[s + "AddRef/QuorErrorAddRefProc"] = of<QuorErrorAddRefProc>([](QuorError* pError) {
            error_.nReferences_ += isError(pError) ? 1 : 0;
            return VantleResult{0};
        });
        a[s + "Release/QuorErrorReleaseProc"] = of<QuorErrorReleaseProc>([](QuorError* pError) {
            error_.nReferences_ -= isError(pError) ? 1 : 0;
            return VantleResult{0};
        });
        a[s + "GetErrorMessage/QuorGetErrorMessageProc"] =
            of<QuorGetErrorMessageProc>([](QuorError* pError, char const** pText) {
                if (!isError(pError)) {
                    return VantleResult{1};
                }
                *pText = error_.sText_.c_str();
                return VantleResult{0};
            });
        a[s + "GetComponent/QuorGetComponentProc"] =
            of<QuorGetComponentProc>([](QuorError* pError, char const** pText) {
                *pText = error_.sComponent_.c_str();
                return VantleResult{isError(pError) ? 0U : 1U};
            });
    }

    static void addAtomsAndMemory(std::map<std::string, void*>& a) {
        std::string const s = "QuorStringInterface/";
        a[s + "NewStringAtom/QuorNewStringAtomProc"] =
            of<QuorNewStringAtomProc>([](QuorStringAtom** pOut, char const* pText) {
                ++nAtoms_;
                *pOut = reinterpret_cast<QuorStringAtom*>(new std::string(pText));
                return VantleResult{0};
            });
        a[s + "DeleteStringAtom/QuorDeleteStringAtomProc"] =
            of<QuorDeleteStringAtomProc>([](QuorStringAtom* pAtom) {
                --nAtoms_;
                delete reinterpret_cast<std::string*>(pAtom);
                return VantleResult{0};
            });
        a[s + "GetCString/QuorGetCStringProc"] =
            of<QuorGetCStringProc>([](auto, auto) { return VantleResult{0}; });
        a[s + "AddRef/QuorStringAtomAddRefProc"] =
            of<QuorStringAtomAddRefProc>([](auto) { return VantleResult{0}; });
        std::string const m = "QuorMemoryInterface/";
        a[m + "Alloc/QuorAllocProc"] = of<QuorAllocProc>([](auto, auto) { return VantleResult{0}; });
        a[m + "Realloc/QuorReallocProc"] = of<QuorReallocProc>([](auto, auto) { return VantleResult{0}; });
        a[m + "Free/QuorFreeProc"] = of<QuorFreeProc>([](auto) { return VantleResult{0}; });
        a[m + "GetBlockSize/QuorGetBlockSizeProc"] =
            of<QuorGetBlockSizeProc>([](auto, auto) { return VantleResult{0}; });
    }

    static void addEngine(std::map<std::string, void*>& a) {
        std::string const s = "VantleInterface2/";
        a[s + "ProfileFromCode/Vantle_ProfileFromCodeProc2"] =
            of<VantleProfileFromCodeProc>([](VantleProfile** pOut, std::uint32_t code) {
                return give(pOut, 1000 + code, record("ProfileFromCode", code));
            });
        a[s + "UnReferenceProfile/Vantle_UnReferenceProfileProc2"] =
            of<VantleUnReferenceProfileProc>([](auto* p) {
                --nReferences_;
                return record("UnReferenceProfile", p);
            });
        a[s + "UnReferenceString/Vantle_UnReferenceStringProc2"] =
            of<VantleUnReferenceStringProc>([](auto* p) { return record("UnReferenceString", p); });
        a[s + "StringASCII/Vantle_StringASCIIProc2"] = of<VantleStringASCIIProc>(
            [](auto* p, char* pBuffer, std::uint32_t* pSize, std::uint32_t capacity) {
                return record("StringASCII", p, static_cast<void*>(pBuffer), pSize, capacity);
            });
        a[s + "MakeColorTransform/Vantle_MakeColorTransformProc2"] =
            of<VantleMakeColorTransformProc>([](VantleTransform** pOut, auto* pSource, auto* pDestination,
                                                std::uint32_t intent, std::uint32_t options) {
                return give(pOut, 2000, record("MakeColorTransform", pSource, pDestination, intent, options));
            });
        a[s + "ReferenceTransform/Vantle_ReferenceTransformProc2"] =
            of<VantleReferenceTransformProc>([](auto* p) {
                ++nReferences_;
                return record("ReferenceTransform", p);
            });
        a[s + "UnReferenceTransform/Vantle_UnReferenceTransformProc2"] =
            of<VantleUnReferenceTransformProc>([](auto* p) {
                --nReferences_;
                return record("UnReferenceTransform", p);
            });
        a[s + "ApplyGeneral/Vantle_ApplyGeneralProc2"] =
            of<VantleApplyGeneralProc>([](auto* p, auto const* pSource, auto const* pDestination,
                                          std::uint32_t rows, std::uint32_t columns, auto const* pOptions) {
                return record("ApplyGeneral", p, pSource, pDestination, rows, columns, pOptions);
            });
        a[s + "OptimizeTransform/Vantle_OptimizeTransformProc2"] =
            of<VantleOptimizeTransformProc>([](VantleTransform** pOut, auto* p, std::uint32_t options) {
                return give(pOut, 3000, record("OptimizeTransform", p, options));
            });
    }

    static void addShaders(std::map<std::string, void*>& a) {
        std::string const s = "VantleShaderInterface/";
        a[s + "NewShader/VantleNewShaderProc"] = of<VantleNewShaderProc>(
            [](std::uint32_t family, auto* p, auto const* pOptions, VantleShader** pOut) {
                return give(pOut, 4000, record("NewShader", family, p, pOptions));
            });
        a[s + "Family/VantleFamilyProc"] =
            of<VantleFamilyProc>([](auto* p, auto* pOut) { return record("Family", p, pOut); });
        a[s + "Strings/VantleStringsProc"] = of<VantleStringsProc>(
            [](auto* p, auto** pEntry, auto** pCode) { return record("Strings", p, pEntry, pCode); });
        a[s + "NumParameters/VantleNumParametersProc"] =
            of<VantleNumParametersProc>([](auto* p, auto* pOut) { return record("NumParameters", p, pOut); });
        a[s + "Parameter/VantleParameterProc"] = of<VantleParameterProc>(
            [](auto* p, std::uint32_t index, auto* pOut) { return record("Parameter", p, index, pOut); });
        a[s + "CopyData/VantleCopyDataProc"] =
            of<VantleCopyDataProc>([](auto* p, std::uint32_t index, auto* pTarget, auto* pSize) {
                return record("CopyData", p, index, pTarget, pSize);
            });
    }

    static std::map<std::string, void*> const& procedures() {
        static std::map<std::string, void*> const aProcedures = [] {
            std::map<std::string, void*> a;
            addLayer(a);
            addContainers(a);
            addErrors(a);
            addAtomsAndMemory(a);
            addEngine(a);
            addShaders(a);
            return a;
        }();
        return aProcedures;
    }

    static bool isError(QuorError* pError) { return reinterpret_cast<FakeError*>(pError) == &error_; }
    static std::string atomText(QuorStringAtom* pAtom) { return *reinterpret_cast<std::string*>(pAtom); }

    static inline std::vector<std::string> aAsked_;
    static inline std::vector<std::string> aCalls_;
    static inline std::set<std::string> aMissing_;
    static inline std::map<std::string, VantleResult> aResults_;
    static inline FakeError error_;
    static inline std::uint32_t nUnregistered_ = 0;
    static inline bool bNewVersion_ = false;
    static inline int nAtoms_ = 0;
    static inline void* methodResult_ = nullptr;
    static inline bool bCountRefused_ = false;
    static inline void (*pWhenAsked_)(std::string const&) = nullptr;
    static inline void (*pWhenCalled_)(std::string const&) = nullptr;
    static inline int nReferences_ = 0;
};

/// The binding to the fake engine, up for a scope.
struct FakeBinding {
    FakeBinding();
    ~FakeBinding();
    FakeBinding(FakeBinding const&) = delete;
    FakeBinding& operator=(FakeBinding const&) = delete;
};

} // namespace ORVO::Test
