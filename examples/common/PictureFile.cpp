// Reading and writing of picture files, all through OpenImageIO.
#include "common/PictureIO.h"

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdint>
#include <filesystem>
#include <system_error>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace example {

namespace fs = std::filesystem;

namespace {

constexpr float white15_1 = 32768.0F;

fs::path temporaryBeside(std::string const& path) {
    fs::path const target(path);
    std::string name(1, '.');
    name += target.stem().string();
    name += '.';
    name += std::to_string(::getpid());
    name += target.extension().string();
    return target.parent_path() / name;
}

std::vector<float> withoutAlpha(std::vector<float> const& pixels, std::size_t channels) {
    std::vector<float> result;
    result.reserve(pixels.size() / channels * (channels - 1));
    for (std::size_t pixel = 0; pixel < pixels.size(); pixel += channels)
        result.insert(result.end(), pixels.begin() + static_cast<std::ptrdiff_t>(pixel),
                      pixels.begin() + static_cast<std::ptrdiff_t>(pixel + channels - 1));
    return result;
}

} // namespace

std::string firstLine(std::string const& text) { return text.substr(0, text.find('\n')); }

std::unique_ptr<OIIO::ImageInput> openForReading(std::string const& path) {
    if (!fs::exists(path))
        throw PictureError("Cannot read " + path + ": no such file");
    if (fs::is_directory(path))
        throw PictureError("Cannot read " + path + ": it is a folder");
    // A pipe would be waited for, and cannot be gone back in.
    if (!fs::is_regular_file(path))
        throw PictureError("Cannot read " + path + ": it is not a regular file");
    OIIO::ImageSpec hints;
    hints["oiio:UnassociatedAlpha"] = 1;
    auto input = OIIO::ImageInput::open(path, &hints);
    if (!input)
        throw PictureError("Cannot read " + path + ": " + firstLine(OIIO::geterror()));
    int const channels = input->spec().nchannels;
    if (channels < 1 || channels > 4)
        throw PictureError("Cannot read " + path + ": it has " + std::to_string(channels) +
                           " channels, and 1 to 4 are supported");
    if (input->spec().depth > 1)
        throw PictureError("Cannot read " + path + ": volumes are not supported");
    return input;
}

void changeAlpha(std::vector<float>& pixels, std::size_t channels, bool divide) {
    for (std::size_t pixel = 0; pixel + channels <= pixels.size(); pixel += channels) {
        float const alpha = pixels[pixel + channels - 1];
        if (divide && alpha == 0.0F)
            continue;
        for (std::size_t channel = 0; channel + 1 < channels; ++channel)
            pixels[pixel + channel] =
                divide ? pixels[pixel + channel] / alpha : pixels[pixel + channel] * alpha;
    }
}

void floatsToPicture(std::vector<float> const& values, Picture& picture) {
    if (picture.depth == Depth::float32) {
        std::copy(values.begin(), values.end(), reinterpret_cast<float*>(picture.pixels.data()));
        return;
    }
    auto const quantised = [](float value, float white) {
        float const scaled = std::isnan(value) ? 0.0F : std::clamp(value, 0.0F, 1.0F) * white;
        return std::floor(scaled + 0.5F);
    };
    auto* words = reinterpret_cast<std::uint16_t*>(picture.pixels.data());
    for (std::size_t i = 0; i < values.size(); ++i) {
        if (picture.depth == Depth::uint8)
            picture.pixels[i] = static_cast<unsigned char>(quantised(values[i], 255.0F));
        else
            words[i] = static_cast<std::uint16_t>(quantised(values[i], white15_1));
    }
}

std::vector<float> pictureToFloats(Picture const& picture) {
    std::vector<float> values(picture.width * picture.height * picture.channels);
    auto const* floats = reinterpret_cast<float const*>(picture.pixels.data());
    auto const* words = reinterpret_cast<std::uint16_t const*>(picture.pixels.data());
    for (std::size_t i = 0; i < values.size(); ++i) {
        if (picture.depth == Depth::float32)
            values[i] = floats[i];
        else if (picture.depth == Depth::uint8)
            values[i] = static_cast<float>(picture.pixels[i]) / 255.0F;
        else
            values[i] = static_cast<float>(words[i]) / white15_1;
    }
    return values;
}

std::string extensionOf(std::string const& path) {
    std::string extension = fs::path(path).extension().string();
    std::transform(extension.begin(), extension.end(), extension.begin(),
                   [](unsigned char letter) { return static_cast<char>(std::tolower(letter)); });
    return extension;
}

OIIO::TypeDesc fileType(std::string const& extension, Depth depth) {
    if (extension == ".jpg" || extension == ".jpeg" || (depth == Depth::uint8 && extension != ".exr"))
        return OIIO::TypeDesc::UINT8;
    if (extension == ".exr")
        return depth == Depth::uint8 ? OIIO::TypeDesc::HALF : OIIO::TypeDesc::FLOAT;
    bool const floats = depth == Depth::float32 && extension != ".png";
    return floats ? OIIO::TypeDesc::FLOAT : OIIO::TypeDesc::UINT16;
}

std::unique_ptr<OIIO::ImageOutput> outputFor(std::string const& path) {
    auto output = OIIO::ImageOutput::create(path);
    if (!output)
        throw PictureError("Cannot write " + path + ": " + firstLine(OIIO::geterror()));
    return output;
}

TemporaryFile::TemporaryFile(std::string const& target) : target_(target), path_(temporaryBeside(target)) {}

TemporaryFile::~TemporaryFile() {
    std::error_code ignored;
    fs::remove(path_, ignored);
}

void TemporaryFile::takePlace() {
    std::error_code failure;
    fs::rename(path_, target_, failure);
    if (failure)
        throw PictureError("Cannot write " + target_ + ": " + failure.message());
}

std::vector<unsigned char> profileOf(OIIO::ImageSpec const& spec) {
    auto const* attribute = spec.find_attribute("ICCProfile");
    if (!attribute || attribute->type().basetype != OIIO::TypeDesc::UINT8)
        return {};
    auto const* bytes = static_cast<unsigned char const*>(attribute->data());
    return {bytes, bytes + attribute->datasize()};
}

int orientationOf(OIIO::ImageSpec const& spec) { return spec.get_int_attribute("Orientation", 1); }

void setProfileAndOrientation(OIIO::ImageSpec& spec, std::vector<unsigned char> const& profile,
                              int orientation) {
    spec["Orientation"] = orientation;
    // The header of a profile names the colours that it is for behind 16 bytes of other things.
    constexpr std::ptrdiff_t colours = 16;
    std::string const wanted = spec.nchannels < 3 ? "GRAY" : "RGB ";
    if (profile.size() > 128 && std::equal(wanted.begin(), wanted.end(), profile.begin() + colours))
        spec.attribute("ICCProfile", OIIO::TypeDesc(OIIO::TypeDesc::UINT8, static_cast<int>(profile.size())),
                       profile.data());
}

bool hasAssociatedAlpha(OIIO::ImageSpec const& spec) {
    bool const hasAlpha = spec.nchannels == 2 || spec.nchannels == 4;
    return hasAlpha && spec.get_int_attribute("oiio:UnassociatedAlpha") == 0;
}

Depth depthOf(OIIO::TypeDesc const& type) {
    if (type.is_floating_point())
        return Depth::float32;
    return type.size() == 1 ? Depth::uint8 : Depth::uint15_1;
}

Depth depthOfFile(std::string const& path) { return depthOf(openForReading(path)->spec().format); }

Picture readPicture(std::string const& path, Depth depth) {
    auto const input = openForReading(path);
    OIIO::ImageSpec const& spec = input->spec();
    Picture picture(static_cast<std::size_t>(spec.width), static_cast<std::size_t>(spec.height),
                    static_cast<std::size_t>(spec.nchannels), depth);
    std::vector<float> values(picture.width * picture.height * picture.channels);
    if (!input->read_image(0, 0, 0, spec.nchannels, OIIO::TypeDesc::FLOAT, values.data()))
        throw PictureError("Cannot read " + path + ": " + firstLine(input->geterror()));
    if (hasAssociatedAlpha(spec))
        changeAlpha(values, picture.channels, true);
    floatsToPicture(values, picture);
    picture.profile = profileOf(spec);
    picture.orientation = orientationOf(spec);
    return picture;
}

void checkWritable(std::string const& path) {
    auto const refuse = [&path](std::string const& reason) {
        throw PictureError("Cannot write " + path + ": " + reason);
    };
    fs::path const folder = fs::path(path).parent_path();
    if (fs::is_directory(path))
        refuse("it is a folder");
    static_cast<void>(outputFor(path));
    if (fs::exists(path) && !fs::is_regular_file(path))
        refuse("it is not a regular file");
    if (!folder.empty() && !fs::is_directory(folder))
        refuse("no such folder");
    if (::access(folder.empty() ? "." : folder.c_str(), W_OK) != 0)
        refuse("the folder is not writable");
    // Some folders that look writable are not: those of the system, those on a medium that is full.
    std::string const temporary = temporaryBeside(path);
    int const file = ::open(temporary.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, S_IRUSR | S_IWUSR);
    if (file < 0)
        refuse("no file can be made beside it (" + std::generic_category().message(errno) + ")");
    ::close(file);
    ::unlink(temporary.c_str());
}

void writePicture(std::string const& path, Picture const& picture) {
    checkWritable(path);
    std::string const extension = extensionOf(path);
    auto const output = outputFor(path);
    std::vector<float> values = pictureToFloats(picture);
    std::size_t channels = picture.channels;
    if (picture.hasAlpha()) {
        bool const keepsAlpha = output->supports("alpha");
        if (!keepsAlpha || extension == ".exr")
            changeAlpha(values, channels, false);
        if (!keepsAlpha)
            values = withoutAlpha(values, channels--);
    }

    OIIO::ImageSpec spec(static_cast<int>(picture.width), static_cast<int>(picture.height),
                         static_cast<int>(channels), fileType(extension, picture.depth));
    spec.alpha_channel =
        channels == picture.channels && picture.hasAlpha() ? static_cast<int>(channels) - 1 : -1;
    if (spec.alpha_channel >= 0 && extension != ".exr")
        spec["oiio:UnassociatedAlpha"] = 1;
    if (extension != ".exr")
        setProfileAndOrientation(spec, picture.profile, picture.orientation);

    TemporaryFile temporary(path);
    if (!output->open(temporary.path(), spec) || !output->write_image(OIIO::TypeDesc::FLOAT, values.data()) ||
        !output->close())
        throw PictureError("Cannot write " + path + ": " + firstLine(output->geterror()));
    temporary.takePlace();
}

} // namespace example
