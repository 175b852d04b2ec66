#pragma once

#include <cstddef>
#include <stdexcept>
#include <string>
#include <vector>

namespace example {

/// Storage of one channel.
enum class Depth {
    uint8,    ///< 0 to 255
    uint15_1, ///< 16-bit integers, black at 0 and white at 32768: the scale of the engine's 16-bit CPU images
    float32,  ///< black at 0, white at 1
};

/// An image in memory: rows from the top without padding, channels interleaved. Alpha, where there is one (2
/// and 4 channels), is the last channel and is not multiplied into the others.
struct Picture {
    std::size_t width = 0;
    std::size_t height = 0;
    std::size_t channels = 0;
    Depth depth = Depth::uint8;
    std::vector<unsigned char> pixels;
    /// The ICC profile that stands in the file; empty where there is none.
    std::vector<unsigned char> profile;
    /// How viewers turn the picture of the file: EXIF's number, 1 for not at all.
    int orientation = 1;

    Picture() = default;
    Picture(std::size_t width, std::size_t height, std::size_t channels, Depth depth);

    /// Makes it another picture, with any pixels, in the same memory where that is large enough.
    void resize(std::size_t width, std::size_t height, std::size_t channels, Depth depth);

    [[nodiscard]] bool hasAlpha() const { return channels == 2 || channels == 4; }
    [[nodiscard]] std::size_t rowBytes() const;
};

[[nodiscard]] std::size_t bytesPerChannel(Depth depth);

/// A picture file that cannot be read or written; what() is one line for a person.
class PictureError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// The depth that holds every value of the file: 8-bit, 16-bit or float. Throws PictureError.
[[nodiscard]] Depth depthOfFile(std::string const& path);

/// Reads a file of 1 to 4 channels and converts it to depth. Throws PictureError.
[[nodiscard]] Picture readPicture(std::string const& path, Depth depth);

/// Writes through a temporary file beside path, which takes its place at the end: after a failure path is as
/// it was. The file holds the depth nearest to the picture's that its format knows, and the picture's profile
/// and orientation (but for EXR). A format without alpha (JPEG) gets the picture over black. Throws
/// PictureError.
void writePicture(std::string const& path, Picture const& picture);

/// Throws PictureError if writePicture would refuse path for its format or its folder, before any work is
/// done.
void checkWritable(std::string const& path);

/// Grey widened to three equal channels (1 to 3, 2 to 4 channels); other pictures as they are.
[[nodiscard]] Picture widenedToColour(Picture const& picture);

/// The opposite of widenedToColour: the three colour channels replaced by their mean.
[[nodiscard]] Picture reducedToGrey(Picture const& picture);

/// An opaque alpha added to a picture without one (1 to 2, 3 to 4 channels); other pictures as they are.
[[nodiscard]] Picture withAlpha(Picture const& picture);

/// The opposite: the picture without its alpha, which is not multiplied in.
[[nodiscard]] Picture withoutAlpha(Picture const& picture);

/// The rows in the opposite order.
[[nodiscard]] Picture upsideDown(Picture const& picture);

} // namespace example
