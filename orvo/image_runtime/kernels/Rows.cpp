#include "orvo/image_runtime/kernels/Rows.h"

#include "orvo/core/Check.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/images/ImageCPUWriteAccessor.h"
#include "orvo/image_runtime/kernels/PixelRuns.h"
#include "orvo/image_runtime/kernels/RowKernelTables.h"

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <emmintrin.h>
#include <typeinfo>

namespace ORVO::ImageRuntime {

namespace {

/// Pixels that are rearranged at a time, beside the row.
constexpr std::size_t CHUNK = 128;
/// Below this many pixels a kernel of vectors does not pay.
constexpr std::size_t FEW_PIXELS = 4;

/// How a format differs from RGBA floats.
struct RowFormat {
    std::size_t nPixelChannels;
    std::size_t nChannelBytes;
    bool bBlueFirst;
};

RowFormat rowFormatOf(ImageCPU const& image) {
    switch (static_cast<int>(image.pixelFormat())) {
    case ImageCPU::PIXEL_FORMAT_BGR8:
        return {3, 1, true};
    case ImageCPU::PIXEL_FORMAT_BGRA8:
        return {4, 1, true};
    case ImageCPU::PIXEL_FORMAT_RGB8:
        return {3, 1, false};
    case ImageCPU::PIXEL_FORMAT_RGBA8:
        return {4, 1, false};
    case ImageCPU::PIXEL_FORMAT_RGB32F:
        return {3, 4, false};
    case ImageCPU::PIXEL_FORMAT_RGBA32F:
        return {4, 4, false};
    case ImageCPU::PIXEL_FORMAT_RGB16F:
        return {3, 2, false};
    case ImageCPU::PIXEL_FORMAT_RGBA16F:
        return {4, 2, false};
    default:
        ORVO_FAIL("Invalid input image type");
    }
}

std::ptrdiff_t byteOffset(ImageCPU const& image, RowFormat const& format, int x, int y) {
    std::ptrdiff_t const row = static_cast<std::ptrdiff_t>(y) - image.position().y();
    std::ptrdiff_t const column = static_cast<std::ptrdiff_t>(x) - image.position().x();
    return (row * image.capacityExtent().width() + column) *
           static_cast<std::ptrdiff_t>(format.nPixelChannels * format.nChannelBytes);
}

std::size_t pixelsOf(int beginX, int endX) {
    std::ptrdiff_t const nPixels = static_cast<std::ptrdiff_t>(endX) - beginX;
    return nPixels > 0 ? static_cast<std::size_t>(nPixels) : 0;
}

RowKernels const& kernelsFor(std::size_t nPixels) {
    return nPixels < FEW_PIXELS ? Internal::plainRowKernels() : rowKernels();
}

/// Channel values of the image to floats, in the order of the image.
void load(RowKernels const& kernels, RowFormat const& format, float* pChannels, unsigned char const* pRow,
          std::size_t n) {
    switch (format.nChannelBytes) {
    case 1:
        kernels.unitFromUInt8(pChannels, pRow, n);
        break;
    case 2:
        kernels.floatFromHalf(pChannels, reinterpret_cast<std::uint16_t const*>(pRow), n);
        break;
    default:
        std::memcpy(pChannels, pRow, n * sizeof(float));
    }
}

void store(RowKernels const& kernels, RowFormat const& format, unsigned char* pRow, float const* pChannels,
           std::size_t n) {
    switch (format.nChannelBytes) {
    case 1:
        kernels.uInt8FromUnit(pRow, pChannels, n);
        break;
    case 2:
        kernels.halfFromUnit(reinterpret_cast<std::uint16_t*>(pRow), pChannels, n);
        break;
    default:
        kernels.clampedToUnit(reinterpret_cast<float*>(pRow), pChannels, n);
    }
}

/// A pixel with red and blue exchanged, if asked for.
template <bool bSwap>
__m128 ordered(__m128 pixel) {
    if constexpr (bSwap) {
        return _mm_shuffle_ps(pixel, pixel, _MM_SHUFFLE(3, 0, 1, 2));
    } else {
        return pixel;
    }
}

/// Four floats a pixel to four; the two may be the same.
void exchangeRedAndBlue(float* pOutput, float const* pInput, std::size_t nPixels) {
    for (std::size_t i = 0; i < nPixels; ++i) {
        _mm_storeu_ps(pOutput + 4 * i, ordered<true>(_mm_loadu_ps(pInput + 4 * i)));
    }
}

/// Three floats a pixel to four, with an alpha of 1.0. Reads one float past the last pixel.
template <bool bSwap>
void expand(float* pRGBA, float const* pChannels, std::size_t nPixels) {
    __m128 const colour = _mm_castsi128_ps(_mm_setr_epi32(-1, -1, -1, 0));
    __m128 const alpha = _mm_setr_ps(0.0f, 0.0f, 0.0f, 1.0f);
    for (std::size_t i = 0; i < nPixels; ++i) {
        __m128 const pixel = ordered<bSwap>(_mm_loadu_ps(pChannels + 3 * i));
        _mm_storeu_ps(pRGBA + 4 * i, _mm_or_ps(_mm_and_ps(pixel, colour), alpha));
    }
}

/// Four floats a pixel to three. Writes one float past the last pixel.
template <bool bSwap>
void drop(float* pChannels, float const* pRGBA, std::size_t nPixels) {
    for (std::size_t i = 0; i < nPixels; ++i) {
        _mm_storeu_ps(pChannels + 3 * i, ordered<bSwap>(_mm_loadu_ps(pRGBA + 4 * i)));
    }
}

void readThreeChannels(RowKernels const& kernels, RowFormat const& format, float* pRGBA,
                       unsigned char const* pRow, std::size_t nPixels) {
    float aChannels[3 * CHUNK + 1];
    for (std::size_t i = 0; i < nPixels; i += CHUNK) {
        std::size_t const nChunk = std::min(CHUNK, nPixels - i);
        load(kernels, format, aChannels, pRow + 3 * i * format.nChannelBytes, 3 * nChunk);
        // Read with the last pixel, and masked.
        aChannels[3 * nChunk] = 0.0f;
        if (format.bBlueFirst) {
            expand<true>(pRGBA + 4 * i, aChannels, nChunk);
        } else {
            expand<false>(pRGBA + 4 * i, aChannels, nChunk);
        }
    }
}

/// The channels in the order of the image, a chunk at a time, and then into the row.
void writeRearranged(RowKernels const& kernels, RowFormat const& format, unsigned char* pRow,
                     float const* pRGBA, std::size_t nPixels) {
    float aChannels[4 * CHUNK];
    for (std::size_t i = 0; i < nPixels; i += CHUNK) {
        std::size_t const nChunk = std::min(CHUNK, nPixels - i);
        if (format.nPixelChannels == 4) {
            exchangeRedAndBlue(aChannels, pRGBA + 4 * i, nChunk);
        } else if (format.bBlueFirst) {
            drop<true>(aChannels, pRGBA + 4 * i, nChunk);
        } else {
            drop<false>(aChannels, pRGBA + 4 * i, nChunk);
        }
        store(kernels, format, pRow + format.nPixelChannels * i * format.nChannelBytes, aChannels,
              format.nPixelChannels * nChunk);
    }
}

} // namespace

namespace Internal {

void readPixelRun(ImageCPU const& image, int x, int y, std::size_t nPixels, float* pRGBA) {
    RowFormat const format = rowFormatOf(image);
    if (!nPixels) {
        return;
    }
    RowKernels const& kernels = kernelsFor(nPixels);
    unsigned char const* const pRow = image.pixels() + byteOffset(image, format, x, y);
    if (format.nPixelChannels == 3) {
        readThreeChannels(kernels, format, pRGBA, pRow, nPixels);
        return;
    }
    load(kernels, format, pRGBA, pRow, 4 * nPixels);
    if (format.bBlueFirst) {
        exchangeRedAndBlue(pRGBA, pRGBA, nPixels);
    }
}

void writePixelRun(ImageCPU& image, int x, int y, std::size_t nPixels, float const* pRGBA) {
    RowFormat const format = rowFormatOf(image);
    if (!nPixels) {
        return;
    }
    RowKernels const& kernels = kernelsFor(nPixels);
    unsigned char* const pRow = image.pixels() + byteOffset(image, format, x, y);
    if (format.nPixelChannels == 4 && !format.bBlueFirst) {
        store(kernels, format, pRow, pRGBA, 4 * nPixels);
    } else {
        writeRearranged(kernels, format, pRow, pRGBA, nPixels);
    }
}

} // namespace Internal

void readRowAsRGBAFloat(ImageCPU const& image, int y, int beginX, int endX, float* pRGBA) {
    Internal::readPixelRun(image, beginX, y, pixelsOf(beginX, endX), pRGBA);
}

void writeRowFromRGBAFloat(ImageCPU& image, int y, int beginX, int endX, float const* pRGBA) {
    Internal::writePixelRun(image, beginX, y, pixelsOf(beginX, endX), pRGBA);
}

void readRowAsRGBAFloat(ImageReadAccessor const& accessor, int y, int beginX, int endX, float* pRGBA) {
    if (ImageCPU const* pImage = imageBehind(accessor)) {
        readRowAsRGBAFloat(*pImage, y, beginX, endX, pRGBA);
        return;
    }
    for (int x = beginX; x < endX; ++x) {
        float4 pixel = accessor.getRGBAFloat4PixelAt(x, y);
        for (int channel = 0; channel < 4; ++channel) {
            *pRGBA++ = pixel[channel];
        }
    }
}

void writeRowFromRGBAFloat(ImageWriteAccessor& accessor, int y, int beginX, int endX, float const* pRGBA) {
    if (ImageCPU* pImage = imageBehind(accessor)) {
        writeRowFromRGBAFloat(*pImage, y, beginX, endX, pRGBA);
        return;
    }
    for (int x = beginX; x < endX; ++x) {
        accessor.writeRGBAFloatPixel4At(float4(pRGBA[0], pRGBA[1], pRGBA[2], pRGBA[3]), x, y);
        pRGBA += 4;
    }
}

// A class derived from one of the library's accessors may answer otherwise: only the very classes are
// recognised.

ImageCPU const* imageBehind(ImageReadAccessor const& accessor) {
    return typeid(accessor) == typeid(ImageCPUReadAccessor)
               ? &dynamic_cast<ImageCPUReadAccessor const&>(accessor).image()
               : nullptr;
}

ImageCPU* imageBehind(ImageWriteAccessor& accessor) {
    return typeid(accessor) == typeid(ImageCPUWriteAccessor)
               ? &dynamic_cast<ImageCPUWriteAccessor&>(accessor).image()
               : nullptr;
}

} // namespace ORVO::ImageRuntime
