#pragma once

#include "orvo/core/Export.h"

#include <string>

namespace ORVO::ImageFlow {

/// Start and stop of the image layer. Core, OGL, image runtime and data flow libraries must be up before it
/// starts. Failures are `InternalException`s with the stated texts.
///
/// Threads: `initialize` and `terminate` by the thread that starts the layers; the others from any thread.
class ORVO_API Library {
public:
    Library() = delete;

    /// Opens the binding to the colour engine that `GetQuorGetAddressProc()` hands out, unless that is null,
    /// and registers the node types of the layer with the `DataFlow::NodeLibrarian`. `checkGPU` asks for the
    /// check of the OpenGL driver, which takes place only where the image runtime was given a context. After
    /// a failure the library is not initialized and may be started again; the binding may be open then, and
    /// is kept for the next start with the same engine.
    ///
    /// Throws "ImageFlow already initialized", "Core::Library::isInitialized()",
    /// "DataFlow::Library::isInitialized()", "OGL::Library::isInitialized()" or
    /// "ImageRuntime::Library::isInitialized()", "nResult != 0" where the engine lacks what the binding
    /// needs, and `ParameterException` "!bDuplicate" where a node type of the same identity is registered
    /// already; the catalogue is then as it was. Where memory runs out
    /// (`std::bad_alloc`) the catalogue is emptied, also of the types of others.
    /// The driver of the runtime's first context fails the check with `ResourceException` "Minimum OpenGL
    /// Version (1.5) not supported." (versions 1.0 to 1.4), "Framebuffer Object Extension not supported." or
    /// "Non power of two textures not supported.", or with `OGL::ExceptionOGL` where that context cannot be
    /// made current.
    static void initialize(bool checkGPU);
    /// Removes every node type from the librarian, also those that others registered, and closes the binding
    /// to the colour engine. Throws "ImageFlow is not initialized!", "Core::Library::isInitialized()",
    /// "DataFlow::Library::isInitialized()" or "OGL::Library::isInitialized()".
    static void terminate();
    /// Whether `initialize` has succeeded and `terminate` has not since.
    static bool isInitialized();
    /// Whether the image runtime was started without an OpenGL context. Throws
    /// "ImageRuntime::Library::isInitialized()".
    static bool cpuOnlyMode();

    /// "Norvane".
    static std::string norvaneVendor();
    /// "ImageFlow".
    static std::string imageFlowNamespace();
    /// "MotionLoft".
    static std::string motionLoftNamespace();
};

/// Keeps the image layer up in a scope.
///
/// Threads: the thread that starts the layers.
class ORVO_API AutoInitializer {
public:
    /// Starts the library unless it is up. Throws as `Library::initialize`.
    explicit AutoInitializer(bool checkGPU);
    /// Terminates the library, unless released; failures are swallowed.
    ~AutoInitializer();

    AutoInitializer(AutoInitializer const&) = delete;
    AutoInitializer& operator=(AutoInitializer const&) = delete;

    /// Leaves the library up at the end of the scope.
    void release();

private:
    bool bActive_;
};

} // namespace ORVO::ImageFlow
