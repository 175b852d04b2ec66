#pragma once

#include <cstdint>

namespace ORVO::DataFlow {

/// Which form of a node type is asked for. Handed to the creation function as it is; a function may answer
/// null for a target that it does not serve.
enum NodeTargetType : std::int32_t {
    NODE_TARGET_CPU = 0, ///< The form that runs on the CPU.
    NODE_TARGET_GPU = 1  ///< The form that runs on the GPU.
};

} // namespace ORVO::DataFlow
