#pragma once

#include "orvo/core/CoreLibrary.h"
#include "orvo/core/Export.h"

#include <cstdint>

namespace Quor_T_MT {
class LazyClient;
class LazyTerminate;
} // namespace Quor_T_MT

namespace ORVO::ImageFlow {

/// The client's side of the interface layer: keeps the address procedure and what was fetched through it.
///
/// Of the layer's interfaces it binds the four base ones. The cache interface, which a start loads only for
/// client classes that ask for it, is left out: no class here keeps purgeable data at the engine, and
/// transforms are shared by the engine itself.
///
/// Threads: start and stop by the thread that starts the layers; the others from any thread.
class ORVO_API QuorClient {
public:
    QuorClient() = delete;

    /// Binds the layer behind an address procedure; 1 on success, also where one is bound already, which is
    /// then kept. 0 where the procedure is null, where one of the five core procedures is missing or the
    /// address of the counter is refused, or where one of the base interfaces (container, error, string,
    /// memory, in this order) is incomplete; nothing is bound then. Afterwards the strict mode is on and the
    /// client is live, and then the registered `LazyClient`s are initialised in the order of their
    /// registration: they may call the engine. What an initialiser throws comes out, and nothing is bound
    /// then.
    static int start(QuorGetAddressProc pProc);

    /// Finishes what was begun since the start, the latest first, and forgets the address procedure. Does
    /// nothing if nothing is bound.
    static void stop() noexcept;

    /// The address procedure that is bound, null if none is.
    static QuorGetAddressProc addressProc() noexcept;
    /// Whether a start succeeded, or is initialising its clients, and no stop came since.
    static bool isLive() noexcept;
    /// Whether a table that lacks a procedure throws (true) or reports (false) at its load.
    static bool isStrict() noexcept;

    /// Asks the address procedure; null where there is none.
    static void* resolve(char const* pInterface, char const* pSelector, char const* pProcName);

    /// How many starts have succeeded or are under way: tells what belongs to an earlier binding. 0 before
    /// the first.
    static std::uint32_t generation() noexcept;
    /// The global counter of unregistrations, 0 where nothing is bound.
    static std::uint32_t unregisterCount() noexcept;

private:
    static bool fetchCore();
    static bool loadBase();
    static void forget() noexcept;
};

} // namespace ORVO::ImageFlow
