// The storage of a frame's images: allocate, write every byte, free.
//
//   recycled     through the image store: every frame finds the blocks of the last one
//   plain        from the system anew in each frame, page by page: what first touch costs
//   first_frame  through the image store, which is emptied before each frame: what a first frame pays
//
// `page_faults` is the number of minor faults a frame took (getrusage), `images` the number of images. The
// rate counts the bytes written, so that the memcpy of the same run that is nearest in bytes moved stands
// beside it.
#include "benchmarks/support/MemoryBandwidth.h"
#include "orvo/core/memory/AlignedMemory.h"
#include "orvo/core/memory/ImageStorage.h"
#include "orvo/core/memory/TrackedNew.h"

#include <benchmark/benchmark.h>
#include <sys/mman.h>
#include <sys/resource.h>

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>

namespace {

using namespace ORVO;

constexpr std::size_t nFloatRGBA4K = std::size_t(3840) * 2160 * 16;
constexpr std::size_t nByteRGBA4K = std::size_t(3840) * 2160 * 4;
constexpr std::size_t nMostImages = 3;

long minorFaults() {
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_minflt;
}

void* allocateImage(std::size_t bytes) {
    return ORVO_private::newAlignedMemory(MEMORY_TYPE_IMAGE, bytes, 64);
}
void freeImage(void* pImage, std::size_t) { ORVO_private::deleteAlignedMemory(MEMORY_TYPE_IMAGE, pImage); }

/// Fresh pages, as a large block of malloc is.
void* mapPages(std::size_t bytes) {
    void* const pPages = mmap(nullptr, bytes, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (pPages == MAP_FAILED) {
        std::abort();
    }
    return pPages;
}
void unmapPages(void* pPages, std::size_t bytes) { munmap(pPages, bytes); }

/// One frame: all its images live at once, and each byte of them is written.
template <typename Allocate, typename Free>
void frame(std::size_t nImages, std::size_t bytes, Allocate const& allocate, Free const& free) {
    void* apImages[nMostImages] = {};
    for (std::size_t i = 0; i < nImages; ++i) {
        apImages[i] = allocate(bytes);
        std::memset(apImages[i], static_cast<int>(i), bytes);
        benchmark::ClobberMemory();
    }
    for (std::size_t i = 0; i < nImages; ++i) {
        free(apImages[i], bytes);
    }
}

template <typename Frame>
void measure(benchmark::State& state, std::size_t nImages, std::size_t bytes, Frame const& oneFrame) {
    oneFrame();
    long const nBefore = minorFaults();
    for (auto _ : state) {
        oneFrame();
    }
    state.counters["page_faults"] =
        benchmark::Counter(static_cast<double>(minorFaults() - nBefore), benchmark::Counter::kAvgIterations);
    state.counters["images"] = static_cast<double>(nImages);
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations()) *
                            static_cast<std::int64_t>(nImages * bytes));
}

void recycled(benchmark::State& state, std::size_t nImages, std::size_t bytes) {
    measure(state, nImages, bytes, [=] { frame(nImages, bytes, allocateImage, freeImage); });
    Core::releaseImageStorage();
}

void plain(benchmark::State& state, std::size_t nImages, std::size_t bytes) {
    measure(state, nImages, bytes, [=] { frame(nImages, bytes, mapPages, unmapPages); });
}

void firstFrame(benchmark::State& state, std::size_t nImages, std::size_t bytes) {
    measure(state, nImages, bytes, [=] {
        Core::releaseImageStorage();
        frame(nImages, bytes, allocateImage, freeImage);
    });
    Core::releaseImageStorage();
}

/// The cost of the store itself, where images are a pixel.
void smallImage(benchmark::State& state) {
    for (auto _ : state) {
        void* const pImage = allocateImage(16);
        benchmark::DoNotOptimize(pImage);
        freeImage(pImage, 16);
    }
    state.SetItemsProcessed(state.iterations());
}

/// The accounts of tracked objects, beside plain new and delete.
void trackedObject(benchmark::State& state) {
    for (auto _ : state) {
        auto* const pObject = ORVO_NEW std::uint64_t(1);
        benchmark::DoNotOptimize(pObject);
        trackedDelete(pObject);
    }
    state.SetItemsProcessed(state.iterations());
}

void plainObject(benchmark::State& state) {
    for (auto _ : state) {
        auto* const pObject = new std::uint64_t(1);
        benchmark::DoNotOptimize(pObject);
        delete pObject;
    }
    state.SetItemsProcessed(state.iterations());
}

int registerAll() {
    struct Row {
        char const* pName_;
        std::size_t nImages_;
        std::size_t nBytes_;
    };
    static constexpr Row rows[] = {{"image_storage/4k_float_rgba", 1, nFloatRGBA4K},
                                   {"image_storage/3_x_4k_float_rgba", 3, nFloatRGBA4K},
                                   {"image_storage/4k_8bit_rgba", 1, nByteRGBA4K}};
    using Function = void (*)(benchmark::State&, std::size_t, std::size_t);
    struct Road {
        char const* pName_;
        Function pFunction_;
    };
    static constexpr Road roads[] = {{"recycled", recycled}, {"plain", plain}, {"first_frame", firstFrame}};
    for (Row const& row : rows) {
        for (Road const& road : roads) {
            std::string const sName = std::string(row.pName_) + "/" + road.pName_;
            benchmark::RegisterBenchmark(
                sName.c_str(),
                [row, road](benchmark::State& state) { road.pFunction_(state, row.nImages_, row.nBytes_); })
                ->UseRealTime()
                ->Unit(benchmark::kMillisecond);
        }
    }
    benchmark::RegisterBenchmark("image_storage/one_pixel/recycled", smallImage)->UseRealTime();
    benchmark::RegisterBenchmark("object/tracked", trackedObject)->UseRealTime();
    benchmark::RegisterBenchmark("object/plain", plainObject)->UseRealTime();
    Benchmarks::registerMemcpy(nFloatRGBA4K);
    Benchmarks::registerMemcpy(nByteRGBA4K);
    return 0;
}

[[maybe_unused]] int const iRegistered = registerAll();

} // namespace
