// The texture pool: taking a texture and giving it back among 1,000 that are free.
//
//   2D/...        as the pool does it: an index over the free list, and the wrap mode set anew
//   1D/...        the same without the wrap mode, which 1D textures keep
//   walk/...      the list alone, walked from its front for the first texture that matches: the plain version
//   index/...     the list alone, with its index: what stands beside the walk
//   .../different each texture has a size of its own; a request may stand anywhere in the list
//   .../same      all are alike, and the first one matches
//
// `take_ns` and `return_ns` are means of one operation in a context of the software driver or of whatever
// driver comes first; the time of a row is that of a batch of both.
#include "orvo/core/CoreLibrary.h"
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/TextureFreeList.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/OGLLibrary.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/Texture2D.h"

#include <benchmark/benchmark.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <cstdlib>
#include <iterator>
#include <list>
#include <memory>
#include <numeric>
#include <random>
#include <vector>

namespace {

using namespace ORVO;

constexpr unsigned nTextures = 1000;
constexpr std::size_t nBatch = 16;
constexpr auto eFormat = OGL::Texture::INTERNAL_FORMAT_LUMINANCE8;

/// The runtime on a context without a window, for the length of a benchmark.
struct Runtime {
    Runtime() : pContext_(OGL::ContextOffscreen::createHeadless()) {
        pContext_->makeCurrent();
        runtime_ =
            std::make_unique<ImageRuntime::AutoInitializer>(pContext_.get(), VideoMemory::Configuration());
    }

    Core::AutoInitializer core_;
    OGL::AutoInitializer ogl_;
    std::unique_ptr<OGL::ContextOffscreen> pContext_;
    std::unique_ptr<ImageRuntime::AutoInitializer> runtime_;
};

/// The width of the texture with a number.
unsigned widthOf(unsigned i, bool bDifferent) { return bDifferent ? i + 1 : 1; }

/// Which textures are asked for: no pattern, and none twice in a batch.
std::vector<unsigned> requests() {
    std::mt19937 random(1);
    std::vector<unsigned> aTextures(nTextures);
    std::iota(aTextures.begin(), aTextures.end(), 0u);
    std::vector<unsigned> aRequests;
    for (std::size_t i = 0; i < 4096; ++i) {
        std::vector<unsigned> aBatch;
        std::sample(aTextures.begin(), aTextures.end(), std::back_inserter(aBatch), nBatch, random);
        std::shuffle(aBatch.begin(), aBatch.end(), random);
        aRequests.insert(aRequests.end(), aBatch.begin(), aBatch.end());
    }
    return aRequests;
}

/// Takes and returns in batches, each timed for itself.
template <typename TextureT, typename Take, typename Return>
void measure(benchmark::State& state, bool bDifferent, Take const& take, Return const& giveBack) {
    using Clock = std::chrono::steady_clock;
    std::vector<unsigned> const aRequests = requests();
    std::array<TextureT*, nBatch> vpTaken{};
    std::chrono::nanoseconds taking{0};
    std::chrono::nanoseconds returning{0};
    std::size_t nNext = 0;
    for (auto _ : state) {
        auto const start = Clock::now();
        for (TextureT*& p : vpTaken) {
            p = take(widthOf(aRequests[nNext], bDifferent));
            nNext = (nNext + 1) % aRequests.size();
        }
        auto const middle = Clock::now();
        for (TextureT* p : vpTaken)
            giveBack(p);
        taking += middle - start;
        returning += Clock::now() - middle;
    }
    double const nOperations = static_cast<double>(state.iterations()) * nBatch;
    state.counters["take_ns"] = static_cast<double>(taking.count()) / nOperations;
    state.counters["return_ns"] = static_cast<double>(returning.count()) / nOperations;
    state.counters["free"] = nTextures;
}

void pool2D(benchmark::State& state, bool bDifferent) {
    Runtime const runtime;
    TexturePool& pool = *TexturePool::Instance();
    auto const take = [&pool](unsigned width) { return pool.getTexture2DFromPool(width, 1, eFormat, true); };
    auto const giveBack = [&pool](OGL::Texture2D* p) { pool.returnTexture2DToPool(p); };
    std::vector<OGL::Texture2D*> vpTexture;
    for (unsigned i = 0; i < nTextures; ++i)
        vpTexture.push_back(take(widthOf(i, bDifferent)));
    for (OGL::Texture2D* p : vpTexture)
        giveBack(p);
    measure<OGL::Texture2D>(state, bDifferent, take, giveBack);
}

void pool1D(benchmark::State& state, bool bDifferent) {
    Runtime const runtime;
    TexturePool& pool = *TexturePool::Instance();
    auto const take = [&pool](unsigned width) { return pool.getTexture1DFromPool(width, eFormat, true); };
    auto const giveBack = [&pool](OGL::Texture1D* p) { pool.returnTexture1DToPool(p); };
    std::vector<OGL::Texture1D*> vpTexture;
    for (unsigned i = 0; i < nTextures; ++i)
        vpTexture.push_back(take(widthOf(i, bDifferent)));
    for (OGL::Texture1D* p : vpTexture)
        giveBack(p);
    measure<OGL::Texture1D>(state, bDifferent, take, giveBack);
}

/// A texture as far as a list looks at it, on the heap like the driver's.
struct Sizes {
    std::size_t nWidth_;
    std::size_t nHeight_ = 1;
    std::size_t nDepth_ = 1;
    int nFormat_ = eFormat;
};

std::vector<std::unique_ptr<Sizes>> sizes(bool bDifferent) {
    std::vector<std::unique_ptr<Sizes>> vpSizes;
    for (unsigned i = 0; i < nTextures; ++i)
        vpSizes.push_back(std::make_unique<Sizes>(Sizes{widthOf(i, bDifferent)}));
    return vpSizes;
}

void walk(benchmark::State& state, bool bDifferent) {
    auto const vpSizes = sizes(bDifferent);
    std::list<Sizes*> vpFree;
    for (auto const& p : vpSizes)
        vpFree.push_back(p.get());
    auto const take = [&vpFree](unsigned width) -> Sizes* {
        for (auto place = vpFree.begin(); place != vpFree.end(); ++place) {
            Sizes* const p = *place;
            if (p->nWidth_ == width && p->nHeight_ == 1 && p->nDepth_ == 1 && p->nFormat_ == eFormat) {
                vpFree.erase(place);
                return p;
            }
        }
        std::abort();
    };
    measure<Sizes>(state, bDifferent, take, [&vpFree](Sizes* p) { vpFree.push_back(p); });
}

void index(benchmark::State& state, bool bDifferent) {
    using FreeList = TextureFreeList<Sizes>;
    auto const vpSizes = sizes(bDifferent);
    FreeList list;
    auto const giveBack = [&list](Sizes* p) {
        list.pushBack({p->nWidth_, p->nHeight_, p->nDepth_, p->nFormat_}, p);
    };
    for (auto const& p : vpSizes)
        giveBack(p.get());
    auto const take = [&list](unsigned width) {
        return list.takeFirstMatch({width, 1, 1, eFormat}, [](Sizes&) {});
    };
    measure<Sizes>(state, bDifferent, take, giveBack);
}

BENCHMARK_CAPTURE(pool2D, different, true)->Name("2D/different");
BENCHMARK_CAPTURE(pool2D, same, false)->Name("2D/same");
BENCHMARK_CAPTURE(pool1D, different, true)->Name("1D/different");
BENCHMARK_CAPTURE(pool1D, same, false)->Name("1D/same");
BENCHMARK_CAPTURE(walk, different, true)->Name("walk/different");
BENCHMARK_CAPTURE(walk, same, false)->Name("walk/same");
BENCHMARK_CAPTURE(index, different, true)->Name("index/different");
BENCHMARK_CAPTURE(index, same, false)->Name("index/same");

} // namespace
