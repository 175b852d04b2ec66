#include "orvo/image_runtime/images/ImageCPU.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/AlignedMemory.h"
#include "orvo/core/memory/MemoryType.h"
#include "orvo/core/utility/Integers.h"
#include "orvo/image_runtime/images/PixelStructures.h"

#include <algorithm>
#include <cstring>
#include <iterator>
#include <limits>
#include <ostream>

namespace ORVO {

namespace {

/// A size of 0 marks what is refused.
struct FormatProperties {
    char const* sName;
    std::uint8_t nChannels;
    std::uint8_t nChannelBits;
    std::uint8_t nPixelBytes;
    bool bInt;
};

// Indexed by the format. The holes of the half-float formats and the undefined format are part of the
// interface.
constexpr FormatProperties FORMATS[] = {
    {"UNKNOWN", 0, 0, 0, false},
    {"PIXEL_FORMAT_BGR8", 3, 8, 3, true},
    {"PIXEL_FORMAT_BGRA8", 4, 8, 4, true},
    {"PIXEL_FORMAT_RGB8", 3, 8, 3, true},
    {"PIXEL_FORMAT_RGBA8", 4, 8, 4, true},
    {"PIXEL_FORMAT_RGB16", 3, 16, 6, true},
    {"PIXEL_FORMAT_RGBA16", 4, 16, 8, true},
    {"PIXEL_FORMAT_RGB32F", 3, 32, 12, false},
    {"PIXEL_FORMAT_RGBA32F", 4, 32, 16, false},
    {"PIXEL_FORMAT_LUMINANCE8", 1, 8, 1, true},
    {"PIXEL_FORMAT_LUMINANCE16", 1, 16, 2, true},
    {"PIXEL_FORMAT_LUMINANCE32F", 1, 32, 4, false},
    {"PIXEL_FORMAT_LUMINANCE_ALPHA8", 2, 8, 2, true},
    {"PIXEL_FORMAT_LUMINANCE_ALPHA16", 2, 16, 4, true},
    {"PIXEL_FORMAT_LUMINANCE_ALPHA32F", 2, 32, 8, false},
    {"PIXEL_FORMAT_RGB16F", 0, 16, 6, false},
    {"PIXEL_FORMAT_RGBA16F", 0, 16, 8, false},
    {"PIXEL_FORMAT_LUMINANCE16F", 0, 16, 0, false},
    {"PIXEL_FORMAT_LUMINANCE_ALPHA16F", 0, 16, 0, false},
    {"PIXEL_FORMAT_UNDEFINED", 0, 0, 0, false},
};

FormatProperties const& propertiesOf(ImageCPU::tePixelFormat ePixelFormat) {
    bool const bFormat = ePixelFormat > 0 && static_cast<std::size_t>(ePixelFormat) < std::size(FORMATS);
    return FORMATS[bFormat ? static_cast<std::size_t>(ePixelFormat) : 0];
}

constexpr int FRESH_ALIGNMENT = 64;
constexpr int COPY_ALIGNMENT = 16;

unsigned char* allocatePixels(std::uint64_t nBytes, int alignment) {
    return static_cast<unsigned char*>(ORVO_private::newAlignedMemory(MEMORY_TYPE_IMAGE, nBytes, alignment));
}

unsigned char* duplicatePixels(unsigned char const* pPixels, std::uint64_t nBytes) {
    unsigned char* pCopy = allocatePixels(nBytes, COPY_ALIGNMENT);
    if (pPixels && nBytes) {
        std::memcpy(pCopy, pPixels, nBytes);
    }
    return pCopy;
}

/// Capacity width times height times pixel bytes. Every number that is refused is refused here, so that the
/// 32-bit arithmetic of sizes further on can not wrap.
std::uint64_t checkedSize(ExtentInPixelSpace const& extent, ExtentInPixelSpace const& capacity,
                          std::size_t nPixelBytes) {
    ORVO_CHECK_PARAMETER(extent.width() >= 0 && extent.height() >= 0 && capacity.width() >= 0 &&
                             capacity.height() >= 0,
                         "Image extent and capacity must not be negative");
    // Below 2^62 for any pair of positive ints, so that only the last factor could wrap.
    std::uint64_t const nPixels =
        static_cast<std::uint64_t>(capacity.width()) * static_cast<std::uint64_t>(capacity.height());
    ORVO_CHECK_PARAMETER(nPixels <= std::numeric_limits<std::uint32_t>::max() / nPixelBytes,
                         "Image size exceeds 4294967295 bytes");
    return nPixels * nPixelBytes;
}

/// Copies each channel out, since memory of the caller may lie anywhere.
template <class Channel>
void writeRow(std::ostream& stream, unsigned char const* pRow, int width, std::size_t nChannels,
              char const* sBehindPixel) {
    for (int x = 0; x < width; ++x) {
        for (std::size_t c = 0; c < nChannels; ++c) {
            Channel value;
            std::memcpy(&value, pRow, sizeof(value));
            pRow += sizeof(value);
            // The unary plus makes a number of a byte.
            stream << +value << " ";
        }
        stream << sBehindPixel;
    }
    stream << "\n";
}

} // namespace

ImageCPU::ImageCPU()
    : ePixelFormat_(PIXEL_FORMAT_UNDEFINED), pPixels_(nullptr), bOwnsPixels_(false), nSizeBytes_(0) {
    eTargetPlatform_ = ORVO_TARGET_CPU;
}

ImageCPU::ImageCPU(tePixelFormat ePixelFormat, PositionExtentInPixelSpace const& positionExtent,
                   PixelExtentInWorldSpace const& pixelExtent, ExtentInPixelSpace capacity)
    : ImageBase(positionExtent, pixelExtent),
      ePixelFormat_(ePixelFormat),
      pPixels_(nullptr),
      bOwnsPixels_(false),
      nSizeBytes_(0) {
    eTargetPlatform_ = ORVO_TARGET_CPU;
    init_stride(capacity);
    pPixels_ = allocatePixels(nSizeBytes_, FRESH_ALIGNMENT);
    bOwnsPixels_ = true;
}

ImageCPU::ImageCPU(tePixelFormat ePixelFormat, unsigned char const* pPixels,
                   PositionExtentInPixelSpace const& positionExtent,
                   PixelExtentInWorldSpace const& pixelExtent, ExtentInPixelSpace capacity)
    : ImageBase(positionExtent, pixelExtent),
      ePixelFormat_(ePixelFormat),
      // Images of constant memory are handed on as constant images: only their type lacks the word.
      pPixels_(const_cast<unsigned char*>(pPixels)),
      bOwnsPixels_(false),
      nSizeBytes_(0) {
    eTargetPlatform_ = ORVO_TARGET_CPU;
    init_stride(capacity);
}

ImageCPU::ImageCPU(ImageCPU const& other)
    : ImageBase(other),
      ePixelFormat_(other.ePixelFormat_),
      pPixels_(duplicatePixels(other.pixels(), other.nSizeBytes_)),
      bOwnsPixels_(true),
      oCapacity_(other.oCapacity_),
      nSizeBytes_(other.nSizeBytes_) {}

ImageCPU& ImageCPU::operator=(ImageCPU const& other) {
    if (this == &other) {
        return *this;
    }
    // The copy is made before the old storage goes: this image may own the pixels that the other one is made
    // around.
    unsigned char* pCopy = duplicatePixels(other.pixels(), other.nSizeBytes_);
    if (bOwnsPixels_) {
        ORVO_private::deleteAlignedMemory(MEMORY_TYPE_IMAGE, pPixels_);
    }
    ImageBase::operator=(other);
    ePixelFormat_ = other.ePixelFormat_;
    pPixels_ = pCopy;
    bOwnsPixels_ = true;
    oCapacity_ = other.oCapacity_;
    nSizeBytes_ = other.nSizeBytes_;
    return *this;
}

ImageCPU::~ImageCPU() {
    if (bOwnsPixels_) {
        ORVO_private::deleteAlignedMemory(MEMORY_TYPE_IMAGE, pPixels_);
    }
}

void ImageCPU::init_stride(ExtentInPixelSpace const& capacity) {
    ExtentInPixelSpace const stride = !capacity.isDefined() || capacity.width() == 0 ? extent() : capacity;
    nSizeBytes_ = checkedSize(extent(), stride, pixelSizeBytes(ePixelFormat_));
    oCapacity_ = stride;
}

ExtentInPixelSpace ImageCPU::capacityExtent() const { return oCapacity_; }

void ImageCPU::initializeToTransparentBlack() {
    unsigned char* pStorage = pixels();
    if (pStorage) {
        std::memset(pStorage, 0, nSizeBytes_);
    }
}

ImageCPU::tePixelFormat ImageCPU::pixelFormat() const { return ePixelFormat_; }

bool ImageCPU::isInSIMDOptimizedFormat() const {
    if (!isFloat(ePixelFormat_) || channelSizeBits(ePixelFormat_) != 32) {
        return false;
    }
    return isAligned(pixels(), 64) &&
           static_cast<std::uint64_t>(capacityExtent().width()) * pixelSizeBytes(ePixelFormat_) % 64 == 0;
}

void ImageCPU::doWrite(std::ostream& stream) const {
    ImageBase::doWrite(stream);
    stream << "Pixel format : " << pixelFormat() << "\n";
    stream << "Physical size " << capacityExtent() << "\n";
    stream << "isInSIMDOptimizedFormat " << isInSIMDOptimizedFormat() << "\n";
}

void ImageCPU::writeImageData(std::ostream& stream) const {
    writeImageData(stream, capacityExtent().width(), capacityExtent().height());
}

void ImageCPU::writeImageData(std::ostream& stream, int maxWidth, int maxHeight) const {
    bool const bBytes = ePixelFormat_ == PIXEL_FORMAT_RGB8 || ePixelFormat_ == PIXEL_FORMAT_RGBA8;
    if (!bBytes && ePixelFormat_ != PIXEL_FORMAT_RGB32F && ePixelFormat_ != PIXEL_FORMAT_RGBA32F) {
        stream << "Image format not handled\n";
        return;
    }
    stream.setf(std::ios_base::fixed, std::ios_base::floatfield);
    stream.precision(2);

    ExtentInPixelSpace const capacity = capacityExtent();
    int const width = std::min(capacity.width(), maxWidth);
    int const height = pixels() ? std::min(capacity.height(), maxHeight) : 0;
    std::size_t const nPixelChannels = nChannels(ePixelFormat_);
    char const* sBehindPixel = ePixelFormat_ == PIXEL_FORMAT_RGB8 ? "" : " ";
    for (int y = 0; y < height; ++y) {
        std::size_t const nOffset = static_cast<std::size_t>(y) * static_cast<std::size_t>(capacity.width()) *
                                    pixelSizeBytes(ePixelFormat_);
        unsigned char const* pRow = pixels() + nOffset;
        if (bBytes) {
            writeRow<unsigned char>(stream, pRow, width, nPixelChannels, sBehindPixel);
        } else {
            writeRow<float>(stream, pRow, width, nPixelChannels, sBehindPixel);
        }
    }
}

void ImageCPU::writeFull(std::ostream& stream) const {
    doWrite(stream);
    writeImageData(stream);
}

PixelBGRA8* ImageCPU::pixels_BGRA8() { return reinterpret_cast<PixelBGRA8*>(pPixels_); }

PixelBGRA8 const* ImageCPU::pixels_BGRA8() const { return reinterpret_cast<PixelBGRA8 const*>(pPixels_); }

PixelBGR8* ImageCPU::pixels_BGR8() { return reinterpret_cast<PixelBGR8*>(pPixels_); }

PixelBGR8 const* ImageCPU::pixels_BGR8() const { return reinterpret_cast<PixelBGR8 const*>(pPixels_); }

PixelRGB16F* ImageCPU::pixels_RGB16F() { return reinterpret_cast<PixelRGB16F*>(pPixels_); }

PixelRGB16F const* ImageCPU::pixels_RGB16F() const { return reinterpret_cast<PixelRGB16F const*>(pPixels_); }

PixelRGBA16F* ImageCPU::pixels_RGBA16F() { return reinterpret_cast<PixelRGBA16F*>(pPixels_); }

PixelRGBA16F const* ImageCPU::pixels_RGBA16F() const {
    return reinterpret_cast<PixelRGBA16F const*>(pPixels_);
}

PixelRGB32F* ImageCPU::pixels_RGB32F() { return reinterpret_cast<PixelRGB32F*>(pPixels_); }

PixelRGB32F const* ImageCPU::pixels_RGB32F() const { return reinterpret_cast<PixelRGB32F const*>(pPixels_); }

PixelRGBA32F* ImageCPU::pixels_RGBA32F() { return reinterpret_cast<PixelRGBA32F*>(pPixels_); }

PixelRGBA32F const* ImageCPU::pixels_RGBA32F() const {
    return reinterpret_cast<PixelRGBA32F const*>(pPixels_);
}

PixelRGB8* ImageCPU::pixels_RGB8() { return reinterpret_cast<PixelRGB8*>(pPixels_); }

PixelRGB8 const* ImageCPU::pixels_RGB8() const { return reinterpret_cast<PixelRGB8 const*>(pPixels_); }

PixelRGBA8* ImageCPU::pixels_RGBA8() { return reinterpret_cast<PixelRGBA8*>(pPixels_); }

PixelRGBA8 const* ImageCPU::pixels_RGBA8() const { return reinterpret_cast<PixelRGBA8 const*>(pPixels_); }

PixelLuminance8* ImageCPU::pixels_Luminance8() { return reinterpret_cast<PixelLuminance8*>(pPixels_); }

PixelLuminance8 const* ImageCPU::pixels_Luminance8() const {
    return reinterpret_cast<PixelLuminance8 const*>(pPixels_);
}

PixelLuminanceAlpha8* ImageCPU::pixels_LuminanceAlpha8() {
    return reinterpret_cast<PixelLuminanceAlpha8*>(pPixels_);
}

PixelLuminanceAlpha8 const* ImageCPU::pixels_LuminanceAlpha8() const {
    return reinterpret_cast<PixelLuminanceAlpha8 const*>(pPixels_);
}

PixelLuminance16F* ImageCPU::pixels_Luminance16F() { return reinterpret_cast<PixelLuminance16F*>(pPixels_); }

PixelLuminance16F const* ImageCPU::pixels_Luminance16F() const {
    return reinterpret_cast<PixelLuminance16F const*>(pPixels_);
}

PixelLuminanceAlpha16F* ImageCPU::pixels_LuminanceAlpha16F() {
    return reinterpret_cast<PixelLuminanceAlpha16F*>(pPixels_);
}

PixelLuminanceAlpha16F const* ImageCPU::pixels_LuminanceAlpha16F() const {
    return reinterpret_cast<PixelLuminanceAlpha16F const*>(pPixels_);
}

PixelLuminance32F* ImageCPU::pixels_Luminance32F() { return reinterpret_cast<PixelLuminance32F*>(pPixels_); }

PixelLuminance32F const* ImageCPU::pixels_Luminance32F() const {
    return reinterpret_cast<PixelLuminance32F const*>(pPixels_);
}

PixelLuminanceAlpha32F* ImageCPU::pixels_LuminanceAlpha32F() {
    return reinterpret_cast<PixelLuminanceAlpha32F*>(pPixels_);
}

PixelLuminanceAlpha32F const* ImageCPU::pixels_LuminanceAlpha32F() const {
    return reinterpret_cast<PixelLuminanceAlpha32F const*>(pPixels_);
}

unsigned char* ImageCPU::pixels() { return pPixels_; }

unsigned char const* ImageCPU::pixels() const { return pPixels_; }

std::size_t nChannels(ImageCPU::tePixelFormat ePixelFormat) {
    std::size_t const nFound = propertiesOf(ePixelFormat).nChannels;
    ORVO_CHECK(nFound != 0, "Pixel format not supported by ORVO in CPU mode");
    return nFound;
}

std::size_t channelSizeBits(ImageCPU::tePixelFormat ePixelFormat) {
    std::size_t const nBits = propertiesOf(ePixelFormat).nChannelBits;
    ORVO_CHECK(nBits != 0, "Not implemented: ePixelFormat in channelSizeBits().");
    return nBits;
}

std::size_t pixelSizeBytes(ImageCPU::tePixelFormat ePixelFormat) {
    ORVO_CHECK(ePixelFormat != ImageCPU::PIXEL_FORMAT_UNDEFINED, "!\"PIXEL_FORMAT_UNDEFINED\"");
    std::size_t const nBytes = propertiesOf(ePixelFormat).nPixelBytes;
    ORVO_CHECK(nBytes != 0, "Not implemented: ePixelFormat in pixelSizeBytes().");
    return nBytes;
}

bool isFloat(ImageCPU::tePixelFormat ePixelFormat) { return !isInt(ePixelFormat); }

bool isInt(ImageCPU::tePixelFormat ePixelFormat) { return propertiesOf(ePixelFormat).bInt; }

std::ostream& operator<<(std::ostream& stream, ImageCPU::tePixelFormat ePixelFormat) {
    return stream << propertiesOf(ePixelFormat).sName;
}

} // namespace ORVO
