#include "orvo/image_flow/filters/VantleFilterCPU.h"

#include "orvo/colour_engine/VantlePackingSpec.h"
#include "orvo/core/Check.h"
#include "orvo/core/utility/SaturatingCast.h"
#include "orvo/image_flow/colour/CVantle.h"
#include "orvo/image_flow/colour/TrelException.h"
#include "orvo/image_flow/sources/PixelArea.h"

#include <cstdint>
#include <cstring>

namespace ORVO {

namespace {

std::size_t pitchOf(ImageCPU const& image) {
    return static_cast<std::size_t>(image.capacityExtent().width()) * pixelSizeBytes(image.pixelFormat());
}

/// The first byte of an area that the image holds. The records of the engine have no constant form: it reads
/// one side and writes the other.
unsigned char* firstByte(ImageCPU const& image, PixelArea const& area) {
    PositionInPixelSpace const place = area.placeIn(image);
    return const_cast<unsigned char*>(image.pixels()) + static_cast<std::size_t>(place.y()) * pitchOf(image) +
           static_cast<std::size_t>(place.x()) * pixelSizeBytes(image.pixelFormat());
}

void clear(ImageCPU& image, PixelArea const& area) {
    ExtentInPixelSpace const extent = area.extent();
    if (area.isEmpty()) {
        return;
    }
    unsigned char* pRow = firstByte(image, area);
    std::size_t const nBytes = static_cast<std::size_t>(extent.width()) * pixelSizeBytes(image.pixelFormat());
    for (int row = 0; row < extent.height(); ++row) {
        std::memset(pRow, 0, nBytes);
        pRow += pitchOf(image);
    }
}

/// Completes the record of an image's format by the planes of an area; answers the first byte.
unsigned char* describePlanes(ImageCPU const& image, PixelArea const& area, _t_Vantle_PackingSpec& record) {
    unsigned char* const pFirst = firstByte(image, area);
    for (std::size_t i = 0; i < record.channels; ++i) {
        auto& plane = record.planes[i];
        plane.base = pFirst + i * record.bytesPerChannel;
        // An image with longer rows than the field can tell has one row only.
        plane.rowBytes = saturatingCast<std::int32_t>(pitchOf(image));
        plane.columnBytes = static_cast<std::int32_t>(pixelSizeBytes(image.pixelFormat()));
    }
    return pFirst;
}

bool isRGB(ImageCPU::tePixelFormat format) {
    return format == ImageCPU::PIXEL_FORMAT_RGB8 || format == ImageCPU::PIXEL_FORMAT_RGBA8 ||
           format == ImageCPU::PIXEL_FORMAT_RGB16 || format == ImageCPU::PIXEL_FORMAT_RGBA16;
}

bool isLuminance(ImageCPU::tePixelFormat format) {
    return format == ImageCPU::PIXEL_FORMAT_LUMINANCE8 || format == ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8 ||
           format == ImageCPU::PIXEL_FORMAT_LUMINANCE16 || format == ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16;
}

bool hasIntegerAlpha(ImageCPU::tePixelFormat format) {
    return format == ImageCPU::PIXEL_FORMAT_RGBA8 || format == ImageCPU::PIXEL_FORMAT_RGBA16 ||
           format == ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8 ||
           format == ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16;
}

/// Copies the last channel of `n` pixels, given the address and the size of a pixel.
template <std::size_t nBytes>
void copyLastChannel(unsigned char* pTo, std::size_t nToPixel, unsigned char const* pFrom,
                     std::size_t nFromPixel, std::size_t n) {
    pTo += nToPixel - nBytes;
    pFrom += nFromPixel - nBytes;
    for (std::size_t i = 0; i < n; ++i) {
        std::memcpy(pTo, pFrom, nBytes);
        pTo += nToPixel;
        pFrom += nFromPixel;
    }
}

} // namespace

VantleFilterCPU::VantleFilterCPU()
    : ImageFilter("ORVO::VantleFilterCPU", OUTPUT_PRECISION_DEFAULT),
      vantleTransform_(DataFlow::Parameter<void*>::create(nullptr, "Transform", "Colour transform")),
      vantleOptions_(
          DataFlow::Parameter<void*>::create(nullptr, "Vantle Options", "Options of the colour engine")),
      oInputImage_("InputImage", this),
      oOutputImage_("OutputImage", this) {
    inputTarget_ = ORVO_TARGET_CPU;
    outputTarget_ = ORVO_TARGET_CPU;
    addImageInput(&oInputImage_);
    setImageOutput(&oOutputImage_);
    registerParameter(vantleTransform_.get());
    registerParameter(vantleOptions_.get());
}

VantleFilterCPU::~VantleFilterCPU() = default;

std::shared_ptr<DataFlow::Parameter<void*>> VantleFilterCPU::transform() const {
    ORVO_ENFORCE(vantleTransform_.get());
    return vantleTransform_;
}

std::shared_ptr<DataFlow::Parameter<void*>> VantleFilterCPU::options() const {
    ORVO_ENFORCE(vantleOptions_.get());
    return vantleOptions_;
}

void VantleFilterCPU::getImageInfo(ImageCPU::tePixelFormat format, unsigned& channels,
                                   unsigned& bytesPerChannel, _t_Vantle_PackingSpec& record) {
    bool const bRGB = isRGB(format);
    ORVO_CHECK(bRGB || isLuminance(format), "Invalid input image type");
    channels = bRGB ? 3 : 1;
    bytesPerChannel = channelSizeBits(format) == 8 ? 1 : 2;
    record = _t_Vantle_PackingSpec{};
    record.space = bRGB ? _t_Vantle_PackingSpec::SPACE_RGB : _t_Vantle_PackingSpec::SPACE_GRAY;
    record.channels = channels;
    record.bytesPerChannel = bytesPerChannel;
}

void VantleFilterCPU::processSlice(std::size_t first, std::size_t last) {
    ImageCPU const& input = *oInputImage_;
    ImageCPU& output = *spOutputImage_;
    unsigned channels = 0;
    unsigned inputBytes = 0;
    unsigned outputBytes = 0;
    _t_Vantle_PackingSpec source{};
    _t_Vantle_PackingSpec destination{};
    getImageInfo(input.pixelFormat(), channels, inputBytes, source);
    getImageInfo(output.pixelFormat(), channels, outputBytes, destination);
    ORVO_ENFORCE(vantleTransform_.get());
    ORVO_ENFORCE(vantleOptions_.get());

    PositionInPixelSpace const corner = oOutputRegionInPixels_.position();
    PixelArea target(
        {PositionInPixelSpace(corner.x(), corner.y() + static_cast<int>(first)),
         ExtentInPixelSpace(oOutputRegionInPixels_.extent().width(), static_cast<int>(last - first))});
    target.clipTo(output);
    PixelArea window = target;
    window.clipTo(input);
    if (window.extent() != target.extent()) {
        clear(output, target);
    }
    if (window.isEmpty()) {
        return;
    }
    unsigned char const* const pFrom = describePlanes(input, window, source);
    unsigned char* const pTo = describePlanes(output, window, destination);
    auto const rows = static_cast<std::uint32_t>(window.extent().height());
    auto const columns = static_cast<std::uint32_t>(window.extent().width());
    try {
        CVantle::ApplyGeneral(static_cast<VantleTransform*>(vantleTransform_->value()), &source, &destination,
                              rows, columns, static_cast<_t_Vantle_Options*>(vantleOptions_->value()));
    } catch (TrelException const&) { // No engine: no colours. It may also have gone between two slices.
    }
    if (hasIntegerAlpha(input.pixelFormat()) && inputBytes == outputBytes) {
        auto const copy = inputBytes == 1 ? copyLastChannel<1> : copyLastChannel<2>;
        for (std::size_t row = 0; row < rows; ++row) {
            copy(pTo + row * pitchOf(output), pixelSizeBytes(output.pixelFormat()),
                 pFrom + row * pitchOf(input), pixelSizeBytes(input.pixelFormat()), columns);
        }
    }
}

} // namespace ORVO
