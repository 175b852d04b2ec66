// What reading and writing of picture files have in common, for the sources that know OpenImageIO.
#pragma once

#include "common/Picture.h"

#include <OpenImageIO/imageio.h>

#include <filesystem>
#include <memory>
#include <string>
#include <vector>

namespace example {

/// OpenImageIO's own messages may have several lines: the first one says it.
[[nodiscard]] std::string firstLine(std::string const& text);

/// Opens a file of 1 to 4 channels. Throws PictureError.
[[nodiscard]] std::unique_ptr<OIIO::ImageInput> openForReading(std::string const& path);

/// Whether the colours of the file come with alpha multiplied in.
[[nodiscard]] bool hasAssociatedAlpha(OIIO::ImageSpec const& spec);

/// The ICC profile that stands in the file; empty where there is none.
[[nodiscard]] std::vector<unsigned char> profileOf(OIIO::ImageSpec const& spec);

/// Has the file that is written hold the profile, if it is one for that number of channels, and the
/// orientation. Not for EXR files.
void setProfileAndOrientation(OIIO::ImageSpec& spec, std::vector<unsigned char> const& profile,
                              int orientation);

/// How viewers turn the picture.
[[nodiscard]] int orientationOf(OIIO::ImageSpec const& spec);

/// The depth that holds every value of that type.
[[nodiscard]] Depth depthOf(OIIO::TypeDesc const& type);

/// Divides the colours by alpha, or multiplies with it.
void changeAlpha(std::vector<float>& pixels, std::size_t channels, bool divide);

/// The picture's values, black at 0 and white at 1.
[[nodiscard]] std::vector<float> pictureToFloats(Picture const& picture);

/// The opposite: the picture's values from as many numbers, cut off at its black and white if it is of
/// integers.
void floatsToPicture(std::vector<float> const& values, Picture& picture);

/// The extension in small letters, with its dot.
[[nodiscard]] std::string extensionOf(std::string const& path);

/// What a file's channels are stored as: the depth where the format knows it.
[[nodiscard]] OIIO::TypeDesc fileType(std::string const& extension, Depth depth);

/// A writer of the format that the name says. Throws PictureError.
[[nodiscard]] std::unique_ptr<OIIO::ImageOutput> outputFor(std::string const& path);

/// A file beside another, which takes its place when all is written. Removed unless that came about.
class TemporaryFile {
public:
    explicit TemporaryFile(std::string const& target);
    TemporaryFile(TemporaryFile const&) = delete;
    TemporaryFile& operator=(TemporaryFile const&) = delete;
    ~TemporaryFile();

    [[nodiscard]] std::string path() const { return path_.string(); }

    /// Throws PictureError.
    void takePlace();

private:
    std::string target_;
    std::filesystem::path path_;
};

} // namespace example
