#include "orvo/data_flow/controllers/processSliceHelper.h"

#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/data_flow/controllers/SchedulingHooks.h"
#include "orvo/data_flow/nodes/Node.h"

namespace ORVO::DataFlow::internal {

void processSliceHelper::operator()(tbb::blocked_range<std::size_t> const& range) const noexcept {
    try {
        SchedulingHooks::atSlice();
        pNode_->processSlice(range.begin(), range.end());
    } catch (...) {
        pController_->failSlice();
    }
}

} // namespace ORVO::DataFlow::internal
