#include "orvo/image_flow/sources/ImageGPUInput.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/image_flow/sources/TextureRegionCopy.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/internal/GL.h"

#include <climits>
#include <memory>

namespace ORVO {

namespace {

void requireHalfFloats() {
    auto const* const pManager = OGL::ExtensionManager::Instance();
    bool const bFloatTextures = pManager->isSupported(OGL::EXTENSION_APPLE_FLOAT_PIXELS) ||
                                pManager->isSupported(OGL::EXTENSION_ARB_TEXTURE_FLOAT);
    ORVO_CHECK(pManager->isSupported(OGL::EXTENSION_ARB_HALF_FLOAT_PIXEL) && bFloatTextures,
               "load16BitFloatImageData not supported for this graphic card");
}

} // namespace

/// What a loader was given, and what it makes of it.
struct ImageGPUInput::RawPixels {
    void const* pPixels_;
    PositionExtentInPixelSpace oRegion_;
    PixelExtentInWorldSpace oPixelExtent_;
    tePixelFormat eLayout_;
    unsigned nRowLength_;
    /// The type of a channel, as OpenGL's token.
    unsigned nType_;
    ImageGPU::tePixelFormat eFallback_;
};

ImageGPUInput::ImageGPUInput()
    : ImageFilter("ImageGPUInput", OUTPUT_PRECISION_DEFAULT),
      bReleasable_(false),
      bEmitted_(true),
      bBufferChanged_(false),
      bGeneratedFromImage_(true),
      oOutputImage_("OutputImage", this) {
    inputTarget_ = ORVO_TARGET_GL;
    outputTarget_ = ORVO_TARGET_GL;
    setImageOutput(&oOutputImage_);
}

ImageGPUInput::~ImageGPUInput() = default;

void ImageGPUInput::emit() { bEmitted_ = false; }

bool ImageGPUInput::canEmit() const { return true; }

bool ImageGPUInput::hasBufferChanged() {
    bool const bChanged = bBufferChanged_;
    bBufferChanged_ = false;
    return bChanged;
}

bool ImageGPUInput::isReady() const { return Node::isReady() && !bEmitted_; }

PositionExtentInWorldSpace ImageGPUInput::generated(RegionMap const& inputDODs) {
    if (!bGeneratedFromImage_) {
        return ImageFilter::generated(inputDODs);
    }
    ImageGPU const* const pImage = getImageGPU();
    return pImage == nullptr ? PositionExtentInWorldSpace()
                             : pixelToWorldSpace(pImage->positionExtent(), pImage->pixelExtent());
}

void ImageGPUInput::setGeneratedRegion(PositionExtentInWorldSpace const& region) {
    ImageFilter::setGeneratedRegion(region);
    bGeneratedFromImage_ = false;
}

void ImageGPUInput::checkReleasable() const {
    bool const bHeld = imageDataPtr_.get() != nullptr && bReleasable_;
    ORVO_CHECK(!bHeld, "ImageGPU already set on input");
}

void ImageGPUInput::setImageGPU(ImageGPU* image) {
    checkReleasable();
    imageDataPtr_.setDataWithReleasableOwnership(image);
    bReleasable_ = true;
    bBufferChanged_ = true;
}

void ImageGPUInput::setImageGPUWithNoOwnership(ImageGPU* image) {
    checkReleasable();
    imageDataPtr_.setDataWithNoOwnership(image);
    bReleasable_ = false;
    bBufferChanged_ = true;
}

ImageGPU const* ImageGPUInput::getImageGPU() const { return imageDataPtr_.get(); }

ImageGPU* ImageGPUInput::releaseImageGPU() {
    ImageGPU* const pImage = imageDataPtr_.get();
    // Asked before the release, which cannot be undone.
    bool const wasReleased = pImage == nullptr || !bReleasable_ || imageDataPtr_.useCount() == 1;
    ORVO_CHECK(wasReleased);
    imageDataPtr_.release();
    return pImage;
}

void ImageGPUInput::clear() { imageDataPtr_.reset(); }

ImageGPU const& ImageGPUInput::image() const {
    ORVO_CHECK(imageDataPtr_.get() != nullptr, "No ImageGPU set yet.");
    return *imageDataPtr_;
}

int ImageGPUInput::width() const { return image().extent().width(); }

int ImageGPUInput::height() const { return image().extent().height(); }

int ImageGPUInput::offsetX() const { return image().position().x(); }

int ImageGPUInput::offsetY() const { return image().position().y(); }

PositionInPixelSpace ImageGPUInput::offset() const { return image().position(); }

ExtentInPixelSpace ImageGPUInput::size() const { return image().extent(); }

std::size_t ImageGPUInput::getNumChannelsOutput() {
    ImageGPU const* const pImage = getImageGPU();
    if (pImage == nullptr) {
        return ImageFilter::getNumChannelsOutput();
    }
    switch (pImage->pixelFormat()) {
    case ImageGPU::PIXEL_FORMAT_RGBA8:
    case ImageGPU::PIXEL_FORMAT_RGBA16F:
    case ImageGPU::PIXEL_FORMAT_RGBA32F:
    case ImageGPU::PIXEL_FORMAT_RGB8:
    case ImageGPU::PIXEL_FORMAT_RGB16F:
    case ImageGPU::PIXEL_FORMAT_RGB32F:
    case ImageGPU::PIXEL_FORMAT_LUMINANCE8:
    case ImageGPU::PIXEL_FORMAT_LUMINANCE16:
    case ImageGPU::PIXEL_FORMAT_LUMINANCE32F:
    case ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA8:
    case ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F:
    case ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F:
        return ORVO::nChannels(pImage->pixelFormat());
    case ImageGPU::PIXEL_FORMAT_RGBA16:
    case ImageGPU::PIXEL_FORMAT_RGB16:
    case ImageGPU::PIXEL_FORMAT_LUMINANCE16F:
    case ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA16:
    case ImageGPU::PIXEL_FORMAT_UNDEFINED:
        break;
    }
    return ImageFilter::getNumChannelsOutput();
}

void ImageGPUInput::internalProcess() {
    ORVO_CHECK(imageDataPtr_.get() != nullptr, "imageDataPtr_.hasData()");
    if (oOutputImage_.bound()) {
        copyIntoBoundImage();
    } else {
        oOutputImage_ = imageDataPtr_;
    }
    bPreparedForRender_ = false;
    bEmitted_ = true;
}

void ImageGPUInput::copyIntoBoundImage() {
    allocateOutputImage();
    copyTextureRegion(*imageDataPtr_, *boundOutputImageGPU(), oOutputRegionInPixels_);
}

unsigned ImageGPUInput::ConvertToPixelFormatGL(tePixelFormat layout) {
    switch (layout) {
    case PIXEL_LAYOUT_BGRA:
        return GL_BGRA;
    case PIXEL_LAYOUT_RGBA:
        return GL_RGBA;
    case PIXEL_LAYOUT_RGB:
        return GL_RGB;
    case PIXEL_LAYOUT_LUMINANCE:
        return GL_LUMINANCE;
    }
    ORVO_FAIL_PARAMETER("Invalid pixel format.");
}

ImageGPU::tePixelFormat ImageGPUInput::recommendedImageGPUPixelFormat(ImageGPU::tePixelFormat fallback) {
    teOutputPrecisionHint const hint = outputPrecisionHintParameter().value();
    if (hint == OUTPUT_PRECISION_DEFAULT) {
        return fallback;
    }
    ORVO_CHECK_PARAMETER(hint == OUTPUT_PRECISION_8_BIT_INT || hint == OUTPUT_PRECISION_16_BIT_FLOAT,
                         "Invalid output precision hint.");
    return hint == OUTPUT_PRECISION_8_BIT_INT ? ImageGPU::PIXEL_FORMAT_RGBA8 : ImageGPU::PIXEL_FORMAT_RGBA16F;
}

void ImageGPUInput::load(RawPixels const& raw, bool bAsync) {
    int const width = raw.oRegion_.extent().width();
    int const height = raw.oRegion_.extent().height();
    bool const bPixels = width != 0 && height != 0;
    ORVO_CHECK_PARAMETER(width >= 0 && height >= 0, "Image extent must not be negative");
    ORVO_CHECK_PARAMETER(raw.pPixels_ != nullptr || !bPixels, "Image has no pixels");
    ORVO_CHECK_PARAMETER(raw.nRowLength_ <= INT_MAX &&
                             (raw.nRowLength_ == 0 || static_cast<int>(raw.nRowLength_) >= width),
                         "Row length does not fit the width of the image");
    unsigned const nFormat = ConvertToPixelFormatGL(raw.eLayout_);
    ImageGPU::tePixelFormat const format = recommendedImageGPUPixelFormat(raw.eFallback_);
    checkReleasable();
    std::unique_ptr<ImageGPU, ORVODeleter<ImageGPU>> upImage(
        ORVO_NEW ImageGPU(raw.oRegion_, format, raw.oPixelExtent_, true));
    if (bPixels && bAsync) {
        oUpload_.asyncUpload(upImage->texture(), 0, PositionExtentInPixelSpace(raw.oRegion_.extent()),
                             OGL::Texture::GL2Format(nFormat), OGL::Texture::GL2Type(raw.nType_),
                             raw.pPixels_, raw.nRowLength_);
    } else if (bPixels) {
        upImage->copyImageData(static_cast<unsigned char const*>(raw.pPixels_), raw.oRegion_,
                               raw.oPixelExtent_, nFormat, raw.nType_, raw.nRowLength_);
    }
    setImageGPU(upImage.release());
}

void ImageGPUInput::load8BitUnsignedImageData(unsigned char const* pixels,
                                              PositionExtentInPixelSpace const& region,
                                              PixelExtentInWorldSpace const& pixelExtent,
                                              tePixelFormat layout, unsigned int rowLength) {
    load({pixels, region, pixelExtent, layout, rowLength, GL_UNSIGNED_BYTE, ImageGPU::PIXEL_FORMAT_RGBA8},
         true);
}

void ImageGPUInput::load16BitUnsignedImageData(unsigned short const* pixels,
                                               PositionExtentInPixelSpace const& region,
                                               PixelExtentInWorldSpace const& pixelExtent,
                                               tePixelFormat layout, unsigned int rowLength) {
    load({pixels, region, pixelExtent, layout, rowLength, GL_UNSIGNED_SHORT, ImageGPU::PIXEL_FORMAT_RGBA16F},
         true);
}

void ImageGPUInput::load16BitFloatImageData(unsigned short const* pixels,
                                            PositionExtentInPixelSpace const& region,
                                            PixelExtentInWorldSpace const& pixelExtent, tePixelFormat layout,
                                            unsigned int rowLength) {
    requireHalfFloats();
    load({pixels, region, pixelExtent, layout, rowLength, GL_HALF_FLOAT, ImageGPU::PIXEL_FORMAT_RGBA16F},
         true);
}

void ImageGPUInput::load32BitFloatImageData(float const* pixels, PositionExtentInPixelSpace const& region,
                                            PixelExtentInWorldSpace const& pixelExtent, tePixelFormat layout,
                                            unsigned int rowLength) {
    load({pixels, region, pixelExtent, layout, rowLength, GL_FLOAT, ImageGPU::PIXEL_FORMAT_RGBA32F}, true);
}

void ImageGPUInput::load8BitUnsignedImageData_DEPRECATED_2_0(unsigned char const* pixels,
                                                             PositionExtentInPixelSpace const& region,
                                                             PixelExtentInWorldSpace const& pixelExtent,
                                                             tePixelFormat layout, unsigned int rowLength) {
    load({pixels, region, pixelExtent, layout, rowLength, GL_UNSIGNED_BYTE, ImageGPU::PIXEL_FORMAT_RGBA8},
         false);
}

void ImageGPUInput::load16BitUnsignedImageData_DEPRECATED_2_0(unsigned short const* pixels,
                                                              PositionExtentInPixelSpace const& region,
                                                              PixelExtentInWorldSpace const& pixelExtent,
                                                              tePixelFormat layout, unsigned int rowLength) {
    load({pixels, region, pixelExtent, layout, rowLength, GL_UNSIGNED_SHORT, ImageGPU::PIXEL_FORMAT_RGBA16F},
         false);
}

void ImageGPUInput::load16BitFloatImageData_DEPRECATED_2_0(unsigned short const* pixels,
                                                           PositionExtentInPixelSpace const& region,
                                                           PixelExtentInWorldSpace const& pixelExtent,
                                                           tePixelFormat layout, unsigned int rowLength) {
    requireHalfFloats();
    load({pixels, region, pixelExtent, layout, rowLength, GL_HALF_FLOAT, ImageGPU::PIXEL_FORMAT_RGBA16F},
         false);
}

void ImageGPUInput::load32BitFloatImageData_DEPRECATED_2_0(float const* pixels,
                                                           PositionExtentInPixelSpace const& region,
                                                           PixelExtentInWorldSpace const& pixelExtent,
                                                           tePixelFormat layout, unsigned int rowLength) {
    load({pixels, region, pixelExtent, layout, rowLength, GL_FLOAT, ImageGPU::PIXEL_FORMAT_RGBA32F}, false);
}

} // namespace ORVO
