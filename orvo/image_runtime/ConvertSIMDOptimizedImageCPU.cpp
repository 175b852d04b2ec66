#include "orvo/image_runtime/ConvertSIMDOptimizedImageCPU.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/Integers.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/image_runtime/BlankSIMDOptimizedImageCPU.h"
#include "orvo/image_runtime/kernels/RowKernels.h"

#include <cstdint>
#include <limits>
#include <memory>

namespace ORVO::ImageRuntime {

namespace {

using OwnedImage = std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>>;

/// A rectangle in pixel-space coordinates, `end` exclusive.
struct Range {
    int beginX, endX, beginY, endY;
};

/// The ends of an image in 64 bits: a position near the end of the integers must not wrap to a small one.
std::int64_t endX(ImageCPU const& image) {
    return static_cast<std::int64_t>(image.position().x()) + image.extent().width();
}

std::int64_t endY(ImageCPU const& image) {
    return static_cast<std::int64_t>(image.position().y()) + image.extent().height();
}

Range wholeRangeOf(ImageCPU const& image) {
    constexpr int LAST = std::numeric_limits<int>::max();
    ORVO_CHECK_PARAMETER(endX(image) <= LAST && endY(image) <= LAST,
                         "Image lies beyond the range of pixel coordinates");
    return {image.position().x(), static_cast<int>(endX(image)), image.position().y(),
            static_cast<int>(endY(image))};
}

void enforceRangeInImages(Range const& range, ImageCPU const& input, ImageCPU const& output) {
    ORVO_CHECK(range.beginX >= input.position().x(), "beginX >= inputImage.position().x()");
    ORVO_CHECK(range.endX <= endX(input),
               "endX <= int( inputImage.position().x() + inputImage.extent().width() )");
    ORVO_CHECK(range.beginX >= output.position().x(), "beginX >= pOutputImage->position().x()");
    ORVO_CHECK(range.endX <= endX(output),
               "endX <= int( pOutputImage->position().x() + pOutputImage->extent().width() )");
    ORVO_CHECK(range.beginY >= input.position().y(), "beginY >= inputImage.position().y()");
    ORVO_CHECK(range.endY <= endY(input),
               "endY <= int( inputImage.position().y() + inputImage.extent().height() )");
    ORVO_CHECK(range.beginY >= output.position().y(), "beginY >= pOutputImage->position().y()");
    ORVO_CHECK(range.endY <= endY(output),
               "endY <= int( pOutputImage->position().y() + pOutputImage->extent().height() )");
}

void enforceFloats(ImageCPU const& image, char const* sText) {
    ORVO_CHECK(isFloat(image.pixelFormat()) && channelSizeBits(image.pixelFormat()) == 32, sText);
}

void enforceSameChannels(ImageCPU const& input, ImageCPU const& output) {
    ORVO_CHECK(nChannels(input.pixelFormat()) == nChannels(output.pixelFormat()),
               "nChannels( inputImage.pixelFormat() ) == nChannels( pOutputImage->pixelFormat() )");
}

std::uint64_t storageBytes(ImageCPU const& image) {
    ExtentInPixelSpace const capacity = image.capacityExtent();
    return static_cast<std::uint64_t>(capacity.width()) * static_cast<std::uint64_t>(capacity.height()) *
           pixelSizeBytes(image.pixelFormat());
}

/// Channel values from the start of the storage to the pixel at the given pixel-space coordinates.
std::ptrdiff_t elementOffset(ImageCPU const& image, int x, int y, std::size_t nPixelChannels) {
    std::ptrdiff_t const row = static_cast<std::ptrdiff_t>(y) - image.position().y();
    std::ptrdiff_t const column = static_cast<std::ptrdiff_t>(x) - image.position().x();
    return (row * image.capacityExtent().width() + column) * static_cast<std::ptrdiff_t>(nPixelChannels);
}

/// A capacity is taken as given when an image is made: here it has to hold the pixels that are touched.
void enforceStorage(ImageCPU const& image, Range const& range, char const* sText) {
    std::int64_t const nColumns = static_cast<std::int64_t>(range.endX) - image.position().x();
    std::int64_t const nRows = static_cast<std::int64_t>(range.endY) - image.position().y();
    ExtentInPixelSpace const capacity = image.capacityExtent();
    ORVO_CHECK(image.pixels() && nColumns <= capacity.width() && nRows <= capacity.height(), sText);
}

/// Runs a kernel over each row of the range.
template <class OutputChannel, class InputChannel>
void convertRows(ImageCPU const& input, ImageCPU& output, Range const& range,
                 void (*kernel)(OutputChannel*, InputChannel const*, std::size_t, StoreMode)) {
    if (range.endX <= range.beginX || range.endY <= range.beginY) {
        return;
    }
    enforceStorage(input, range, "The rectangle lies inside the storage of inputImage");
    enforceStorage(output, range, "The rectangle lies inside the storage of pOutputImage");
    StoreMode const eStoreMode = storeModeForOutput(storageBytes(output));
    std::size_t const nPixelChannels = nChannels(input.pixelFormat());
    std::size_t const nElements =
        static_cast<std::size_t>(static_cast<std::int64_t>(range.endX) - range.beginX) * nPixelChannels;
    InputChannel const* const pInput = reinterpret_cast<InputChannel const*>(input.pixels());
    OutputChannel* const pOutput = reinterpret_cast<OutputChannel*>(output.pixels());
    for (int y = range.beginY; y < range.endY; ++y) {
        kernel(pOutput + elementOffset(output, range.beginX, y, nPixelChannels),
               pInput + elementOffset(input, range.beginX, y, nPixelChannels), nElements, eStoreMode);
    }
}

void convertToFloats(ImageCPU const& input, ImageCPU& output, Range const& range) {
    std::size_t const nInputBits = channelSizeBits(input.pixelFormat());
    enforceFloats(output, "channelSizeBits( pOutputImage->pixelFormat() ) == 32");
    enforceSameChannels(input, output);
    RowKernels const& kernels = rowKernels();
    switch (nInputBits) {
    case 8:
        return convertRows(input, output, range, kernels.floatFromUInt8);
    case 16:
        return convertRows(input, output, range, kernels.floatFromUInt16);
    case 32:
        return convertRows(input, output, range, kernels.copyFloat);
    default:
        ORVO_FAIL("false");
    }
}

void convertFromFloats(ImageCPU const& input, ImageCPU& output, Range const& range) {
    std::size_t const nOutputBits = channelSizeBits(output.pixelFormat());
    enforceFloats(input, "channelSizeBits( inputImage.pixelFormat() ) == 32");
    enforceSameChannels(input, output);
    RowKernels const& kernels = rowKernels();
    switch (nOutputBits) {
    case 8:
        return convertRows(input, output, range, kernels.uInt8FromFloat);
    case 16:
        return convertRows(input, output, range, kernels.uInt16FromFloat);
    case 32:
        return convertRows(input, output, range, kernels.copyFloat);
    default:
        ORVO_FAIL("false");
    }
}

} // namespace

ImageCPU* convertImageToSIMDOptimized32FFormat(ImageCPU const& inputImage) {
    OwnedImage pOutputImage(getBlankSIMDOptimized32FFormat(inputImage));
    convertImageToSIMDOptimized32FFormat(inputImage, pOutputImage.get());
    return pOutputImage.release();
}

void convertImageToSIMDOptimized32FFormat(ImageCPU const& inputImage, ImageCPU* pOutputImage) {
    ORVO_ENFORCE(pOutputImage);
    Range const range = wholeRangeOf(*pOutputImage);
    convertImageToSIMDOptimized32FFormat(inputImage, pOutputImage, range.beginX, range.endX, range.beginY,
                                         range.endY);
}

void convertImageToSIMDOptimized32FFormat(ImageCPU const& inputImage, ImageCPU* pOutputImage, int beginX,
                                          int endX, int beginY, int endY) {
    ORVO_ENFORCE(pOutputImage);
    Range const range{beginX, endX, beginY, endY};
    enforceRangeInImages(range, inputImage, *pOutputImage);
    ORVO_CHECK(pOutputImage->capacityExtent().width() >=
                   incrementToBoundary(pOutputImage->extent().width(), 4),
               "int( pOutputImage->capacityExtent().width() ) >= incrementToBoundary( int( "
               "pOutputImage->extent().width() ), 4 )");
    ORVO_CHECK(isAligned(pOutputImage->pixels(), 16), "isAligned( pOutputImage->pixels(), 16 )");
    convertToFloats(inputImage, *pOutputImage, range);
}

ImageCPU* convertImageFromSIMDOptimized32FFormat(ImageCPU const& inputImage,
                                                 ImageCPU::tePixelFormat ePixelFormat) {
    OwnedImage pOutputImage(ORVO_NEW ImageCPU(ePixelFormat, inputImage.positionExtent(),
                                              inputImage.pixelExtent(), inputImage.capacityExtent()));
    convertImageFromSIMDOptimized32FFormat(inputImage, pOutputImage.get());
    return pOutputImage.release();
}

void convertImageFromSIMDOptimized32FFormat(ImageCPU const& inputImage, ImageCPU* pOutputImage) {
    ORVO_ENFORCE(pOutputImage);
    Range const range = wholeRangeOf(*pOutputImage);
    convertImageFromSIMDOptimized32FFormat(inputImage, pOutputImage, range.beginX, range.endX, range.beginY,
                                           range.endY);
}

void convertImageFromSIMDOptimized32FFormat(ImageCPU const& inputImage, ImageCPU* pOutputImage, int beginX,
                                            int endX, int beginY, int endY) {
    ORVO_ENFORCE(pOutputImage);
    Range const range{beginX, endX, beginY, endY};
    enforceRangeInImages(range, inputImage, *pOutputImage);
    convertFromFloats(inputImage, *pOutputImage, range);
}

} // namespace ORVO::ImageRuntime
