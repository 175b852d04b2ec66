#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/VideoMemoryConfiguration.h"

#include <vector>

namespace ORVO {

namespace OGL {
class Context;
}
class TexturePool;
class ShaderManagerOGL;

namespace ImageRuntime {

/// Static entry of the image runtime: started once a process with the OpenGL contexts that the host will work
/// in, of which each gets a texture pool and a shader manager; a single null context means that there are
/// none and all work is done on the CPU.
///
/// Start Core::Library and OGL::Library first:
///
///     Core::AutoInitializer core;
///     OGL::AutoInitializer ogl;
///     std::unique_ptr<OGL::Context> pContext = OGL::Context::adoptCurrent();
///     ImageRuntime::AutoInitializer runtime(pContext.get(), VideoMemory::Configuration());
///
/// Threads: initialize() and terminate() while nothing else uses the library; the queries from any thread.
class ORVO_API Library {
public:
    /// What the library holds for one context. All three are null for the single null context.
    struct DeviceObject {
        OGL::Context const* pContext_; ///< not owned; outlives the library's use.
        TexturePool* pTPool_;          ///< owned by the library; null if textures have to be powers of two.
        ShaderManagerOGL* pSMOGL_;     ///< owned by the library.
    };

    /// Starts the library: makes each context current in turn for its pool and its manager. The context that
    /// is current stays so.
    /// @param vpContext the contexts, at least one; a null context only as the single one. Not owned; they
    ///        outlive the library's use.
    /// @param configuration what the texture pools are made with. Its listener outlives the library's use.
    /// @throws InternalException, in this order, "Core::Library::isInitialized()",
    ///         "OGL::Library::isInitialized()", "vpContext.size()" (an empty list), "!pvDeviceObject_"
    ///         (started already), "vpContext.size() == 1" (a null context beside others); then as a context's
    ///         makeCurrent() throws, ExceptionOGL for what the driver refuses, and "Enforce gc != NULL" for a
    ///         context that, made current, leaves none current. Whatever is thrown, the library stays as it
    ///         was.
    static void initialize(std::vector<OGL::Context const*> const& vpContext,
                           VideoMemory::Configuration const& configuration);
    /// The same with a list of one.
    static void initialize(OGL::Context const* pContext, VideoMemory::Configuration const& configuration);

    /// Stops the library: destroys the pools and managers, each with its context current. A context that the
    /// host has destroyed before is passed over. The context that is current stays so. Does nothing more if
    /// the library is not started.
    /// @throws InternalException "Core::Library::isInitialized()" or "OGL::Library::isInitialized()".
    static void terminate();

    /// Whether the library is started.
    static bool isInitialized();

    /// The contexts that the library was started with, in order, null included.
    /// @throws InternalException "Enforce pvDeviceObject_ != NULL" if the library is not started.
    static std::vector<OGL::Context const*> initializationContextList();

    /// The texture pool of the first context that shares with the current one; null where the library was
    /// started without a context, and where the contexts up to that one have none. Not for the caller to
    /// delete.
    /// @throws InternalException "Enforce pvDeviceObject_ != NULL" if the library is not started, "Current
    ///         context of value <handle> does not share with any context used to initialize image_runtime"
    ///         (the handle is 0 where none is current).
    static TexturePool* texturePool();

    /// The shader manager of the first context that shares with the current one; null where the library was
    /// started without a context, and where the contexts up to that one have none. Not for the caller to
    /// delete.
    /// @throws InternalException "Enforce pvDeviceObject_ != NULL" if the library is not started, "Current
    ///         context of value <handle> does not share with any context used to initialize image_runtime"
    ///         (the handle is 0 where none is current).
    static ShaderManagerOGL* shaderManager();

    /// Kept for hosts that know them: the library neither reads nor writes them.
    static bool bNativeIntrinsicsRegistered_;
    static bool bInterpretedIntrinsicsRegistered_;

private:
    static void fill(DeviceObject& deviceObject, VideoMemory::Configuration const& configuration);
    static void destroy(std::vector<DeviceObject>* pvDeviceObject) noexcept;

    static std::vector<DeviceObject>* pvDeviceObject_;
};

/// Starts the library for the length of a scope.
///
/// Threads: as Library::initialize().
class ORVO_API AutoInitializer {
public:
    /// Both throw what Library::initialize() throws.
    AutoInitializer(std::vector<OGL::Context const*> const& vpContext,
                    VideoMemory::Configuration const& configuration);
    AutoInitializer(OGL::Context const* pContext, VideoMemory::Configuration const& configuration);
    /// Stops the library, unless released. No exception leaves it.
    ~AutoInitializer();

    AutoInitializer(AutoInitializer const&) = delete;
    AutoInitializer& operator=(AutoInitializer const&) = delete;

    /// The library stays started when the scope ends.
    void release();

private:
    bool bArmed_;
};

} // namespace ImageRuntime
} // namespace ORVO
