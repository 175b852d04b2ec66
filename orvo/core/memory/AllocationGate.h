#pragma once

namespace ORVO_private {

/// Called first by every allocation that the test hook AllocationFailure can make fail; throws std::bad_alloc
/// if this one is to. Threads: any.
void passAllocationGate();

} // namespace ORVO_private
