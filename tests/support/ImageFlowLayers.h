#pragma once

#include "orvo/data_flow/DataFlowLibrary.h"
#include "orvo/image_flow/ImageFlowLibrary.h"
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/VideoMemoryConfiguration.h"
#include "orvo/ogl/Context.h"
#include "orvo/ogl/OGLLibrary.h"
#include "tests/support/CoreLayer.h"

namespace ORVO::Test {

/// The layers up to the image runtime, without an OpenGL context, up for a scope.
struct ImageRuntimeLayers : CoreLayer {
    OGL::AutoInitializer oOGL_;
    ImageRuntime::AutoInitializer oImageRuntime_{static_cast<OGL::Context const*>(nullptr),
                                                 VideoMemory::Configuration()};
};

/// The layers up to image flow, without an OpenGL context, up for a scope.
struct ImageFlowLayers : ImageRuntimeLayers {
    DataFlow::AutoInitializer oDataFlow_;
    ImageFlow::AutoInitializer oImageFlow_{false};
};

} // namespace ORVO::Test
