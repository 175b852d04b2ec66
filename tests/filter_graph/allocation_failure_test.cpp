// Every allocation of a build, of a first and of a second frame is made to fail in turn: each time a clean
// exception, no leak, and the next frame is right.
//
// The global operator new of this program is replaced, so that not only the tracked blocks of the library are
// counted, but also what its containers allocate.
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <new>
#include <thread>

#include "orvo/core/exceptions/ExceptionBase.h"
#include "orvo/core/memory/ImageStorage.h"
#include "tests/filter_graph/RandomGraph.h"

namespace {

/// Counts down to the allocation that fails. Armed by one test at a time.
struct FailingHeap {
    static inline std::atomic<bool> bArmed{false};
    static inline std::atomic<long> nLeft{0};
    static inline std::atomic<long> nLive{0};

    static void* allocate(std::size_t bytes, std::size_t alignment) {
        if (bArmed.load() && nLeft.fetch_sub(1) == 1) {
            throw std::bad_alloc();
        }
        void* const pBlock =
            alignment > alignof(std::max_align_t)
                ? std::aligned_alloc(alignment, (bytes + alignment - 1) / alignment * alignment)
                : std::malloc(bytes > 0 ? bytes : 1);
        if (!pBlock) {
            throw std::bad_alloc();
        }
        ++nLive;
        return pBlock;
    }

    static void* tryAllocate(std::size_t bytes, std::size_t alignment) noexcept {
        try {
            return allocate(bytes, alignment);
        } catch (std::bad_alloc const&) {
            return nullptr;
        }
    }

    static void free(void* pBlock) noexcept {
        if (pBlock) {
            --nLive;
            std::free(pBlock);
        }
    }
};

} // namespace

void* operator new(std::size_t bytes) { return FailingHeap::allocate(bytes, 0); }

void* operator new[](std::size_t bytes) { return FailingHeap::allocate(bytes, 0); }

void* operator new(std::size_t bytes, std::align_val_t alignment) {
    return FailingHeap::allocate(bytes, static_cast<std::size_t>(alignment));
}

void* operator new[](std::size_t bytes, std::align_val_t alignment) {
    return FailingHeap::allocate(bytes, static_cast<std::size_t>(alignment));
}

void* operator new(std::size_t bytes, std::nothrow_t const&) noexcept {
    return FailingHeap::tryAllocate(bytes, 0);
}

void* operator new[](std::size_t bytes, std::nothrow_t const&) noexcept {
    return FailingHeap::tryAllocate(bytes, 0);
}

void* operator new(std::size_t bytes, std::align_val_t alignment, std::nothrow_t const&) noexcept {
    return FailingHeap::tryAllocate(bytes, static_cast<std::size_t>(alignment));
}

void* operator new[](std::size_t bytes, std::align_val_t alignment, std::nothrow_t const&) noexcept {
    return FailingHeap::tryAllocate(bytes, static_cast<std::size_t>(alignment));
}

void operator delete(void* pBlock) noexcept { FailingHeap::free(pBlock); }

void operator delete[](void* pBlock) noexcept { FailingHeap::free(pBlock); }

void operator delete(void* pBlock, std::size_t) noexcept { FailingHeap::free(pBlock); }

void operator delete[](void* pBlock, std::size_t) noexcept { FailingHeap::free(pBlock); }

void operator delete(void* pBlock, std::align_val_t) noexcept { FailingHeap::free(pBlock); }

void operator delete[](void* pBlock, std::align_val_t) noexcept { FailingHeap::free(pBlock); }

void operator delete(void* pBlock, std::size_t, std::align_val_t) noexcept { FailingHeap::free(pBlock); }

void operator delete[](void* pBlock, std::size_t, std::align_val_t) noexcept { FailingHeap::free(pBlock); }

void operator delete(void* pBlock, std::nothrow_t const&) noexcept { FailingHeap::free(pBlock); }

void operator delete[](void* pBlock, std::nothrow_t const&) noexcept { FailingHeap::free(pBlock); }

void operator delete(void* pBlock, std::align_val_t, std::nothrow_t const&) noexcept {
    FailingHeap::free(pBlock);
}

void operator delete[](void* pBlock, std::align_val_t, std::nothrow_t const&) noexcept {
    FailingHeap::free(pBlock);
}

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

/// Runs a statement with the heap armed. Answers whether it threw: std::bad_alloc, or an exception of the
/// library where the failure crossed a thread. Anything else is let through and fails the test.
template <typename Statement>
bool throwsWhileArmed(Statement const& statement) {
    FailingHeap::bArmed = true;
    try {
        statement();
    } catch (std::bad_alloc const&) {
        FailingHeap::bArmed = false;
        return true;
    } catch (ExceptionBase const&) {
        FailingHeap::bArmed = false;
        return true;
    }
    FailingHeap::bArmed = false;
    return false;
}

class FailingFrameTest : public FrameTest {
protected:
    using Frame = void (*)(IProcessor& processor);

    static void runSynchronously(IProcessor& processor) { processor.processFrame(cpuOptions()); }

    static void runAsynchronously(IProcessor& processor) {
        processor.asyncProcessFrame(cpuOptions());
        while (processor.waitForFrame(60.0, 0.0001) != IProcessorBase::FRAME_COMPLETE) {
        }
    }

    /// Blocks in use, without the store of freed images, which grows with each new size of image.
    static long liveBlocks() {
        Core::releaseImageStorage();
        return FailingHeap::nLive;
    }

    /// The thread that ran a frame may still be putting its job away.
    static bool comesDownTo(long nBlocks) {
        for (int attempt = 0; attempt < 200 && liveBlocks() != nBlocks; ++attempt) {
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
        return liveBlocks() == nBlocks;
    }

    /// One round with the n-th allocation failing; false once there are fewer.
    bool round(RandomGraph& graph, long n, Frame frame) {
        long const nLiveBefore = liveBlocks();
        {
            std::shared_ptr<IProcessor> spProcessor;
            FailingHeap::nLeft = n;
            bool bThrew = throwsWhileArmed([&] {
                spProcessor = createProcessor(graph.sink(), nullptr);
                frame(*spProcessor);
            });
            if (!bThrew) {
                graph.changeParameter();
                bThrew = throwsWhileArmed([&] { frame(*spProcessor); });
            }
            bFired_ = FailingHeap::nLeft <= 0;
            // Some failures do no harm: what was asked for without need is done without.
            nThrown_ += bThrew ? 1 : 0;
            EXPECT_TRUE(bFired_ || !bThrew) << "threw without a failed allocation";

            if (!spProcessor) {
                spProcessor = createProcessor(graph.sink(), nullptr);
            }
            for (int following = 0; following < 2; ++following) {
                graph.spoilOutput();
                EXPECT_NO_THROW(frame(*spProcessor)) << "after allocation " << n;
                EXPECT_TRUE(graph.isOutputRight()) << "after allocation " << n << "\n"
                                                   << graph.describeDifference();
                graph.changeParameter();
            }
        }
        bLeftBlocks_ = !comesDownTo(nLiveBefore);
        return bFired_ && !HasFailure();
    }

    void failEachInTurn(RandomGraph& graph, Frame frame) {
        // What is made once for the process, such as the classes of sizes of the image store, is no leak.
        for (int warming = 0; warming < 40; ++warming) {
            round(graph, 1L << 40, frame);
        }
        nThrown_ = 0;
        for (long n = 1; round(graph, n, frame); ++n) {
            // The pool of frame threads grows when a frame is launched before the last thread is idle again.
            // What is left once more after the same failure is a leak.
            for (int again = 0; again < 3 && bLeftBlocks_; ++again) {
                round(graph, n, frame);
            }
            ASSERT_FALSE(bLeftBlocks_) << "blocks are left after allocation " << n;
        }
        EXPECT_GT(nThrown_, 20) << "hardly any allocation was reached";
    }

    bool bLeftBlocks_ = false;
    bool bFired_ = false;
    int nThrown_ = 0;
};

class AllocationFailureTest : public FailingFrameTest, public testing::WithParamInterface<std::uint32_t> {};

TEST_P(AllocationFailureTest, OfSynchronousFrames) {
    RandomGraph graph(GetParam(), IAdapter::REGION_SYNC_FROM_IMAGE, 12, RandomGraph::TEST_FILTERS);
    failEachInTurn(graph, runSynchronously);
}

TEST_P(AllocationFailureTest, OfAsynchronousFrames) {
    RandomGraph graph(GetParam(), IAdapter::REGION_SYNC_FROM_IMAGE, 12, RandomGraph::TEST_FILTERS);
    failEachInTurn(graph, runAsynchronously);
}

INSTANTIATE_TEST_SUITE_P(TenGraphs, AllocationFailureTest, testing::Range(1u, 11u));

/// The same with one filter of the library, which makes more allocations than all else: the first small graph
/// that has one.
class LibraryFilterAllocationFailureTest : public FailingFrameTest {
protected:
    void failEachInGraphWith(RandomGraph::eKind kind) {
        for (std::uint32_t seed = 1;; ++seed) {
            RandomGraph graph(seed, IAdapter::REGION_SYNC_FROM_IMAGE, 2);
            if (graph.numberOf(kind) == 1 && graph.numberOfFilters() == 2) {
                failEachInTurn(graph, runSynchronously);
                return;
            }
        }
    }
};

TEST_F(LibraryFilterAllocationFailureTest, OfTheBilateralFilter) {
    failEachInGraphWith(RandomGraph::BILATERAL);
}

TEST_F(LibraryFilterAllocationFailureTest, OfTheColourTransformer) {
    failEachInGraphWith(RandomGraph::TRANSFORMER);
}

} // namespace
} // namespace ORVO::FilterGraph
