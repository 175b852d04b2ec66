// How a rectangle is cut into tiles, the order of the tiles, and the ledger of memory, without OpenGL.
#include "orvo/filter_graph/utility/Tiles.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/filter_graph/impl/ImageDescriptorCPU.h"
#include "orvo/filter_graph/utility/ImageWrapper.h"
#include "tests/support/CoreLayer.h"
#include "tests/support/Expect.h"

#include <algorithm>
#include <limits>
#include <new>

namespace ORVO::FilterGraph::Utility {
namespace {

using Rectangle = PositionExtentInPixelSpace;
using Regions = std::vector<Rectangle>;

Rectangle rectangle(int x, int y, int width, int height) {
    return {PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height)};
}

ImageDescriptorCPU rgb8() { return {{3, ImageDescriptor::CHANNEL_TYPE_UINT8}, PixelExtentInWorldSpace()}; }

Regions regions(Rectangle const& rect, int width, int height) {
    return Tiles::getRegions(rect, ExtentInPixelSpace(width, height));
}

/// Every pixel of the rectangle lies in one region, every region in the rectangle, and they come in rows.
void expectPartition(Rectangle const& rect, Regions const& parts) {
    std::vector<int> covered(static_cast<std::size_t>(rect.extent().width()) *
                             static_cast<std::size_t>(rect.extent().height()));
    for (Rectangle const& part : parts) {
        for (int y = 0; y < part.extent().height(); ++y) {
            for (int x = 0; x < part.extent().width(); ++x) {
                int const px = part.position().x() + x - rect.position().x();
                int const py = part.position().y() + y - rect.position().y();
                ASSERT_TRUE(px >= 0 && px < rect.extent().width() && py >= 0 && py < rect.extent().height());
                ++covered[static_cast<std::size_t>(py * rect.extent().width() + px)];
            }
        }
    }
    EXPECT_EQ(covered, std::vector<int>(covered.size(), 1));
}

class TilesTest : public testing::Test {
protected:
    /// Positions of the tiles in their order; (-1, -1) for an empty place.
    static std::vector<std::pair<int, int>> order(Tiles const& tiles) {
        std::vector<std::pair<int, int>> result;
        for (auto const& spTile : tiles.tiles()) {
            result.emplace_back(spTile ? spTile->position().x() : -1, spTile ? spTile->position().y() : -1);
        }
        return result;
    }

    /// Three tiles of 10 by 10 pixels of 3 bytes with storage, booked by createTileAt.
    static void fill(Tiles& tiles) {
        for (int i = 0; i < 3; ++i) {
            tiles.createTileAt(i, rectangle(10 * i, 0, 10, 10))->initializeStorage();
        }
    }

    static std::vector<bool> haveStorage(Tiles const& tiles) {
        std::vector<bool> result;
        for (auto const& spTile : tiles.tiles()) {
            result.push_back(spTile && spTile->imageHasPixelStorage());
        }
        return result;
    }

    ORVO::Test::CoreLayer oCore_;
};

TEST_F(TilesTest, JoinsAStripBelowSixteenWithItsNeighbour) {
    EXPECT_EQ(regions(rectangle(0, 0, 100, 100), 90, 90), Regions{rectangle(0, 0, 100, 100)});
    EXPECT_EQ(regions(rectangle(0, 0, 100, 100), 84, 84),
              (Regions{rectangle(0, 0, 84, 84), rectangle(84, 0, 16, 84), rectangle(0, 84, 84, 16),
                       rectangle(84, 84, 16, 16)}));
    EXPECT_EQ(regions(rectangle(0, 0, 100, 100), 85, 84),
              (Regions{rectangle(0, 0, 100, 84), rectangle(0, 84, 100, 16)}));
}

TEST_F(TilesTest, CutsRowsFromTheTopAndEachFromTheLeft) {
    EXPECT_EQ(regions(rectangle(-5, 7, 64, 32), 32, 16),
              (Regions{rectangle(-5, 7, 32, 16), rectangle(27, 7, 32, 16), rectangle(-5, 23, 32, 16),
                       rectangle(27, 23, 32, 16)}));
    // Of tiles below 16 the last but one swallows what remains.
    EXPECT_EQ(regions(rectangle(0, 0, 20, 4), 4, 4),
              (Regions{rectangle(0, 0, 4, 4), rectangle(4, 0, 16, 4)}));
}

TEST_F(TilesTest, PartsEveryRectangle) {
    for (int const width : {1, 15, 16, 17, 47, 48, 63, 64}) {
        for (int const tile : {1, 15, 16, 17, 32, 100}) {
            Rectangle const rect = rectangle(-3, 11, width, 65 - width);
            Regions const parts = regions(rect, tile, tile);
            expectPartition(rect, parts);
            for (Rectangle const& part : parts) {
                EXPECT_LE(part.extent().width(), tile + 15);
                EXPECT_LE(part.extent().height(), tile + 15);
                EXPECT_GE(part.extent().width(), std::min({tile, 16, width}));
                EXPECT_GE(part.extent().height(), std::min({tile, 16, 65 - width}));
            }
        }
    }
}

TEST_F(TilesTest, HasNoTilesForARectangleWithoutPixels) {
    EXPECT_TRUE(regions(Rectangle(), 8, 8).empty());
    EXPECT_TRUE(regions(rectangle(3, 4, 0, 10), 8, 8).empty());
    EXPECT_TRUE(regions(rectangle(3, 4, 10, 0), 8, 8).empty());
    EXPECT_TRUE(regions(rectangle(3, 4, -10, 10), 8, 8).empty());
}

TEST_F(TilesTest, RefusesSizesBelowOneAndPositionsOutOfRange) {
    Rectangle const rect = rectangle(0, 0, 10, 10);
    for (auto const& [width, height] : {std::pair(0, 8), {8, 0}, {-1, 8}, {8, -1}}) {
        ORVO_EXPECT_PARAMETER(regions(rect, width, height), "Tile size must be at least 1");
        ORVO_EXPECT_PARAMETER(Tiles(rgb8(), rect, ExtentInPixelSpace(width, height)),
                              "Tile size must be at least 1");
    }
    int const farthest = std::numeric_limits<int>::max();
    ORVO_EXPECT_PARAMETER(regions(rectangle(farthest - 5, 0, 6, 6), 8, 8),
                          "Image rectangle exceeds the range of pixel positions");
    EXPECT_EQ(regions(rectangle(farthest - 5, 0, 5, 5), 8, 8).size(), 1U);
}

TEST_F(TilesTest, WrapsAnImageAroundEachRegion) {
    Rectangle const rect = rectangle(4, 5, 40, 20);
    Tiles const tiles(rgb8(), rect, ExtentInPixelSpace(20, 20));
    EXPECT_EQ(tiles.rect(), rect);
    EXPECT_TRUE(tiles.descriptor().equals(rgb8()));
    EXPECT_EQ(tiles.memoryUseGPU(), 0);
    ASSERT_EQ(tiles.tiles().size(), 2U);
    for (int i = 0; i < 2; ++i) {
        ImageWrapper const& tile = *tiles.tiles()[static_cast<std::size_t>(i)];
        EXPECT_EQ(tile.image().rect(), rectangle(4 + 20 * i, 5, 20, 20));
        EXPECT_TRUE(tile->imageDescriptor().equals(rgb8()));
        EXPECT_FALSE(tile.imageHasPixelStorage());
    }
}

TEST_F(TilesTest, VisitsASerpentine) {
    Tiles tiles(rgb8(), rectangle(0, 0, 60, 60), ExtentInPixelSpace(20, 20));
    tiles.setReverseTraversal(true);
    tiles.reorderTilesAsSerpentine();
    EXPECT_EQ(order(tiles),
              (std::vector<std::pair<int, int>>{
                  {0, 0}, {20, 0}, {40, 0}, {40, 20}, {20, 20}, {0, 20}, {0, 40}, {20, 40}, {40, 40}}));
    Tiles columns(rgb8(), rectangle(0, 0, 20, 80), ExtentInPixelSpace(20, 20));
    columns.reorderTilesAsSerpentine();
    EXPECT_EQ(order(columns), (std::vector<std::pair<int, int>>{{0, 0}, {0, 20}, {0, 40}, {0, 60}}));
}

TEST_F(TilesTest, FreesTheEndOfASerpentineFirst) {
    Tiles row(rgb8(), rectangle(0, 0, 30, 10), 3);
    fill(row);
    row.setReverseTraversal(true);
    row.reorderTilesAsSerpentine();
    row.cleanupGPU(600); // the flag is down again: from the back
    EXPECT_EQ(haveStorage(row), (std::vector<bool>{true, true, false}));
    EXPECT_EQ(row.memoryUseGPU(), 600);

    Tiles tiles(rgb8(), rectangle(0, 0, 20, 20), 4);
    for (int i = 0; i < 4; ++i) {
        tiles.createTileAt(i, rectangle(10 * (i % 2), 10 * (i / 2), 10, 10))->initializeStorage();
    }
    ImageWrapper const* const pLowerLeft = tiles.tiles()[2].get();
    tiles.setReverseTraversal(true);
    tiles.reorderTilesAsSerpentine();
    EXPECT_EQ(order(tiles), (std::vector<std::pair<int, int>>{{0, 0}, {10, 0}, {10, 10}, {0, 10}}));
    tiles.cleanupGPU(900); // the last of the new order, which came before the last of the old one
    EXPECT_FALSE(pLowerLeft->imageHasPixelStorage());
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{true, true, true, false}));
    tiles.cleanupGPU(600);
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{true, true, false, false}));
    tiles.setReverseTraversal(true); // counts again after the new order
    tiles.cleanupGPU(300);
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{false, true, false, false}));
    EXPECT_EQ(tiles.memoryUseGPU(), 300);
}

TEST_F(TilesTest, KeepsTheOrderOfFewerThanThreeTiles) {
    Tiles tiles(rgb8(), rectangle(0, 0, 20, 40), 2);
    tiles.createTileAt(0, rectangle(0, 20, 20, 20))->initializeStorage();
    tiles.createTileAt(1, rectangle(0, 0, 20, 20))->initializeStorage();
    tiles.setReverseTraversal(true);
    tiles.reorderTilesAsSerpentine();
    EXPECT_EQ(order(tiles), (std::vector<std::pair<int, int>>{{0, 20}, {0, 0}}));
    tiles.cleanupGPU(1200); // the flag is down: from the back
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{true, false}));
}

TEST_F(TilesTest, TakesEmptyPlacesAlongInASerpentine) {
    Tiles tiles(rgb8(), rectangle(0, 0, 40, 40), 6);
    tiles.reorderTilesAsSerpentine();
    EXPECT_EQ(order(tiles), (std::vector<std::pair<int, int>>(6, {-1, -1})));
    tiles.createTileAt(0, rectangle(0, 0, 20, 20));
    tiles.createTileAt(2, rectangle(20, 0, 20, 20));
    tiles.createTileAt(3, rectangle(0, 20, 20, 20));
    tiles.createTileAt(4, rectangle(20, 20, 20, 20));
    tiles.reorderTilesAsSerpentine();
    EXPECT_EQ(order(tiles),
              (std::vector<std::pair<int, int>>{{0, 0}, {-1, -1}, {20, 0}, {-1, -1}, {20, 20}, {0, 20}}));
}

TEST_F(TilesTest, BooksTilesThatAreCreated) {
    Tiles tiles(rgb8(), rectangle(0, 0, 30, 10), 3);
    EXPECT_EQ(order(tiles), (std::vector<std::pair<int, int>>(3, {-1, -1})));
    fill(tiles);
    EXPECT_EQ(tiles.memoryUseGPU(), 900);
    ImageWrapper* const pTile = tiles.createTileAt(1, rectangle(10, 0, 10, 4));
    EXPECT_EQ(pTile, tiles.tiles()[1].get());
    EXPECT_EQ(pTile->image().rect(), rectangle(10, 0, 10, 4));
    EXPECT_EQ(tiles.memoryUseGPU(), 720);
    tiles.reset();
    EXPECT_TRUE(tiles.tiles().empty());
    EXPECT_EQ(tiles.memoryUseGPU(), 0);
}

TEST_F(TilesTest, RefusesPlacesThatDoNotExist) {
    Tiles tiles(rgb8(), rectangle(0, 0, 30, 10), 3);
    for (int const index : {-1, 3}) {
        ORVO_EXPECT_PARAMETER(tiles.createTileAt(index, rectangle(0, 0, 1, 1)),
                              "index >= 0 && index < tiles().size()");
    }
    fill(tiles);
    ImageWrapper const* const pOld = tiles.tiles()[0].get();
    ORVO_EXPECT_PARAMETER(tiles.createTileAt(0, rectangle(0, 0, -1, 1)), "Image extent must not be negative");
    EXPECT_EQ(tiles.tiles()[0].get(), pOld);
    EXPECT_EQ(tiles.memoryUseGPU(), 900);
}

TEST_F(TilesTest, FreesFromTheBackOrFromTheFront) {
    struct Row {
        bool bReverse;
        std::size_t limit;
        std::vector<bool> aKept;
        int use;
    };
    std::vector<Row> const rows = {
        {false, 900, {true, true, true}, 900},  {false, 899, {true, true, false}, 600},
        {false, 600, {true, true, false}, 600}, {false, 599, {true, false, false}, 300},
        {true, 899, {false, true, true}, 600},  {true, 300, {false, false, true}, 300},
        {false, 0, {false, false, false}, 0},   {true, 0, {false, false, false}, 0},
        {false, 5000, {true, true, true}, 900},
    };
    for (Row const& row : rows) {
        Tiles tiles(rgb8(), rectangle(0, 0, 30, 10), 3);
        fill(tiles);
        tiles.setReverseTraversal(row.bReverse);
        tiles.cleanupGPU(row.limit);
        EXPECT_EQ(haveStorage(tiles), row.aKept) << row.bReverse << ' ' << row.limit;
        EXPECT_EQ(tiles.memoryUseGPU(), row.use);
    }
}

TEST_F(TilesTest, PassesTilesWithoutStorageWhenItFrees) {
    Tiles tiles(rgb8(), rectangle(0, 0, 30, 10), 4);
    fill(tiles);
    tiles.tiles()[2]->releaseStorage();
    tiles.cleanupGPU(700);
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{true, false, false, false}));
    EXPECT_EQ(tiles.memoryUseGPU(), 600);
    // What was booked for a tile without storage stays on the books.
    tiles.cleanupGPU(0);
    EXPECT_EQ(tiles.memoryUseGPU(), 300);
}

TEST_F(TilesTest, TakesOffTheBooksOnlyWhatIsBookedForATile) {
    // Tiles of the constructor have storage that was never booked.
    Tiles tiles(rgb8(), rectangle(0, 0, 60, 20), ExtentInPixelSpace(20, 20));
    for (auto const& spTile : tiles.tiles()) {
        spTile->initializeStorage();
    }
    tiles.cleanupTileStorage(tiles.tiles()[0].get());
    EXPECT_EQ(tiles.memoryUseGPU(), 0);
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{false, true, true}));
    tiles.cleanupGPU(0);
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{false, true, true}));
    tiles.createTileAt(0, rectangle(0, 0, 10, 10))->initializeStorage(); // 300 bytes on the books
    tiles.cleanupTileStorage(tiles.tiles()[2].get());                    // 1200 bytes that are not
    EXPECT_EQ(tiles.memoryUseGPU(), 300);
    tiles.cleanupGPU(299); // comes past the second tile, which does not count
    EXPECT_EQ(tiles.memoryUseGPU(), 0);
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{false, false, false}));
    ImageWrapper other(rgb8(), rectangle(0, 0, 10, 10));
    other.initializeStorage();
    fill(tiles);
    tiles.cleanupTileStorage(&other);
    EXPECT_FALSE(other.imageHasPixelStorage());
    EXPECT_EQ(tiles.memoryUseGPU(), 900);
    // An image that has another size by now was booked with that of its tile.
    (*tiles.tiles()[1])->setRect(rectangle(0, 0, 50, 50));
    tiles.cleanupTileStorage(tiles.tiles()[1].get());
    EXPECT_EQ(tiles.memoryUseGPU(), 600);
}

TEST_F(TilesTest, FreesOneTile) {
    Tiles tiles(rgb8(), rectangle(0, 0, 30, 10), 3);
    fill(tiles);
    tiles.cleanupTileStorage(tiles.tiles()[1].get());
    tiles.cleanupTileStorage(tiles.tiles()[1].get());
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{true, false, true}));
    EXPECT_EQ(tiles.memoryUseGPU(), 600);
    ORVO_EXPECT_INTERNAL(tiles.cleanupTileStorage(nullptr), "Enforce pTile != NULL");
}

TEST_F(TilesTest, KeepsToTheLimitAtTheNextTileThatGrows) {
    Tiles tiles(rgb8(), rectangle(0, 0, 60, 10), 6);
    fill(tiles);
    tiles.setGPUMemoryLimit(300);
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{true, true, true, false, false, false}));
    // The same size again, and less: nothing is freed.
    tiles.createTileAt(1, rectangle(10, 0, 10, 10))->initializeStorage();
    tiles.createTileAt(2, rectangle(20, 0, 10, 5))->initializeStorage();
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{true, true, true, false, false, false}));
    EXPECT_EQ(tiles.memoryUseGPU(), 750);
    tiles.createTileAt(3, rectangle(30, 0, 10, 10));
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{true, false, false, false, false, false}));
    EXPECT_EQ(tiles.memoryUseGPU(), 600);
    tiles.setGPUMemoryLimit(-1); // as 0
    tiles.createTileAt(4, rectangle(40, 0, 10, 10));
    EXPECT_EQ(haveStorage(tiles), std::vector<bool>(6, false));
}

TEST_F(TilesTest, DoesNotFreeWhatItReplacesTwice) {
    Tiles tiles(rgb8(), rectangle(0, 0, 30, 10), 3);
    fill(tiles);
    tiles.setGPUMemoryLimit(600);
    // The place that is made anew is off the books before others are looked at: 600 stay, as the limit says.
    tiles.createTileAt(2, rectangle(20, 0, 10, 20));
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{true, true, false}));
    EXPECT_EQ(tiles.memoryUseGPU(), 1200);
}

TEST_F(TilesTest, KeepsToTheLimitInEveryPass) {
    // Ten tiles of 300 bytes, of which two may stand beside the one that is made.
    for (bool const bReverse : {false, true}) {
        Tiles tiles(rgb8(), rectangle(0, 0, 100, 10), 10);
        tiles.setReverseTraversal(bReverse);
        tiles.setGPUMemoryLimit(600);
        std::size_t const nBefore = Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
        for (int step = 0; step < 40; ++step) {
            int const index = bReverse ? 9 - step % 10 : step % 10;
            tiles.createTileAt(index, rectangle(10 * index, 0, 10, 10))->initializeStorage();
            std::vector<bool> const aStorage = haveStorage(tiles);
            EXPECT_TRUE(aStorage[static_cast<std::size_t>(index)]) << step;
            // The first two of a pass stay; the third place is that of the newest.
            EXPECT_EQ(std::count(aStorage.begin(), aStorage.end(), true), std::min(step + 1, 3)) << step;
            EXPECT_EQ(tiles.memoryUseGPU(), 300 * std::min(step + 1, 3)) << step;
            EXPECT_EQ(Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE),
                      nBefore + static_cast<std::size_t>(std::min(step + 1, 3)))
                << step;
        }
    }
}

TEST_F(TilesTest, KeepsToTheLimitInPlacesOfTheConstructorsTiles) {
    Tiles tiles(rgb8(), rectangle(0, 0, 100, 20), ExtentInPixelSpace(20, 20)); // 1200 bytes each
    tiles.setGPUMemoryLimit(1200);
    for (int step = 0; step < 15; ++step) {
        int const index = step % 5;
        tiles.createTileAt(index, rectangle(20 * index, 0, 20, 20))->initializeStorage();
        EXPECT_EQ(tiles.memoryUseGPU(), 1200 * std::min(step + 1, 2)) << step;
        std::vector<bool> const aStorage = haveStorage(tiles);
        EXPECT_EQ(std::count(aStorage.begin(), aStorage.end(), true), std::min(step + 1, 2)) << step;
    }
}

TEST_F(TilesTest, KeepsOnTheBooksWhatAHostDrops) {
    Tiles tiles(rgb8(), rectangle(0, 0, 30, 10), 1);
    for (int i = 1; i <= 3; ++i) {
        tiles.createTileAt(0, rectangle(0, 0, 10, 10));
        EXPECT_EQ(tiles.memoryUseGPU(), 300 * i);
        tiles.tiles()[0].reset();
    }
    // A tile of another grid takes its own bytes with it, and no more than there are.
    Tiles other(rgb8(), rectangle(0, 0, 30, 10), 1);
    other.createTileAt(0, rectangle(0, 0, 30, 20))->initializeStorage(); // 1800 bytes
    tiles.cleanupTileStorage(other.tiles()[0].get());
    EXPECT_EQ(tiles.memoryUseGPU(), 0);
    EXPECT_EQ(other.memoryUseGPU(), 1800);
}

TEST_F(TilesTest, CountsBeyondWhatItAnswers) {
    Tiles tiles(rgb8(), rectangle(0, 0, 30000, 20000), 4);
    EXPECT_EQ(tiles.createTileAt(0, rectangle(0, 0, 20000, 20000))->storageSize(), 1200000000U);
    EXPECT_EQ(tiles.memoryUseGPU(), 1200000000);
    tiles.createTileAt(1, rectangle(0, 0, 20000, 20000));
    EXPECT_EQ(tiles.memoryUseGPU(), std::numeric_limits<std::int32_t>::max());
    tiles.createTileAt(2, rectangle(0, 0, 20000, 20000));
    EXPECT_EQ(tiles.memoryUseGPU(), std::numeric_limits<std::int32_t>::max());
    // 3.6e9 bytes, less two tiles, plus 2 * 3 bytes.
    tiles.createTileAt(0, rectangle(0, 0, 1, 1));
    EXPECT_EQ(tiles.memoryUseGPU(), std::numeric_limits<std::int32_t>::max());
    tiles.createTileAt(1, rectangle(0, 0, 1, 1));
    EXPECT_EQ(tiles.memoryUseGPU(), 1200000006);
}

TEST_F(TilesTest, KeepsToTheLargestLimit) {
    // Two tiles of 1.2e9 bytes pass 2^31 - 1: the small one, which has storage, goes.
    Tiles tiles(rgb8(), rectangle(0, 0, 30000, 20000), 4);
    tiles.createTileAt(0, rectangle(0, 0, 10, 10))->initializeStorage();
    tiles.createTileAt(1, rectangle(0, 0, 20000, 20000));
    tiles.createTileAt(2, rectangle(0, 0, 20000, 20000));
    EXPECT_TRUE(tiles.tiles()[0]->imageHasPixelStorage());
    tiles.createTileAt(3, rectangle(0, 0, 1, 1));
    EXPECT_FALSE(tiles.tiles()[0]->imageHasPixelStorage());
}

TEST_F(TilesTest, StaysAsItWasWithoutMemory) {
    Tiles tiles(rgb8(), rectangle(0, 0, 30, 10), 3);
    fill(tiles);
    std::size_t const nBytes = Core::MemoryStatistics::bytes(MEMORY_TYPE_IMAGE);
    for (std::uint64_t n = 1;; ++n) {
        Core::AllocationFailure const failure(n);
        try {
            tiles.createTileAt(1, rectangle(10, 0, 10, 10))->initializeStorage();
        } catch (std::bad_alloc const&) {
            EXPECT_LE(Core::MemoryStatistics::bytes(MEMORY_TYPE_IMAGE), nBytes);
        }
        EXPECT_EQ(tiles.memoryUseGPU(), 900);
        if (!failure.hasFired()) {
            break;
        }
        ASSERT_LT(n, 100U);
    }
    EXPECT_EQ(haveStorage(tiles), (std::vector<bool>{true, true, true}));
    EXPECT_EQ(Core::MemoryStatistics::bytes(MEMORY_TYPE_IMAGE), nBytes);
}

} // namespace
} // namespace ORVO::FilterGraph::Utility
