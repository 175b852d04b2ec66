#include "orvo/image_flow/sources/ImageCPUInput.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "orvo/image_flow/sources/ImageRegionCopy.h"

#include <climits>
#include <memory>

namespace ORVO {

ImageCPUInput::ImageCPUInput()
    : ImageFilter("ImageCPUInput", OUTPUT_PRECISION_DEFAULT),
      bReleasable_(false),
      bEmitted_(true),
      bBufferChanged_(false),
      bGeneratedFromImage_(true),
      pCopy_(nullptr),
      oOutputImage_("OutputImage", this) {
    inputTarget_ = ORVO_TARGET_CPU;
    outputTarget_ = ORVO_TARGET_CPU;
    setImageOutput(&oOutputImage_);
}

ImageCPUInput::~ImageCPUInput() = default;

void ImageCPUInput::emit() { bEmitted_ = false; }

bool ImageCPUInput::canEmit() const { return true; }

bool ImageCPUInput::hasBufferChanged() {
    bool const bChanged = bBufferChanged_;
    bBufferChanged_ = false;
    return bChanged;
}

bool ImageCPUInput::isReady() const { return Node::isReady() && !bEmitted_; }

PositionExtentInWorldSpace ImageCPUInput::generated(RegionMap const& inputDODs) {
    if (!bGeneratedFromImage_) {
        return ImageFilter::generated(inputDODs);
    }
    ImageCPU const* const pImage = getImageCPU();
    return pImage == nullptr ? PositionExtentInWorldSpace()
                             : pixelToWorldSpace(pImage->positionExtent(), pImage->pixelExtent());
}

void ImageCPUInput::setGeneratedRegion(PositionExtentInWorldSpace const& region) {
    ImageFilter::setGeneratedRegion(region);
    bGeneratedFromImage_ = false;
}

void ImageCPUInput::allocateOutputImage() {
    updateOutputRegionInPixels();
    takeBoundOutputImage();
}

void ImageCPUInput::checkReleasable() const {
    bool const bHeld = imageDataPtr_.get() != nullptr && bReleasable_;
    ORVO_CHECK(!bHeld, "ImageCPU already set on input");
}

void ImageCPUInput::setImageCPUWithRegularOwnership(ImageCPU* image) {
    checkReleasable();
    imageDataPtr_.setDataWithRegularOwnership(image);
    bReleasable_ = false;
    bBufferChanged_ = true;
}

void ImageCPUInput::setImageCPUWithNoOwnership(ImageCPU* image) {
    checkReleasable();
    imageDataPtr_.setDataWithNoOwnership(image);
    bReleasable_ = false;
    bBufferChanged_ = true;
}

void ImageCPUInput::setImageCPU(ImageCPU* image) {
    checkReleasable();
    imageDataPtr_.setDataWithReleasableOwnership(image);
    bReleasable_ = true;
    bBufferChanged_ = true;
}

ImageCPU* ImageCPUInput::releaseImageCPU() {
    ImageCPU* const pImage = imageDataPtr_.get();
    // Asked before the release, which cannot be undone.
    bool const wasReleased = pImage == nullptr || !bReleasable_ || imageDataPtr_.useCount() == 1;
    ORVO_CHECK(wasReleased);
    imageDataPtr_.release();
    return pImage;
}

ImageCPU* ImageCPUInput::getImageCPU() { return imageDataPtr_.get(); }

ImageCPU const* ImageCPUInput::getImageCPU() const { return imageDataPtr_.get(); }

ImageCPU const* ImageCPUInput::operator->() const { return imageDataPtr_.get(); }

void ImageCPUInput::clear() { imageDataPtr_.reset(); }

ImageCPU const& ImageCPUInput::image() const {
    ORVO_CHECK(imageDataPtr_.get() != nullptr, "No ImageCPU set yet.");
    return *imageDataPtr_;
}

int ImageCPUInput::width() const { return image().extent().width(); }

int ImageCPUInput::height() const { return image().extent().height(); }

int ImageCPUInput::offsetX() const { return image().position().x(); }

int ImageCPUInput::offsetY() const { return image().position().y(); }

PositionInPixelSpace ImageCPUInput::offset() const { return image().position(); }

ExtentInPixelSpace ImageCPUInput::size() const { return image().extent(); }

std::size_t ImageCPUInput::getNumChannelsOutput() { return ORVO::nChannels(image().pixelFormat()); }

void ImageCPUInput::internalProcess() {
    if (oOutputImage_.bound()) {
        prepareForRender();
        ImageRegionCopy const copy(image(), *spOutputImage_, oOutputRegionInPixels_);
        pCopy_ = &copy;
        ImageFlowController* const pController = imageFlowController();
        ORVO_ENFORCE(pController);
        pController->processSlices(this);
    } else {
        oOutputImage_ = imageDataPtr_;
    }
    bPreparedForRender_ = false;
    spOutputImage_.reset();
    bEmitted_ = true;
}

void ImageCPUInput::processSlice(std::size_t begin, std::size_t end) { pCopy_->copyRows(begin, end); }

void ImageCPUInput::wrapPixels(ImageCPU::tePixelFormat format, void const* pixels,
                               PositionExtentInPixelSpace const& region,
                               PixelExtentInWorldSpace const& pixelExtent, unsigned int rowLength) {
    int const width = region.extent().width();
    int const height = region.extent().height();
    ORVO_CHECK_PARAMETER(width >= 0 && height >= 0, "Image extent must not be negative");
    ORVO_CHECK_PARAMETER(pixels != nullptr || width == 0 || height == 0, "Image has no pixels");
    ORVO_CHECK_PARAMETER(rowLength <= INT_MAX && (rowLength == 0 || static_cast<int>(rowLength) >= width),
                         "Row length does not fit the width of the image");
    checkReleasable();
    ExtentInPixelSpace const capacity(static_cast<int>(rowLength), height);
    std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>> upImage(
        ORVO_NEW ImageCPU(format, static_cast<unsigned char const*>(pixels), region, pixelExtent, capacity));
    setImageCPUWithRegularOwnership(upImage.release());
}

void ImageCPUInput::load8BitUnsignedImageData(unsigned char const* pixels,
                                              PositionExtentInPixelSpace const& region,
                                              PixelExtentInWorldSpace const& pixelExtent,
                                              tePixelFormat layout, unsigned int rowLength) {
    ImageCPU::tePixelFormat const format = layout == PIXEL_LAYOUT_RGBA ? ImageCPU::PIXEL_FORMAT_RGBA8
                                           : layout == PIXEL_LAYOUT_LUMINANCE
                                               ? ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8
                                               : ImageCPU::PIXEL_FORMAT_BGRA8;
    wrapPixels(format, pixels, region, pixelExtent, rowLength);
}

void ImageCPUInput::load16BitUnsignedImageData(unsigned short const* pixels,
                                               PositionExtentInPixelSpace const& region,
                                               PixelExtentInWorldSpace const& pixelExtent,
                                               tePixelFormat layout, unsigned int rowLength) {
    wrapPixels(layout == PIXEL_LAYOUT_LUMINANCE ? ImageCPU::PIXEL_FORMAT_LUMINANCE16
                                                : ImageCPU::PIXEL_FORMAT_RGBA16,
               pixels, region, pixelExtent, rowLength);
}

void ImageCPUInput::load16BitFloatImageData(unsigned short const* /*pixels*/,
                                            PositionExtentInPixelSpace const& /*region*/,
                                            PixelExtentInWorldSpace const& /*pixelExtent*/,
                                            tePixelFormat /*layout*/, unsigned int /*rowLength*/) {
    ORVO_FAIL("load16BitFloatImageData not supported for the CPU input connector");
}

void ImageCPUInput::load32BitFloatImageData(float const* pixels, PositionExtentInPixelSpace const& region,
                                            PixelExtentInWorldSpace const& pixelExtent, tePixelFormat layout,
                                            unsigned int rowLength) {
    wrapPixels(layout == PIXEL_LAYOUT_LUMINANCE ? ImageCPU::PIXEL_FORMAT_LUMINANCE32F
                                                : ImageCPU::PIXEL_FORMAT_RGBA32F,
               pixels, region, pixelExtent, rowLength);
}

} // namespace ORVO
