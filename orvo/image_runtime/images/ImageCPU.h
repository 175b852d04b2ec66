#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/images/ImageBase.h"

#include <cstddef>
#include <cstdint>
#include <iosfwd>

namespace ORVO {

struct PixelBGR8;
struct PixelBGRA8;
struct PixelRGB8;
struct PixelRGBA8;
struct PixelLuminance8;
struct PixelLuminanceAlpha8;
struct PixelRGB16F;
struct PixelRGBA16F;
struct PixelLuminance16F;
struct PixelLuminanceAlpha16F;
struct PixelRGB32F;
struct PixelRGBA32F;
struct PixelLuminance32F;
struct PixelLuminanceAlpha32F;

/// An image in host memory.
///
/// The storage holds capacity width times capacity height pixels; the capacity width is the row pitch in
/// pixels, so that pixel (column, row) begins at byte (row * capacityWidth + column) * pixelSizeBytes. What
/// lies beyond the extent is undefined storage. Channels of a pixel are interleaved.
///
/// Scales: 8-bit integers are 0..255 for 0.0 to 1.0, 16-bit integers are 0..32768 for 0.0 to 1.0 (never
/// 65535), halves and floats are stored as they are.
///
/// Format, position and capacity are fixed by the constructor. An image owns its storage unless it was made
/// around memory of the caller, which has to outlive it.
///
/// Threads: as ImageBase; rows may be read by several threads and disjoint rows written by several threads at
/// once.
class ORVO_API ImageCPU : public ImageBase {
public:
    /// Channels and their order in memory. The numbers are stored in parameters and compared by range. The
    /// half-float formats are served in part only: see the free functions below.
    enum tePixelFormat : std::int32_t {
        PIXEL_FORMAT_BGR8 = 1,
        PIXEL_FORMAT_BGRA8 = 2,
        PIXEL_FORMAT_RGB8 = 3,
        PIXEL_FORMAT_RGBA8 = 4,
        PIXEL_FORMAT_RGB16 = 5,
        PIXEL_FORMAT_RGBA16 = 6,
        PIXEL_FORMAT_RGB32F = 7,
        PIXEL_FORMAT_RGBA32F = 8,
        PIXEL_FORMAT_LUMINANCE8 = 9,
        PIXEL_FORMAT_LUMINANCE16 = 10,
        PIXEL_FORMAT_LUMINANCE32F = 11,
        PIXEL_FORMAT_LUMINANCE_ALPHA8 = 12,
        PIXEL_FORMAT_LUMINANCE_ALPHA16 = 13,
        PIXEL_FORMAT_LUMINANCE_ALPHA32F = 14,
        PIXEL_FORMAT_RGB16F = 15,
        PIXEL_FORMAT_RGBA16F = 16,
        PIXEL_FORMAT_LUMINANCE16F = 17,
        PIXEL_FORMAT_LUMINANCE_ALPHA16F = 18,
        PIXEL_FORMAT_UNDEFINED = 19
    };

    /// An image of PIXEL_FORMAT_UNDEFINED without pixels and with an undefined capacity.
    ImageCPU();

    /// An image with storage of its own, aligned to 64 bytes. The pixels are not cleared.
    /// @param ePixelFormat any format that pixelSizeBytes() serves.
    /// @param positionExtent the meaningful pixels, in pixel space.
    /// @param pixelExtent the world size of one pixel, positive.
    /// @param capacity the storage in pixels; undefined or of width 0 it becomes the extent, else it is taken
    ///        as given, also if it is smaller than the extent: pixels beyond
    ///        the storage are then not to be touched.
    /// @throws ParameterException "Image extent and capacity must not be negative" and
    ///         "Image size exceeds 4294967295 bytes",
    ///         before anything is allocated.
    /// @throws InternalException as pixelSizeBytes() and ImageBase do. @throws std::bad_alloc.
    ImageCPU(tePixelFormat ePixelFormat, PositionExtentInPixelSpace const& positionExtent,
             PixelExtentInWorldSpace const& pixelExtent, ExtentInPixelSpace capacity);

    /// An image around pixels of the caller, which are neither copied nor freed and have to outlive the
    /// image. The memory is written only by those who write to the image. Parameters and exceptions as above.
    ImageCPU(tePixelFormat ePixelFormat, unsigned char const* pPixels,
             PositionExtentInPixelSpace const& positionExtent, PixelExtentInWorldSpace const& pixelExtent,
             ExtentInPixelSpace capacity);

    /// A deep copy of the whole storage, always owned by the copy and aligned to 16 bytes: it need not be in
    /// the SIMD-optimised format even if its source is.
    ImageCPU(ImageCPU const& other);
    /// As the copy constructor; what the image owned is freed. If it throws, the image stays as it was.
    ImageCPU& operator=(ImageCPU const& other);
    ~ImageCPU() override;

    ExtentInPixelSpace capacityExtent() const override;
    /// Sets the whole storage to zero. Without pixels it does nothing.
    void initializeToTransparentBlack() override;
    /// The lines of the base, then pixel format, capacity and whether the image is in the SIMD-optimised
    /// format.
    /// @throws InternalException for an undefined image, as isInSIMDOptimizedFormat() does.
    void doWrite(std::ostream& stream) const override;

    /// The first pixel of the storage, reinterpreted without a look at the format.
    virtual PixelBGRA8* pixels_BGRA8();
    virtual PixelBGRA8 const* pixels_BGRA8() const;
    virtual PixelBGR8* pixels_BGR8();
    virtual PixelBGR8 const* pixels_BGR8() const;
    virtual PixelRGB16F* pixels_RGB16F();
    virtual PixelRGB16F const* pixels_RGB16F() const;
    virtual PixelRGBA16F* pixels_RGBA16F();
    virtual PixelRGBA16F const* pixels_RGBA16F() const;
    virtual PixelRGB32F* pixels_RGB32F();
    virtual PixelRGB32F const* pixels_RGB32F() const;
    virtual PixelRGBA32F* pixels_RGBA32F();
    virtual PixelRGBA32F const* pixels_RGBA32F() const;
    virtual PixelRGB8* pixels_RGB8();
    virtual PixelRGB8 const* pixels_RGB8() const;
    virtual PixelRGBA8* pixels_RGBA8();
    virtual PixelRGBA8 const* pixels_RGBA8() const;
    virtual PixelLuminance8* pixels_Luminance8();
    virtual PixelLuminance8 const* pixels_Luminance8() const;
    virtual PixelLuminanceAlpha8* pixels_LuminanceAlpha8();
    virtual PixelLuminanceAlpha8 const* pixels_LuminanceAlpha8() const;
    virtual PixelLuminance16F* pixels_Luminance16F();
    virtual PixelLuminance16F const* pixels_Luminance16F() const;
    virtual PixelLuminanceAlpha16F* pixels_LuminanceAlpha16F();
    virtual PixelLuminanceAlpha16F const* pixels_LuminanceAlpha16F() const;
    virtual PixelLuminance32F* pixels_Luminance32F();
    virtual PixelLuminance32F const* pixels_Luminance32F() const;
    virtual PixelLuminanceAlpha32F* pixels_LuminanceAlpha32F();
    virtual PixelLuminanceAlpha32F const* pixels_LuminanceAlpha32F() const;
    virtual unsigned char* pixels();
    virtual unsigned char const* pixels() const;

    tePixelFormat pixelFormat() const;

    /// Whether every row is fit for aligned vector access: a format of 32-bit floats, storage on a 64-byte
    /// boundary, and rows of a multiple of 64 bytes.
    /// @throws InternalException for PIXEL_FORMAT_UNDEFINED, as channelSizeBits() does.
    bool isInSIMDOptimizedFormat() const;

    /// Writes the channel values of the whole storage, one text line a row.
    void writeImageData(std::ostream& stream) const;
    /// Writes the channel values of at most maxWidth columns and maxHeight rows of the storage, one text line
    /// a row. The stream is left in fixed notation with precision 2. Served are PIXEL_FORMAT_RGB8,
    /// PIXEL_FORMAT_RGBA8, PIXEL_FORMAT_RGB32F and PIXEL_FORMAT_RGBA32F; any other format writes "Image
    /// format not handled\n" alone.
    void writeImageData(std::ostream& stream, int maxWidth, int maxHeight) const;
    /// doWrite() followed by writeImageData().
    void writeFull(std::ostream& stream) const;

private:
    void init_stride(ExtentInPixelSpace const& capacity);

    tePixelFormat ePixelFormat_;
    unsigned char* pPixels_;
    bool bOwnsPixels_;
    ExtentInPixelSpace oCapacity_;
    std::uint64_t nSizeBytes_;
};

/// Channels of a pixel.
/// @throws InternalException
///         "Pixel format not supported by ORVO in CPU mode" for the four half-float formats, the undefined
///         format and any number that is no format.
ORVO_API std::size_t nChannels(ImageCPU::tePixelFormat ePixelFormat);

/// Bits of a channel: 8, 16 or 32.
/// @throws InternalException
///         "Not implemented: ePixelFormat in channelSizeBits()." for the undefined format and any number that
///         is no format.
ORVO_API std::size_t channelSizeBits(ImageCPU::tePixelFormat ePixelFormat);

/// Bytes of a pixel.
/// @throws InternalException "!\"PIXEL_FORMAT_UNDEFINED\"" for the undefined format,
///         "Not implemented: ePixelFormat in pixelSizeBytes()." for the two half-float luminance formats and
///         any number that is no format.
ORVO_API std::size_t pixelSizeBytes(ImageCPU::tePixelFormat ePixelFormat);

/// Whether the channels are no integers: true also for the undefined format and for numbers that are no
/// format.
ORVO_API bool isFloat(ImageCPU::tePixelFormat ePixelFormat);

/// Whether the channels are 8-bit or 16-bit integers.
ORVO_API bool isInt(ImageCPU::tePixelFormat ePixelFormat);

/// Writes the identifier of the format, or "UNKNOWN" for a number that is no format.
ORVO_API std::ostream& operator<<(std::ostream& stream, ImageCPU::tePixelFormat ePixelFormat);

} // namespace ORVO
