#pragma once

#include "orvo/core/Export.h"

namespace ORVO {

/// The entry point through which the colour engine's interfaces are looked up: interface, operation and
/// version by name; null for what the engine does not have.
using QuorGetAddressProc = void* (*)(char const* pInterface, char const* pOperation, char const* pVersion);

/// The installed entry point of the colour engine, null where there is none ("engine absent").
/// Threads: any.
ORVO_API QuorGetAddressProc GetQuorGetAddressProc();

namespace Core {

/// Static frame of the base library: the first to be started and the last to be stopped.
///
/// Threads: initialize and terminate are called by the host from one thread while no other layer works;
/// isInitialized from any thread.
class ORVO_API Library {
public:
    Library() = delete;

    /// Starts the library. Throws InternalException "!isInitialized()" if it is started already.
    static void initialize();

    /// Stops the library: gives held image storage back to the system and takes back the colour engine's
    /// entry point. Blocks and objects that are still alive stay valid. Throws InternalException
    /// "isInitialized()" if it is not started.
    static void terminate();

    /// Whether the library is started.
    static bool isInitialized() noexcept;

    /// Installs the entry point that GetQuorGetAddressProc hands out from now until terminate(); null means
    /// that there is no engine. To be called before ImageFlow::Library::initialize. Threads: any.
    static void setQuorGetAddressProc(QuorGetAddressProc pProc) noexcept;
};

/// Starts the base library in its constructor and stops it in its destructor, unless it was released.
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

    /// Disarms: the destructor leaves the library started.
    void release() noexcept;

private:
    bool bArmed_;
};

} // namespace Core
} // namespace ORVO
