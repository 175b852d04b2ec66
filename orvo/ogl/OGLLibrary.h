#pragma once

#include "orvo/core/Export.h"

namespace ORVO::OGL {

/// Static frame of the OpenGL object layer, the second to be started. Starting it needs no driver, no display
/// and no context: hosts that work on the CPU alone start it too.
///
/// Threads: initialize and terminate are called by the host from one thread while no other layer works;
/// isInitialized from any thread.
class ORVO_API Library {
public:
    Library() = delete;

    /// Starts the layer. Throws InternalException "Core::Library::isInitialized()" if the base library is not
    /// started, then "!isInitialized()" if the layer is started already.
    static void initialize();

    /// Stops the layer. Throws InternalException "Core::Library::isInitialized()" if the base library is not
    /// started, then "isInitialized()" if the layer is not.
    static void terminate();

    /// Whether the layer is started.
    static bool isInitialized() noexcept;
};

/// Starts the layer in its constructor and stops it in its destructor, unless it was released.
///
/// Threads: as Library::initialize and Library::terminate.
class ORVO_API AutoInitializer {
public:
    /// Library::initialize(), with its failures.
    AutoInitializer();
    /// Library::terminate() while armed; swallows its failures.
    ~AutoInitializer();
    AutoInitializer(AutoInitializer const&) = delete;
    AutoInitializer& operator=(AutoInitializer const&) = delete;

    /// Disarms: the destructor leaves the layer started.
    void release() noexcept;

private:
    bool bArmed_;
};

} // namespace ORVO::OGL
