#pragma once

#include "orvo/data_flow/nodes/Node.h"

namespace ORVO::Test {

/// A data type that host and module both know, and neither exports.
struct SharedPayload {
    int iValue_ = 0;
};

/// What the module `TestModule` makes: a node with the parameters "offset" (`float2`), "size" (an interval of
/// `int`) and "points" (`std::vector<float2>`), the outputs "colour" (`ConstOutput<float4>`) and "payload"
/// (`ConstOutput<SharedPayload>`), and the input "payload" (`Input<SharedPayload>`). A run fills the outputs:
/// the colour from the offset, the payload with one more than the one fetched. The caller frees it with
/// `destroyModuleNode`.
using CreateModuleNode = DataFlow::Node* (*)();
using DestroyModuleNode = void (*)(DataFlow::Node*);

/// Throws the check "module" as an `InternalException`.
using FailInModule = void (*)();

} // namespace ORVO::Test
