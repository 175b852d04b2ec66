#include "orvo/filter_graph/utility/Tiles.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/ImageDescriptorCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptorGL.h"
#include "orvo/filter_graph/utility/ImageWrapper.h"

#include <algorithm>
#include <limits>
#include <utility>

namespace ORVO::FilterGraph::Utility {

namespace {

/// A last strip narrower than this joins its neighbour.
constexpr std::int64_t smallestStrip = 16;

/// The length of the tile that begins where so much remains.
std::int64_t tileLength(std::int64_t nRemaining, std::int64_t nTile) {
    std::int64_t const nLength = std::min(nRemaining, nTile);
    return nRemaining - nLength < smallestStrip ? nRemaining : nLength;
}

PositionExtentInPixelSpace rectangleOf(std::int64_t x, std::int64_t y, std::int64_t nWidth,
                                       std::int64_t nHeight) {
    return {PositionInPixelSpace(static_cast<int>(x), static_cast<int>(y)),
            ExtentInPixelSpace(static_cast<int>(nWidth), static_cast<int>(nHeight))};
}

std::int64_t bytesOf(ImageDescriptor const& descriptor, PositionExtentInPixelSpace const& rect) {
    return static_cast<std::int64_t>(descriptor.numBytesPerPixel()) * rect.extent().width() *
           rect.extent().height();
}

} // namespace

Tiles::Tiles(ImageDescriptorCPU const& descriptor, PositionExtentInPixelSpace const& rect,
             ExtentInPixelSpace const& tileSize)
    : spDescriptor_(std::make_shared<ImageDescriptorCPU>(descriptor)), oRect_(rect) {
    createTiles(tileSize);
}

Tiles::Tiles(ImageDescriptorGL const& descriptor, PositionExtentInPixelSpace const& rect,
             ExtentInPixelSpace const& tileSize)
    : spDescriptor_(std::make_shared<ImageDescriptorGL>(descriptor)), oRect_(rect) {
    createTiles(tileSize);
}

Tiles::Tiles(ImageDescriptorCPU const& descriptor, PositionExtentInPixelSpace const& rect, std::size_t count)
    : spDescriptor_(std::make_shared<ImageDescriptorCPU>(descriptor)), oRect_(rect), vspTiles_(count) {}

Tiles::Tiles(ImageDescriptorGL const& descriptor, PositionExtentInPixelSpace const& rect, std::size_t count)
    : spDescriptor_(std::make_shared<ImageDescriptorGL>(descriptor)), oRect_(rect), vspTiles_(count) {}

Tiles::~Tiles() = default;

void Tiles::createTiles(ExtentInPixelSpace const& tileSize) {
    for (PositionExtentInPixelSpace const& region : getRegions(oRect_, tileSize)) {
        vspTiles_.push_back(std::make_shared<ImageWrapper>(*spDescriptor_, region));
    }
}

std::vector<PositionExtentInPixelSpace> Tiles::getRegions(PositionExtentInPixelSpace const& rect,
                                                          ExtentInPixelSpace const& tileSize) {
    ORVO_CHECK_PARAMETER(tileSize.width() >= 1 && tileSize.height() >= 1, "Tile size must be at least 1");
    std::int64_t const endX = std::int64_t(rect.position().x()) + rect.extent().width();
    std::int64_t const endY = std::int64_t(rect.position().y()) + rect.extent().height();
    std::int64_t const nFarthest = std::numeric_limits<int>::max();
    ORVO_CHECK_PARAMETER(endX <= nFarthest && endY <= nFarthest,
                         "Image rectangle exceeds the range of pixel positions");
    std::vector<PositionExtentInPixelSpace> regions;
    for (std::int64_t y = rect.position().y(); y < endY;) {
        std::int64_t const nHeight = tileLength(endY - y, tileSize.height());
        for (std::int64_t x = rect.position().x(); x < endX;) {
            std::int64_t const nWidth = tileLength(endX - x, tileSize.width());
            regions.push_back(rectangleOf(x, y, nWidth, nHeight));
            x += nWidth;
        }
        y += nHeight;
    }
    return regions;
}

void Tiles::reorderTilesAsSerpentine() {
    bReverseTraversal_ = false;
    if (vspTiles_.size() < 3) {
        return;
    }
    auto const isOfOtherRow = [](std::shared_ptr<ImageWrapper> const& spFirst) {
        return [&spFirst](std::shared_ptr<ImageWrapper> const& spTile) {
            return spTile && spFirst &&
                   spTile->image().rect().position().y() != spFirst->image().rect().position().y();
        };
    };
    bool bTurn = false;
    for (auto row = vspTiles_.begin(); row != vspTiles_.end(); bTurn = !bTurn) {
        auto const first =
            std::find_if(row, vspTiles_.end(), [](auto const& spTile) { return spTile != nullptr; });
        auto const end =
            first == vspTiles_.end() ? first : std::find_if(first, vspTiles_.end(), isOfOtherRow(*first));
        if (bTurn) {
            std::reverse(row, end);
        }
        row = end;
    }
}

std::int32_t Tiles::memoryUseGPU() const {
    std::int64_t const nLargest = std::numeric_limits<std::int32_t>::max();
    return static_cast<std::int32_t>(std::min(nMemoryUseGPU_, nLargest));
}

std::int64_t Tiles::takeOffBooks(ImageWrapper& tile) {
    std::int64_t const nBytes = std::exchange(tile.nBookedSize_, 0);
    // A tile that the host took from another grid was booked there.
    nMemoryUseGPU_ = std::max<std::int64_t>(nMemoryUseGPU_ - nBytes, 0);
    return nBytes;
}

ImageWrapper* Tiles::createTileAt(int index, PositionExtentInPixelSpace const& rect) {
    ORVO_CHECK_PARAMETER(index >= 0 && static_cast<std::size_t>(index) < vspTiles_.size(),
                         "index >= 0 && index < tiles().size()");
    auto spNew = std::make_shared<ImageWrapper>(*spDescriptor_, rect);
    std::shared_ptr<ImageWrapper>& spPlace = vspTiles_[static_cast<std::size_t>(index)];
    std::int64_t nOldSize = 0;
    if (spPlace) {
        nOldSize = takeOffBooks(*spPlace);
        // Off the books already: the cleanup must not come to it.
        spPlace.reset();
    }
    spNew->nBookedSize_ = bytesOf(*spDescriptor_, rect);
    if (spNew->nBookedSize_ > nOldSize) {
        cleanupGPU(static_cast<std::size_t>(std::max(nGPUMemoryLimit_, 0)));
    }
    nMemoryUseGPU_ += spNew->nBookedSize_;
    spPlace = std::move(spNew);
    return spPlace.get();
}

void Tiles::cleanupGPU(std::size_t limit) {
    auto const isAbove = [this, limit] { return static_cast<std::size_t>(nMemoryUseGPU_) > limit; };
    std::size_t const nTiles = vspTiles_.size();
    for (std::size_t i = 0; i < nTiles && isAbove(); ++i) {
        auto const& spTile = vspTiles_[bReverseTraversal_ ? i : nTiles - 1 - i];
        if (spTile) {
            cleanupTileStorage(spTile.get());
        }
    }
}

void Tiles::cleanupTileStorage(ImageWrapper* pTile) {
    ORVO_ENFORCE(pTile);
    if (pTile->imageHasPixelStorage()) {
        pTile->releaseStorage();
        takeOffBooks(*pTile);
    }
}

void Tiles::reset() {
    vspTiles_.clear();
    nMemoryUseGPU_ = 0;
}

} // namespace ORVO::FilterGraph::Utility
