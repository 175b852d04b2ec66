#pragma once

#include "orvo/core/Export.h"

namespace ORVO::DataFlow {

/// Start and stop of the data-flow layer. It needs the core library, and is needed by every node, controller
/// and librarian: no node may be constructed before initialize() or destroyed after terminate().
///
/// Threads: one thread starts and stops the layers. isInitialized() from any thread.
class ORVO_API Library {
public:
    Library() = delete;

    /// Makes the tables of node names and the librarian.
    /// Throws InternalException "!bInitialized_" if the layer is up, "Core::Library::isInitialized()" if the
    /// core is not. Nothing is left behind if it throws.
    static void initialize();

    /// Waits for the asynchronous frames that still run and joins their threads, then destroys the librarian
    /// with all registered types, then the tables of node names. Throws InternalException "bInitialized_" if
    /// the layer is not up, "Core::Library::isInitialized()" if the core is not, and
    /// "!internal::FrameThreads::isFrameThread()" if called on the thread of a frame.
    static void terminate();

    /// Whether the layer is up: true from the end of initialize() to the end of terminate().
    static bool isInitialized();
};

/// Keeps the data-flow layer up for the time of a scope. Owns nothing.
///
/// Threads: as Library.
class ORVO_API AutoInitializer {
public:
    /// Starts the layer; throws as Library::initialize() does, and then terminates nothing.
    AutoInitializer();
    AutoInitializer(AutoInitializer const&) = delete;
    AutoInitializer& operator=(AutoInitializer const&) = delete;

    /// Terminates the layer. Never throws: a refusal is swallowed.
    ~AutoInitializer();

private:
    bool bActive_;
};

} // namespace ORVO::DataFlow
