#pragma once

#include "orvo/core/spaces/PositionExtentInPixelSpace.h"

#include <cstddef>
#include <vector>

namespace ORVO::FilterGraph {
class IFilter;
}

namespace example {

using Rectangle = ORVO::PositionExtentInPixelSpace;

/// The first pixel behind a rectangle.
[[nodiscard]] int rightOf(Rectangle const& rectangle);
[[nodiscard]] int bottomOf(Rectangle const& rectangle);
[[nodiscard]] Rectangle rectangleBetween(int left, int top, int right, int bottom);
/// What two rectangles have in common; 0 by 0 where that is nothing.
[[nodiscard]] Rectangle commonPart(Rectangle const& one, Rectangle const& other);

/// How much more than a tile has to be computed for the tile to be right.
///
/// Regions of interest say which pixels of its input a filter reads, and most filters need no more. The cells
/// of a bilateral grid, though, hang on the corner of what is computed, and take in only pixels that are
/// computed themselves. A pixel is made from cells that reach 4.5 sigmas around it: so much more is computed
/// on each side, from a corner that lies a whole number of cells from that of the picture. The cells are then
/// the same ones as those of the whole picture, and so are their sums, since the number of columns to the
/// left is a whole number of vectors.
struct GridReach {
    int marginX = 0;
    int marginY = 0;
    int stepX = 1; ///< the corner's distance from the picture's edge is a multiple of this
    int stepY = 1;
};

/// That of a filter: none without a parameter "spatialSigma".
[[nodiscard]] GridReach gridReachOf(ORVO::FilterGraph::IFilter& filter);

/// That of a grid with cells of so many pixels. Where no whole number of pixels is a whole number of cells,
/// the step comes as near to one as it can.
[[nodiscard]] GridReach gridReachOf(float sigmaX, float sigmaY);

/// Bytes that the textures of a filter's bilateral grid take on OpenGL for each pixel that is computed: none
/// without parameters "spatialSigma" and "rangeSigma".
[[nodiscard]] std::size_t gridTexturesOf(ORVO::FilterGraph::IFilter& filter);

/// The same of a grid with cells of so many pixels and of so much intensity.
[[nodiscard]] std::size_t gridTexturesOf(float sigmaX, float sigmaY, float rangeSigma);

/// Bytes that are held: so many in any case, and so many for each pixel.
struct MemoryUse {
    std::size_t fixed;
    std::size_t file;       ///< a pixel of the rows that are read, twice
    std::size_t result;     ///< a pixel of the results on their way into the file
    std::size_t work;       ///< a pixel of the frame that is computed
    std::size_t kept;       ///< a pixel of the frame, for the next one
    int rowUnit = 1;        ///< rows are read in multiples of so many
    std::size_t copies = 0; ///< a pixel of the result that is being written, beside it
};

/// A picture cut into tiles.
class TilePlan {
public:
    /// Tiles of about tileSize pixels each way, smaller where memory (in bytes) demands it. Throws UsageError
    /// if it does not suffice for the smallest ones.
    TilePlan(int width, int height, int tileSize, GridReach const& reach, MemoryUse const& use,
             std::size_t memory);

    [[nodiscard]] Rectangle picture() const { return rectangleBetween(0, 0, width_, height_); }

    /// Width and height of the tiles that the file is made of. The tiles of the plan begin on their edges.
    [[nodiscard]] int fileTile() const { return fileTile_; }

    /// The tiles of one band after the other from the top; in each the order of the last one is turned
    /// around.
    [[nodiscard]] std::vector<Rectangle> const& tiles() const { return tiles_; }

    /// Bytes that the frame of a tile takes at most.
    [[nodiscard]] std::size_t frameMemory() const { return frameMemory_; }

    /// What is computed for a tile.
    [[nodiscard]] Rectangle computed(Rectangle const& tile) const;

private:
    int width_;
    int height_;
    GridReach reach_;
    int fileTile_;
    std::vector<Rectangle> tiles_;
    std::size_t frameMemory_ = 0;
};

} // namespace example
