#pragma once

#include "orvo/core/Export.h"

#include <cstddef>
#include <cstdint>

namespace ORVO::FilterGraph {

/// Start and stop of the public filter graph, the top layer. The host starts the layers itself, lowest first,
/// and stops them in the reverse order; each refuses to start if what it needs is not up:
///
///     ORVO::Core::AutoInitializer core;
///     ORVO::OGL::AutoInitializer ogl;
///     ORVO::OGL::Context const* noContext = nullptr;    // CPU-only
///     ORVO::ImageRuntime::AutoInitializer imageRuntime(noContext, ORVO::VideoMemory::Configuration());
///     ORVO::DataFlow::AutoInitializer dataFlow;
///     ORVO::ImageFlow::AutoInitializer imageFlow(false);
///     ORVO::FilterGraph::AutoInitializer filterGraph{ORVO::FilterGraph::Library::InitializationOptions()};
///
/// The factory starts empty: prototypes are inserted by the host.
///
/// Threads: no locks; call from the host's set-up path.
class ORVO_API Library {
public:
    enum eAllocationMode : std::int32_t {
        /// Each node allocates its output image when it runs.
        ALLOCATE_ON_DEMAND = 0,
        /// An asynchronous frame allocates the output images of all nodes on the calling thread, before it is
        /// handed to the worker threads. The synchronous road does not look at this.
        ALLOCATE_BEFORE_LAUNCH = 1,
    };

    class ORVO_API InitializationOptions {
    public:
        InitializationOptions() = default;

        explicit InitializationOptions(eAllocationMode mode) : allocationMode_(mode) {}

        eAllocationMode getAllocationMode() const { return allocationMode_; }

        void setAllocationMode(eAllocationMode mode) { allocationMode_ = mode; }

    private:
        eAllocationMode allocationMode_ = ALLOCATE_ON_DEMAND;
    };

    Library() = delete;

    /// Creates the empty `FilterFactory` and copies the options.
    /// @throws InternalException with the condition that failed, in this order: "!isInitialized_",
    /// "ORVO::Core::Library::isInitialized()", "ORVO::OGL::Library::isInitialized()",
    /// "ORVO::DataFlow::Library::isInitialized()", "ORVO::ImageFlow::Library::isInitialized()".
    static void initialize(InitializationOptions const& options);

    /// Drops all prototypes and the factory. Filters that the host holds stay alive; later calls into the
    /// factory fail.
    /// @throws InternalException with the condition that failed: "isInitialized_" or one of those of the
    /// layers.
    static void terminate();

    /// Whether the library is up.
    static bool isInitialized();

    /// The options of the last `initialize`.
    static InitializationOptions const& getInitializationOptions();

    /// Inserts the one prototype that the library brings itself: the GPU colour transform "VantleFilterGPU"
    /// of the name space "ImageFlow". It runs on a GL target only.
    /// @throws Exception if it is inserted already.
    static void insertORVOFilters();

    /// Removes the prototype of `insertORVOFilters`.
    /// @throws InternalException "iter != aFilters_.end()" if it is not there.
    static void removeORVOFilters();

private:
    static bool isInitialized_;
    static InitializationOptions initOptions_;
};

/// Initialises the library for a scope.
///
/// Threads: as `Library`.
class ORVO_API AutoInitializer {
public:
    /// @throws what `Library::initialize` throws.
    explicit AutoInitializer(Library::InitializationOptions const& options);

    /// Terminates the library, unless released. Swallows what that throws.
    ~AutoInitializer();

    AutoInitializer(AutoInitializer const&) = delete;
    AutoInitializer& operator=(AutoInitializer const&) = delete;

    /// Leaves the library initialised at the end of the scope.
    void release();

private:
    bool armed_;
};

/// Sets the number of threads over which the rows of an image are spread, the frame's own included, for all
/// controllers of the process. 0 counts as 1; more than the scheduler offers gives all that it offers.
///
/// Threads: any; a frame that runs takes it over with its next node.
ORVO_API void setNumberOfThreads(std::size_t nThreads);

} // namespace ORVO::FilterGraph
