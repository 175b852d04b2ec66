// How the texture pool keeps to its budget, and how it is cleared.
#include "tests/image_runtime/support/PoolTest.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

namespace ORVO {
namespace {

using OGL::Texture;
using Test::Events;
using Test::GLHooks;

constexpr auto eBytes = Texture::INTERNAL_FORMAT_LUMINANCE8;

class TexturePoolEviction : public Test::PoolTest {
protected:
    OGL::Texture1D* take1D(unsigned n) { return pool().getTexture1DFromPool(n, eBytes, true); }
    OGL::Texture3D* take3D(unsigned n) { return pool().getTexture3DFromPool(n, 1, 1, eBytes, true); }
    OGL::TextureRECT* takeRECT(unsigned n) { return pool().getTextureRECTFromPool(n, 1, eBytes, true); }
    OGL::TextureRECT* takeClient(unsigned nWidth, unsigned nHeight) {
        return pool().getClientStorageTextureRECTFromPool(nWidth, nHeight, Texture::FORMAT_LUMINANCE,
                                                          Texture::TYPE_UNSIGNED_BYTE);
    }

    /// Textures of so many bytes each, in use; returned in the order given.
    void fill(std::vector<unsigned> const& aBytes) {
        std::vector<OGL::Texture2D*> vpTexture;
        for (unsigned n : aBytes)
            vpTexture.push_back(takeBytes(n));
        oListener_.take();
        for (OGL::Texture2D* p : vpTexture)
            pool().returnTexture2DToPool(p);
    }

    static long textures() {
        auto const counts = GLHooks::objects();
        auto const found = counts.find("texture");
        return found == counts.end() ? 0 : found->second;
    }
};

TEST_F(TexturePoolEviction, StartsAtTheBudgetAndStopsAtThreeQuarters) {
    oConfiguration_.setMaximumFreelistSize(100);
    remake();
    fill({20, 30, 49});
    EXPECT_EQ(99u, freeBytes());
    EXPECT_EQ(Events(), oListener_.take());
    // 100 bytes: the oldest goes, which leaves 80, and the next, which leaves 50.
    fill({1});
    EXPECT_EQ(50u, freeBytes());
    EXPECT_EQ((Events{{"freed", 20}, {"freed", 30}}), oListener_.take());
}

TEST_F(TexturePoolEviction, StopsAsSoonAsTheTargetIsReached) {
    oConfiguration_.setMaximumFreelistSize(100);
    remake();
    fill({25, 75});
    EXPECT_EQ(75u, freeBytes());
    EXPECT_EQ((Events{{"freed", 25}}), oListener_.take());
    fill({24});
    EXPECT_EQ(99u, freeBytes());
}

TEST_F(TexturePoolEviction, DeletesATextureThatIsTooLargeByItself) {
    oConfiguration_.setMaximumFreelistSize(100);
    remake();
    fill({150});
    EXPECT_EQ(0u, freeBytes());
    EXPECT_EQ((Events{{"freed", 150}}), oListener_.take());
}

TEST_F(TexturePoolEviction, CountsOnlyWhatIsOnTheLists) {
    oConfiguration_.setMaximumFreelistSize(100);
    remake();
    OGL::Texture2D* const pInUse = takeBytes(1000);
    fill({99});
    EXPECT_EQ(99u, freeBytes());
    EXPECT_EQ(Events(), oListener_.take());
    pool().returnTexture2DToPool(pInUse);
    EXPECT_EQ(0u, freeBytes());
}

TEST_F(TexturePoolEviction, GoesRoundOverTheKindsOldestFirst) {
    OGL::Texture1D* const a1D[] = {take1D(10), take1D(11)};
    OGL::Texture2D* const a2D[] = {takeBytes(20), takeBytes(21)};
    OGL::Texture3D* const a3D[] = {take3D(30), take3D(31)};
    OGL::TextureRECT* const aRECT[] = {takeRECT(40), takeRECT(41)};
    OGL::TextureRECT* const aClient[] = {takeClient(64, 64), takeClient(64, 64)};
    for (int i : {0, 1}) {
        pool().returnClientStorageTextureRECTToPool(aClient[i]);
        pool().returnTextureRECTToPool(aRECT[i]);
        pool().returnTexture3DToPool(a3D[i]);
        pool().returnTexture2DToPool(a2D[i]);
        pool().returnTexture1DToPool(a1D[i]);
    }
    oListener_.take();
    std::size_t const nAll = 10 + 11 + 20 + 21 + 30 + 31 + 40 + 41 + 2 * 4096;
    ASSERT_EQ(nAll, freeBytes());
    // One pass over all kinds is enough, and is not ended before its end.
    pool().setMaximumPoolSize(nAll);
    EXPECT_EQ(11u + 21 + 31 + 41 + 4096, freeBytes());
    EXPECT_EQ((Events{{"freed", 20}}), oListener_.take());
    EXPECT_EQ(a1D[1], take1D(11));
    EXPECT_EQ(a2D[1], takeBytes(21));
    EXPECT_EQ(a3D[1], take3D(31));
    EXPECT_EQ(aRECT[1], takeRECT(41));
    EXPECT_EQ(aClient[1], takeClient(64, 64));
    EXPECT_EQ(0u, freeBytes());
    pool().setMaximumPoolSize(1 << 20);
    pool().returnTexture1DToPool(a1D[1]);
    pool().returnTexture2DToPool(a2D[1]);
    pool().returnTexture3DToPool(a3D[1]);
    pool().returnTextureRECTToPool(aRECT[1]);
    pool().returnClientStorageTextureRECTToPool(aClient[1]);
}

/// Counts the textures that are left when it is told of freed memory.
class CountingListener : public VideoMemory::VideoMemoryListener {
public:
    explicit CountingListener(long (*pTextures)()) : pTextures_(pTextures) {}
    void memoryFreed(std::size_t) override { nLeft_ = pTextures_(); }

    long nLeft_ = -1;

private:
    long (*pTextures_)();
};

TEST_F(TexturePoolEviction, TellsOfA2DTextureBeforeTheOtherKindsFollow) {
    CountingListener listener(&TexturePoolEviction::textures);
    oConfiguration_.setVideoMemoryListener(&listener);
    remake();
    long const nBefore = textures();
    OGL::Texture1D* const p1D = take1D(10);
    OGL::Texture2D* const p2D = takeBytes(20);
    OGL::Texture3D* const p3D = take3D(30);
    OGL::TextureRECT* const pRECT = takeRECT(40);
    OGL::TextureRECT* const pClient = takeClient(64, 64);
    pool().returnTexture1DToPool(p1D);
    pool().returnTexture2DToPool(p2D);
    pool().returnTexture3DToPool(p3D);
    pool().returnTextureRECTToPool(pRECT);
    pool().returnClientStorageTextureRECTToPool(pClient);
    ASSERT_EQ(nBefore + 5, textures());
    pool().setMaximumPoolSize(0);
    EXPECT_EQ(nBefore + 3, listener.nLeft_);
    EXPECT_EQ(nBefore, textures());
    pPool_.reset();
}

TEST_F(TexturePoolEviction, TellsOfEachPassAlsoWithout2DTextures) {
    pool().returnTexture1DToPool(take1D(8));
    pool().returnTexture1DToPool(take1D(9));
    oListener_.take();
    pool().setMaximumPoolSize(0);
    EXPECT_EQ(0u, freeBytes());
    // The first of 8 bytes was taken for the second request only if it matched, which it does not.
    EXPECT_EQ((Events{{"freed", 0}, {"freed", 0}}), oListener_.take());
}

TEST_F(TexturePoolEviction, EmptiesTheListsForABudgetOfNothing) {
    long const nBefore = textures();
    fill({10, 20, 30});
    pool().returnTexture1DToPool(take1D(8));
    pool().returnClientStorageTextureRECTToPool(takeClient(1, 1));
    EXPECT_EQ(nBefore + 5, textures());
    pool().setMaximumPoolSize(0);
    EXPECT_EQ(0u, freeBytes());
    EXPECT_EQ(nBefore, textures());
    oListener_.take();
    pool().setMaximumPoolSize(0);
    EXPECT_EQ(Events(), oListener_.take());
    // From now on nothing is kept.
    fill({10});
    EXPECT_EQ(0u, freeBytes());
    EXPECT_EQ(nBefore, textures());
}

TEST_F(TexturePoolEviction, ReportsACountThatHasGoneWrong) {
    oConfiguration_.setMaximumFreelistSize(100);
    remake();
    TexturePoolProbe::setFreeListBytes(pool(), 90);
    ORVO_EXPECT_INTERNAL(pool().returnTexture2DToPool(takeBytes(10)),
                         "oFreeList1D_.size() != 0 || oFreeList2D_.size() != 0 || "
                         "oFreeList3D_.size() != 0 || oFreeListRECT_.size() != 0 || "
                         "vpTransferClientStorage_.size() != 0");
    EXPECT_EQ(90u, freeBytes());
    TexturePoolProbe::setFreeListBytes(pool(), 0);
}

TEST(TexturePoolTarget, IsThreeQuartersOfTheBudgetIn64Bits) {
    struct Row {
        std::size_t nBudget_;
        std::size_t nTarget_;
    };
    Row const rows[] = {{0, 0},
                        {1, 0},
                        {2, 1},
                        {3, 2},
                        {4, 3},
                        {100, 75},
                        {0x8000000, 0x6000000},
                        {0x60000000, 0x48000000},
                        {0x80000000, 0x60000000},
                        {0x180000000, 0x120000000},
                        {SIZE_MAX, 0xbfffffffffffffff}};
    for (Row const& row : rows)
        EXPECT_EQ(row.nTarget_, TexturePoolProbe::evictionTarget(row.nBudget_)) << row.nBudget_;
}

TEST_F(TexturePoolEviction, TakesAnyBudget) {
    oConfiguration_.setMaximumFreelistSize(SIZE_MAX);
    remake();
    fill({10, 20});
    EXPECT_EQ(30u, freeBytes());
    pool().setMaximumPoolSize(std::size_t{1} << 32);
    EXPECT_EQ(30u, freeBytes());
}

class TexturePoolClear : public TexturePoolEviction {
protected:
    void SetUp() override {
        TexturePoolEviction::SetUp();
        pool().returnTexture1DToPool(take1D(1));
        fill({2, 20});
        pool().returnTexture3DToPool(take3D(400));
        pool().returnTextureRECTToPool(takeRECT(5000));
        pool().returnClientStorageTextureRECTToPool(takeClient(64, 64));
        oListener_.take();
        nTextures_ = textures();
        ASSERT_EQ(9519u, freeBytes());
    }

    long nTextures_ = 0;
};

TEST_F(TexturePoolClear, ClearsOneKindAtATime) {
    pool().clear1DPool();
    EXPECT_EQ(9518u, freeBytes());
    EXPECT_EQ(nTextures_ - 1, textures());
    EXPECT_EQ(Events(), oListener_.take());
    pool().clear2DPool();
    EXPECT_EQ(9496u, freeBytes());
    EXPECT_EQ(nTextures_ - 3, textures());
    EXPECT_EQ((Events{{"freed", 22}}), oListener_.take());
    pool().clear3DPool();
    EXPECT_EQ(9096u, freeBytes());
    EXPECT_EQ(nTextures_ - 4, textures());
    pool().clearRECTPool();
    EXPECT_EQ(0u, freeBytes());
    EXPECT_EQ(nTextures_ - 6, textures());
    EXPECT_EQ(Events(), oListener_.take());
}

TEST_F(TexturePoolClear, ClearsAll) {
    pool().clearAll();
    EXPECT_EQ(0u, freeBytes());
    EXPECT_EQ(nTextures_ - 6, textures());
    EXPECT_EQ((Events{{"freed", 22}}), oListener_.take());
    pool().clearAll();
    EXPECT_EQ((Events{{"freed", 0}}), oListener_.take());
}

TEST_F(TexturePoolClear, ClearsWithThePool) {
    pPool_.reset();
    EXPECT_EQ(nTextures_ - 6, textures());
    EXPECT_EQ((Events{{"freed", 22}}), oListener_.take());
}

TEST_F(TexturePoolClear, ClearsWithoutACurrentContext) {
    host().release();
    pool().clearAll();
    EXPECT_EQ(nTextures_ - 6, textures());
    host().makeCurrent();
}

} // namespace
} // namespace ORVO
