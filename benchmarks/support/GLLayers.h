#pragma once

#include <epoxy/egl.h>
#include <epoxy/gl.h>

#include <memory>
#include <type_traits>

#include "orvo/orvo.h"

namespace ORVO::Benchmarks {

/// Counts the calls of an entry point, once it is installed in a context that is current.
template <auto* pSlot, typename Function = std::remove_pointer_t<decltype(pSlot)>>
struct CountedCalls;
template <auto* pSlot, typename... Arguments>
struct CountedCalls<pSlot, void (*)(Arguments...)> {
    static inline void (*pOriginal)(Arguments...) = nullptr;
    static inline long nCalls = 0;

    static void call(Arguments... arguments) {
        ++nCalls;
        pOriginal(arguments...);
    }
    static void install(char const* pName) {
        pOriginal = reinterpret_cast<decltype(pOriginal)>(eglGetProcAddress(pName));
        *pSlot = &call;
    }
};

/// All layers up to the nodes, on a context of their own, which is current.
class GLNodeLayers {
public:
    OGL::Context const& context() const { return *pContext_; }

private:
    static std::unique_ptr<OGL::ContextOffscreen> makeContext() {
        auto pContext = OGL::ContextOffscreen::createHeadless();
        pContext->makeCurrent();
        return pContext;
    }

    Core::AutoInitializer oCore_;
    OGL::AutoInitializer oOGL_;
    std::unique_ptr<OGL::ContextOffscreen> pContext_ = makeContext();
    ImageRuntime::AutoInitializer oRuntime_{pContext_.get(), VideoMemory::Configuration()};
    DataFlow::AutoInitializer oDataFlow_;
    ImageFlow::AutoInitializer oImageFlow_{true};
};

/// The same, with what drivers are slow at counted.
class CountingGLNodeLayers : public GLNodeLayers {
public:
    using Links = CountedCalls<&epoxy_glLinkProgram>;
    using Textures = CountedCalls<&epoxy_glGenTextures>;

    CountingGLNodeLayers() {
        Links::install("glLinkProgram");
        Textures::install("glGenTextures");
    }
};

/// All layers, likewise on a context of their own.
class GLLayers : public GLNodeLayers {
private:
    FilterGraph::AutoInitializer oFilterGraph_{FilterGraph::Library::InitializationOptions()};
};

} // namespace ORVO::Benchmarks
