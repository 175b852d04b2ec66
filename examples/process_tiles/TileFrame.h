#pragma once

#include "common/Picture.h"
#include "process_tiles/BandReader.h"
#include "process_tiles/TilePlan.h"

#include <cstddef>
#include <memory>

namespace ORVO {
namespace FilterGraph {
class IFilter;
} // namespace FilterGraph
namespace OGL {
class Context;
} // namespace OGL
} // namespace ORVO

namespace example {

/// What the frames of a picture have in common.
struct TileFrameSettings {
    ORVO::OGL::Context const* context = nullptr; ///< frames run on OpenGL in it; null: on the CPU
    int width = 0;                               ///< of the whole picture
    int height = 0;
    std::size_t channels = 0;      ///< of the file
    Depth depth = Depth::uint8;    ///< on OpenGL 8 bits or float
    std::size_t textureMemory = 0; ///< bytes of textures that may be held, on OpenGL
};

/// Runs a filter over parts of a picture. The engine says which pixels it needs for them.
///
/// Frames on the CPU read the band where it lies. Those on OpenGL take their input from a texture of the
/// wrapped tile.
class TileFrame {
public:
    TileFrame(std::shared_ptr<ORVO::FilterGraph::IFilter> filter, TileFrameSettings const& settings);
    TileFrame(TileFrame const&) = delete;
    TileFrame& operator=(TileFrame const&) = delete;
    ~TileFrame();

    /// The pixels of the picture that a frame over a part of it reads.
    [[nodiscard]] Rectangle needed(Rectangle const& computed);

    /// Computes a part of the picture from a band that has the pixels needed for it. Grey comes out as
    /// colour, and on OpenGL every picture has alpha. Throws what the engine throws.
    void run(Band const& band, Rectangle const& computed, Picture& result);

    /// Computes a part of a black picture on OpenGL, for its textures: throws what the engine throws where
    /// the driver refuses them.
    void tryOut(Rectangle const& computed);

    /// Channels of the results.
    [[nodiscard]] std::size_t channels() const;

    /// Without what reading and writing take beside it.
    [[nodiscard]] MemoryUse memoryUse() const;

private:
    struct Graph;

    std::unique_ptr<Graph> graph_;
};

} // namespace example
