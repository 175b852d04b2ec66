#pragma once

#include "orvo/core/Export.h"

namespace Quor_T_MT {

/// Something that must be finished when the binding stops: an entry of one static list. An entry that is
/// added during the life of the binding is finished at its stop, the latest first, and leaves the list then.
///
/// Threads: `add` from any thread; the list runs on the thread that stops the layers.
class ORVO_API LazyTerminate {
public:
    /// `pTerminate` must not throw; it is handed `pContext`.
    constexpr LazyTerminate(void (*pTerminate)(void*), void* pContext) noexcept
        : pTerminate_(pTerminate), pContext_(pContext) {}

    LazyTerminate(LazyTerminate const&) = delete;
    LazyTerminate& operator=(LazyTerminate const&) = delete;

    /// Adds the entry, unless it is in the list.
    void add() noexcept;

    /// Runs the list and empties it.
    static void runAll() noexcept;

private:
    void (*pTerminate_)(void*);
    void* pContext_;
    LazyTerminate* pNext_ = nullptr;
    bool bListed_ = false;
};

/// A client class with something to initialise once the binding stands: an entry of one static list for the
/// life of the object. The binding is live while it initialises, so it may call the engine.
///
/// Threads: made and destroyed while no binding starts or stops.
class ORVO_API LazyClient {
public:
    /// Registers the class. What `pInitialize` throws makes the start of the binding fail.
    explicit LazyClient(void (*pInitialize)()) noexcept;
    ~LazyClient();

    LazyClient(LazyClient const&) = delete;
    LazyClient& operator=(LazyClient const&) = delete;

    /// Runs the initialisers in the order of registration.
    static void initializeAll();

private:
    void (*pInitialize_)();
    LazyClient* pNext_ = nullptr;
};

} // namespace Quor_T_MT
