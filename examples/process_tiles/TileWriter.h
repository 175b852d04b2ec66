#pragma once

#include "common/Picture.h"
#include "process_tiles/TilePlan.h"

#include <condition_variable>
#include <cstddef>
#include <deque>
#include <exception>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

namespace example {

/// What a file of tiles is to be.
struct TileFileFormat {
    int width = 0;
    int height = 0;
    int fileTile = 0; ///< width and height of the file's own tiles
    std::size_t channels = 0;
    Depth depth = Depth::uint8;         ///< what the file is to hold, where its format knows it
    std::string compression;            ///< as OpenImageIO names it
    std::vector<unsigned char> profile; ///< of ICC; not for EXR
    int orientation = 1;                ///< as Picture has it; not for EXR
};

/// Throws PictureError if the writer would refuse the path for its format or its folder.
void checkTilesWritable(std::string const& path);

/// Bytes that a pixel of a picture takes in the copies that are made to write it into a file of so many
/// channels: without alpha, as grey, in floats.
[[nodiscard]] std::size_t copiesToWrite(std::string const& path, std::size_t fileChannels,
                                        std::size_t channels, Depth depth);

/// Writes a tiled TIFF or EXR file on a thread of its own, tiles in any order, through a temporary file
/// beside it that takes its place at the end: without finish(), and after a failure, the path is as it was.
class TileWriter {
public:
    /// Throws PictureError.
    TileWriter(std::string const& path, TileFileFormat const& format);
    TileWriter(TileWriter const&) = delete;
    TileWriter& operator=(TileWriter const&) = delete;
    ~TileWriter();

    /// A picture whose memory serves again.
    [[nodiscard]] Picture spare();

    /// Hands over a picture of the rectangle `computed`, of which the tile is written: in the file's
    /// channels, or as colour for grey, or with an alpha that the file has not. The tile begins on the edges
    /// of file tiles, and ends there or at the edge of the picture. Waits while one is waiting. Throws
    /// PictureError if an earlier one could not be written.
    void write(Rectangle const& tile, Rectangle const& computed, Picture picture);

    /// Waits for all tiles and puts the file into its place. Throws PictureError.
    void finish();

private:
    struct File;
    struct Job {
        Rectangle tile;
        Rectangle computed;
        Picture picture;
    };

    void writeJobs();
    void writeJob(Job& job);
    void stop();

    std::string path_;
    TileFileFormat format_;
    std::unique_ptr<File> file_;

    std::mutex mutex_;
    std::condition_variable changed_;
    std::deque<Job> jobs_;
    std::vector<Picture> spares_;
    bool complete_ = false; ///< no more jobs come
    bool abandoned_ = false;
    std::exception_ptr failure_;
    std::thread thread_;
};

} // namespace example
