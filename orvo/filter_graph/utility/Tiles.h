#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/spaces/PositionExtentInPixelSpace.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

namespace ORVO::FilterGraph {

class ImageDescriptor;
class ImageDescriptorCPU;
class ImageDescriptorGL;

namespace Utility {

class ImageWrapper;

/// A rectangle cut into tiles, each an `ImageWrapper`, in an order of visiting, with a limit on the memory of
/// textures. For images that are larger than a texture, or for hosts that want memory bounded.
///
///     Tiles tiles(descriptorCPU, rect, ExtentInPixelSpace(1024, 1024));
///     tiles.reorderTilesAsSerpentine();
///     for (auto const& tile : tiles.tiles()) {
///         tile->initializeStorage();
///         ... compute the tile ...
///         tiles.cleanupTileStorage(tile.get());
///     }
///
/// A filter that looks at a neighbourhood needs more of its input than the tile: ask an embedded processor
/// for the region of interest of its source.
///
/// `memoryUseGPU` is a ledger of what `createTileAt` has booked and the cleanups have taken off again, in
/// bytes, and no measurement: tiles from the constructors are not in it, and a tile that the host frees or
/// drops by itself stays in it. Each tile is taken off once, so the limit holds however often the places are
/// made anew.
///
/// Threads: as `ImageWrapper`.
class ORVO_API Tiles {
public:
    /// One tile for each of `getRegions(rect, tileSize)`, in that order, without storage.
    /// @throws ParameterException as `getRegions`; else as `ImageWrapper`.
    Tiles(ImageDescriptorCPU const& descriptor, PositionExtentInPixelSpace const& rect,
          ExtentInPixelSpace const& tileSize);
    Tiles(ImageDescriptorGL const& descriptor, PositionExtentInPixelSpace const& rect,
          ExtentInPixelSpace const& tileSize);

    /// As many empty places for `createTileAt`.
    Tiles(ImageDescriptorCPU const& descriptor, PositionExtentInPixelSpace const& rect, std::size_t count);
    Tiles(ImageDescriptorGL const& descriptor, PositionExtentInPixelSpace const& rect, std::size_t count);

    ~Tiles();
    Tiles(Tiles const&) = delete;
    Tiles& operator=(Tiles const&) = delete;

    /// The rectangle cut into tiles, rows from the top, each from left to right. A last strip of fewer than
    /// 16 pixels joins its neighbour, so a tile may be up to 15 pixels larger than asked. None for a
    /// rectangle without pixels.
    /// @throws ParameterException "Tile size must be at least 1", "Image rectangle exceeds the range of pixel
    /// positions".
    static std::vector<PositionExtentInPixelSpace> getRegions(PositionExtentInPixelSpace const& rect,
                                                              ExtentInPixelSpace const& tileSize);

    /// The tiles in their order; empty places are null.
    std::vector<std::shared_ptr<ImageWrapper>> const& tiles() const { return vspTiles_; }
    std::vector<std::shared_ptr<ImageWrapper>>& tiles() { return vspTiles_; }

    /// The whole.
    PositionExtentInPixelSpace const& rect() const { return oRect_; }

    ImageDescriptor const& descriptor() const { return *spDescriptor_; }

    /// Bytes, never negative; 2^31 - 1 where it is more.
    std::int32_t memoryUseGPU() const;

    /// Whether the tiles are visited from the back to the front: then `cleanupGPU` begins at the front.
    void setReverseTraversal(bool bReverse) { bReverseTraversal_ = bReverse; }

    /// Bytes, 2^31 - 1 at first. Nothing is freed before the next `createTileAt` that grows; a limit below 0
    /// counts as 0.
    void setGPUMemoryLimit(std::int32_t nBytes) { nGPUMemoryLimit_ = nBytes; }

    /// Turns every second row of tiles around, so that each step of a walk goes to a neighbour; a row is a
    /// run of tiles at the same height, to which empty places belong. Ends the reverse traversal. Fewer than
    /// three tiles stay in their order.
    void reorderTilesAsSerpentine();

    /// Puts a new tile, without storage, into a place, and books its bytes; before that, if these are more
    /// than what is booked for the one there (nothing, if its storage was freed by a cleanup), frees others
    /// down to the limit. The pointer is valid as long as the tile stands there.
    /// @throws ParameterException "index >= 0 && index < tiles().size()"; as `ImageWrapper`. The tiles are
    /// then as they were.
    ImageWrapper* createTileAt(int index, PositionExtentInPixelSpace const& rect);

    /// While more than `limit` bytes are booked, frees the storage of tiles, those that the traversal reaches
    /// last first, and takes off the books what is booked for them.
    void cleanupGPU(std::size_t limit);

    /// Frees the storage of one tile, if its image has it, and takes off the books what is booked for it.
    /// @throws InternalException "Enforce pTile != NULL".
    void cleanupTileStorage(ImageWrapper* pTile);

    /// No tiles any more, and nothing booked.
    void reset();

private:
    void createTiles(ExtentInPixelSpace const& tileSize);
    /// Answers what was booked for the tile, in bytes, which is nothing from then on.
    std::int64_t takeOffBooks(ImageWrapper& tile);

    std::shared_ptr<ImageDescriptor> spDescriptor_;
    PositionExtentInPixelSpace oRect_;
    std::vector<std::shared_ptr<ImageWrapper>> vspTiles_;
    bool bReverseTraversal_ = false;
    std::int64_t nMemoryUseGPU_ = 0;
    std::int32_t nGPUMemoryLimit_ = 0x7fffffff;
};

} // namespace Utility
} // namespace ORVO::FilterGraph
