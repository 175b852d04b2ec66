/// Contexts made the way hosts make them, without the library.
#pragma once

#include <memory>
#include <string>

namespace ORVO::Test {

/// A host's own context with what it is drawn on. Made current by its constructor's caller.
class HostContext {
public:
    HostContext() = default;
    HostContext(HostContext const&) = delete;
    HostContext& operator=(HostContext const&) = delete;
    /// Releases the context if it is current, and destroys it.
    virtual ~HostContext();

    virtual void makeCurrent() = 0;
    /// Leaves no context current on the thread.
    virtual void release() = 0;
    /// The context's handle.
    virtual void* handle() const = 0;
    /// Another context on the same display; sharing objects with this one or not.
    virtual std::unique_ptr<HostContext> another(bool bSharing) = 0;
    /// Destroys the context while this object lives on.
    virtual void destroyContext() = 0;

    /// An EGL context without a surface.
    static std::unique_ptr<HostContext> createEGL();
    /// A GLX context on a window of the test's X server.
    static std::unique_ptr<HostContext> createGLX();
    /// By name, "EGL" or "GLX".
    static std::unique_ptr<HostContext> create(std::string const& sInterface);
};

} // namespace ORVO::Test
