#pragma once

#include "orvo/orvo.h"

#include <exception>
#include <memory>
#include <string>

namespace example {

using ContextPtr = std::unique_ptr<ORVO::OGL::ContextOffscreen>;

/// A context without a window, current on this thread. Throws OGL::ExceptionOGL where there is no OpenGL.
[[nodiscard]] ContextPtr makeContext();

/// None: the layers come up without OpenGL.
[[nodiscard]] ContextPtr noContext();

/// The layers of the engine with the filters that come with it, up for the life of one of these, on OpenGL
/// where a context is given.
struct Engine {
    explicit Engine(ContextPtr (*makeContextOrNone)());

    ORVO::Core::AutoInitializer core;
    ORVO::OGL::AutoInitializer ogl;
    ContextPtr const context;
    ORVO::ImageRuntime::AutoInitializer runtime{context.get(), ORVO::VideoMemory::Configuration()};
    ORVO::DataFlow::AutoInitializer dataFlow;
    ORVO::ImageFlow::AutoInitializer imageFlow{context != nullptr};
    ORVO::FilterGraph::AutoInitializer filterGraph{ORVO::FilterGraph::Library::InitializationOptions()};
};

/// What a failure says to a person, in one line.
[[nodiscard]] std::string describe(std::exception const& failure);

} // namespace example
