#pragma once

/// All public headers of the engine, layer by layer. Most hosts need `orvo/filter_graph/FilterGraph.h` and
/// the `Library` classes of the other layers only.

#include "orvo/colour_engine/ColourEngine.h"
#include "orvo/core/Core.h"
#include "orvo/data_flow/DataFlow.h"
#include "orvo/filter_graph/FilterGraph.h"
#include "orvo/image_flow/ImageFlow.h"
#include "orvo/image_runtime/ImageRuntime.h"
#include "orvo/ogl/OGL.h"
