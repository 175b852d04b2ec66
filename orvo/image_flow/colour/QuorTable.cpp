#include "orvo/image_flow/colour/QuorTable.h"

#include "orvo/colour_engine/QuorProcedures.h"
#include "orvo/image_flow/colour/CQuorError.h"
#include "orvo/image_flow/colour/QuorClient.h"
#include "orvo/image_flow/colour/QuorInterfaces.h"

namespace ORVO::ImageFlow {

namespace {

/// The reference that came with a new error object, for a scope.
class NewErrorReference {
public:
    NewErrorReference(QuorErrorReleaseProc pRelease, QuorError* pError) noexcept
        : pRelease_(pRelease), pError_(pError) {}
    ~NewErrorReference() { pRelease_(pError_); }
    NewErrorReference(NewErrorReference const&) = delete;
    NewErrorReference& operator=(NewErrorReference const&) = delete;

private:
    QuorErrorReleaseProc pRelease_;
    QuorError* pError_;
};

[[noreturn]] void throwMissingProcedure() {
    auto* const pNewError = freshProcedure<QuorNewErrorProc>(quorErrorInterface(), QUOR_ERROR_NEW_ERROR);
    auto* const pRelease = freshProcedure<QuorErrorReleaseProc>(quorErrorInterface(), QUOR_ERROR_RELEASE);
    QuorError* pError = nullptr;
    if (pNewError == nullptr || pRelease == nullptr || pNewError(&pError, "", "Quor") != 0) {
        throw Quor_T_MT::CQuorError("Missing Interface");
    }
    NewErrorReference const reference(pRelease, pError);
    throw Quor_T_MT::CQuorError(pError);
}

} // namespace

bool QuorTable::tryLoad() noexcept {
    // An engine that is replaced while the table is filled leaves procedures of both in it, and another
    // thread may have noted the new counter beside them: so the counter is read again behind, and the table
    // filled once more where it moved. An engine that never rests is noticed at the next use.
    constexpr int nRounds = 4;
    for (int iRound = 0; iRound < nRounds; ++iRound) {
        std::uint32_t const iBound = QuorClient::generation();
        std::uint32_t const iCount = QuorClient::unregisterCount();
        if (!fill()) {
            return false;
        }
        iLoadCount_.store(iCount, std::memory_order_release);
        iGeneration_.store(iBound, std::memory_order_release);
        if (QuorClient::unregisterCount() == iCount && QuorClient::generation() == iBound) {
            break;
        }
    }
    return true;
}

bool QuorTable::fill() noexcept {
    for (std::size_t iRow = nRows_; iRow-- > 0;) {
        QuorRow const& row = pRows_[iRow];
        void* const pProcedure = QuorClient::resolve(pInterface_, row.pSelector, row.pProcName);
        if (pProcedure == nullptr) {
            return false;
        }
        pSlots_[row.slot].store(pProcedure, std::memory_order_release);
    }
    return true;
}

int QuorTable::load() {
    if (tryLoad()) {
        return 1;
    }
    if (QuorClient::isStrict()) {
        throwMissingProcedure();
    }
    return 0;
}

bool QuorTable::refresh() noexcept {
    if (!QuorClient::isLive()) {
        return false;
    }
    if (iGeneration_.load(std::memory_order_acquire) == QuorClient::generation() &&
        iLoadCount_.load(std::memory_order_acquire) == QuorClient::unregisterCount()) {
        return true;
    }
    if (tryLoad()) {
        return true;
    }
    iGeneration_.store(0, std::memory_order_release);
    pSlots_[0].store(nullptr, std::memory_order_release);
    return false;
}

void QuorTable::clear() noexcept {
    for (std::size_t iRow = 0; iRow < nRows_; ++iRow) {
        pSlots_[pRows_[iRow].slot].store(nullptr, std::memory_order_release);
    }
    iLoadCount_.store(0, std::memory_order_release);
    iGeneration_.store(0, std::memory_order_release);
}

} // namespace ORVO::ImageFlow
