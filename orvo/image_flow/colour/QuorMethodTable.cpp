#include "orvo/image_flow/colour/QuorMethodTable.h"

#include "orvo/colour_engine/QuorProcedures.h"
#include "orvo/image_flow/colour/CQuorError.h"
#include "orvo/image_flow/colour/QuorInterfaces.h"

namespace Quor_T_MT {

namespace {

using namespace ORVO;
using namespace ORVO::ImageFlow;

template <typename Procedure>
Procedure needed(QuorTable& table, std::size_t slot) {
    auto* const pProcedure = freshProcedure<Procedure>(table, slot);
    if (pProcedure == nullptr) {
        throw CQuorError("Missing Interface");
    }
    return pProcedure;
}

/// A string atom for a scope.
class ScopedAtom {
public:
    explicit ScopedAtom(char const* pText) {
        auto* const pNewAtom =
            needed<QuorNewStringAtomProc>(quorStringInterface(), QUOR_STRING_NEW_STRING_ATOM);
        checkQuorResult(pNewAtom(&pAtom_, pText));
    }
    ~ScopedAtom() {
        auto* const pDelete =
            freshProcedure<QuorDeleteStringAtomProc>(quorStringInterface(), QUOR_STRING_DELETE_STRING_ATOM);
        if (pDelete != nullptr) {
            pDelete(pAtom_);
        }
    }
    ScopedAtom(ScopedAtom const&) = delete;
    ScopedAtom& operator=(ScopedAtom const&) = delete;

    QuorStringAtom* get() const noexcept { return pAtom_; }

private:
    QuorStringAtom* pAtom_ = nullptr;
};

} // namespace

bool QuorVTabGeneric::bind(QuorContainer* pObject, bool bRequired) {
    for (std::size_t i = 0; i < nMethods_; ++i) {
        ScopedAtom const selector(pMethods_[i].pSelector);
        ScopedAtom const procName(pMethods_[i].pProcName);
        auto* const pGetMethod =
            needed<QuorContainerGetMethodProc>(quorContainerInterface(), QUOR_CONTAINER_GET_METHOD);
        void* pMethod = nullptr;
        checkQuorResult(pGetMethod(&pMethod, pObject, selector.get(), procName.get(), bRequired ? 0U : 1U));
        pSlots_[i] = pMethod;
        if (pMethod == nullptr && bRequired) {
            return false;
        }
    }
    return true;
}

} // namespace Quor_T_MT
