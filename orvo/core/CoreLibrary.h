#pragma once

#include "orvo/core/Export.h"

namespace ORVO {

/// The entry point through which the colour engine's procedures are looked up: interface, selector and
/// procedure by name; null for what the engine does not have.
using QuorGetAddressProc = void* (*)(char const* interfaceName, char const* selector, char const* procName);

/// The entry point of the colour engine: the one of the embedded engine, unless the host installed its own or
/// null, which means that there is no engine. Threads: any.
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

    /// Stops the library: gives held image storage back to the system and forgets the entry point that the
    /// host installed for a colour engine. Blocks and objects that are still alive stay valid. Throws
    /// InternalException "isInitialized()" if it is not started.
    static void terminate();

    /// Whether the library is started.
    static bool isInitialized() noexcept;

    /// Installs the entry point that GetQuorGetAddressProc hands out from now until terminate(): the host's
    /// own engine, or null to work without one. ImageFlow::Library::initialize binds what is installed then;
    /// what is installed later waits for its next start. Threads: any.
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
