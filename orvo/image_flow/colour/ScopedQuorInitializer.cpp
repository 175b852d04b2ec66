#include "orvo/image_flow/colour/ScopedQuorInitializer.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/colour/QuorClient.h"

namespace ORVO::ImageFlow {

ScopedQuorInitializer::~ScopedQuorInitializer() { terminate(); }

void ScopedQuorInitializer::initialize(QuorGetAddressProc pProc) {
    if (bInitialized_) {
        return;
    }
    int const nResult = QuorClient::start(pProc);
    ORVO_CHECK(nResult != 0);
    bInitialized_ = true;
}

void ScopedQuorInitializer::terminate() noexcept {
    if (bInitialized_) {
        QuorClient::stop();
        bInitialized_ = false;
    }
}

bool ScopedQuorInitializer::isInitialized() const noexcept { return bInitialized_; }

} // namespace ORVO::ImageFlow
