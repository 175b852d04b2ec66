#pragma once

#include "orvo/data_flow/DataFlowLibrary.h"
#include "tests/support/CoreLayer.h"

namespace ORVO::Test {

/// The layers up to data flow, up for a scope.
struct DataFlowLayers : CoreLayer {
    DataFlow::AutoInitializer oDataFlow_;
};

} // namespace ORVO::Test
