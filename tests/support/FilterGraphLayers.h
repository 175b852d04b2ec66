#pragma once

#include "orvo/filter_graph/impl/FilterGraphLibrary.h"
#include "tests/support/ImageFlowLayers.h"

namespace ORVO::Test {

/// All layers, without an OpenGL context, up for a scope.
struct FilterGraphLayers : ImageFlowLayers {
    FilterGraph::AutoInitializer oFilterGraph_{FilterGraph::Library::InitializationOptions()};
};

} // namespace ORVO::Test
