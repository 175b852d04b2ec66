#include "orvo/image_flow/filters/SimpleFilterGPU.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "orvo/ogl/ExceptionOGL.h"
#include "orvo/ogl/Framebuffer.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/TextureState.h"
#include "orvo/ogl/TokenName.h"
#include "orvo/ogl/internal/GL.h"

#include <cstring>
#include <string>
#include <typeinfo>

namespace ORVO {

namespace {

bool hasPixels(ExtentInPixelSpace const& extent) {
    return extent.isDefined() && extent.width() > 0 && extent.height() > 0;
}

/// Texture coordinates of one direction, where the base begins at nBase and is nSize pixels long.
struct CoordinateSpan {
    float begin_;
    float end_;
};

CoordinateSpan spanOf(int nPosition, int nExtent, int nBase, int nSize) {
    double const dOffset = double(nPosition) - double(nBase);
    return {static_cast<float>(dOffset / nSize), static_cast<float>((dOffset + nExtent) / nSize)};
}

} // namespace

SimpleFilterGPU::SimpleFilterGPU(char const* name)
    : ImageFilter(name, OUTPUT_PRECISION_DEFAULT),
      oInput_("InputImage", this),
      oOutput_("OutputImage", this),
      pFramebuffer_(nullptr),
      pOutputImage_(nullptr),
      o_Rectangle(PositionInWorldSpace(), ExtentInWorldSpace(0.0f, 0.0f)) {
    inputTarget_ = ORVO_TARGET_GL;
    outputTarget_ = ORVO_TARGET_GL;
    o_Rectangle.createTextureCoordinates();
    addImageInput(&oInput_);
    setImageOutput(&oOutput_);
}

SimpleFilterGPU::SimpleFilterGPU(char const* name, bool /*bAddsOwnInputs*/)
    : ImageFilter(name, OUTPUT_PRECISION_DEFAULT),
      oInput_("zInputName", this),
      oOutput_("OutputImage", this),
      pFramebuffer_(nullptr),
      pOutputImage_(nullptr),
      o_Rectangle(PositionInWorldSpace(), ExtentInWorldSpace(0.0f, 0.0f)) {
    inputTarget_ = ORVO_TARGET_GL;
    outputTarget_ = ORVO_TARGET_GL;
    o_Rectangle.createTextureCoordinates();
    setImageOutput(&oOutput_);
}

SimpleFilterGPU::~SimpleFilterGPU() = default;

void SimpleFilterGPU::flush() {
    dropUnfinishedPass();
    ImageFilter::flush();
}

void SimpleFilterGPU::internalProcess() {
    preRender();
    renderAndTearDown();
}

ImageGPU const* SimpleFilterGPU::inputImageGPU(std::size_t iImageInput) const {
    if (iImageInput >= numberOfImageInputs()) {
        return nullptr;
    }
    DataFlow::InputConnector const* const pInput = imageInput(iImageInput);
    bool const bGPU = std::strcmp(pInput->datatype().name(), typeid(ImageGPU).name()) == 0;
    return bGPU ? static_cast<ImageGPU const*>(pInput->data()) : nullptr;
}

PositionExtentInPixelSpace SimpleFilterGPU::outputRectangle(PixelExtentInWorldSpace const& pixelExtent) {
    PositionExtentInWorldSpace const& outRect = computeRegionParameter().value();
    ORVO_CHECK(!outRect.isInfinite());
    PositionExtentInPixelSpace const rectangle = worldToPixelSpace(outRect, pixelExtent);
    return rectangle.extent().isDefined()
               ? rectangle
               : PositionExtentInPixelSpace(rectangle.position(), ExtentInPixelSpace(0, 0));
}

bool SimpleFilterGPU::takeBoundImage() {
    if (!pImageOutput_->bound()) {
        return false;
    }
    PositionExtentInPixelSpace const rectangle = outputRectangle(outputPixelExtent());
    updateOutputRegionInPixels();
    pOutputImage_ = boundOutputImageGPU();
    oDrawnRegion_ = rectangle;
    return true;
}

void SimpleFilterGPU::setNewOutputImage(PositionExtentInPixelSpace const& rectangle,
                                        ImageGPU::tePixelFormat ePixelFormat,
                                        PixelExtentInWorldSpace const& pixelExtent, bool exact) {
    spNewImage_.setDataWithReleasableOwnership(
        ORVO_NEW ImageGPU(rectangle, ePixelFormat, pixelExtent, exact));
    pOutputImage_ = spNewImage_.get();
    oDrawnRegion_ = rectangle;
    oOutputRegionInPixels_ = rectangle;
}

bool SimpleFilterGPU::hasPixelsToDraw() const { return hasPixels(oDrawnRegion_.extent()); }

ImageGPU::tePixelFormat SimpleFilterGPU::outputFormat() {
    ImageGPU const* const pInputImage = inputImageGPU(0);
    ImageGPU::tePixelFormat const eInput =
        pInputImage != nullptr ? pInputImage->pixelFormat() : ImageGPU::PIXEL_FORMAT_RGBA8;
    switch (outputPrecisionHint()) {
    case OUTPUT_PRECISION_8_BIT_INT:
        return ImageGPU::PIXEL_FORMAT_RGBA8;
    case OUTPUT_PRECISION_16_BIT_INT:
        return ImageGPU::PIXEL_FORMAT_RGBA16;
    case OUTPUT_PRECISION_16_BIT_FLOAT:
        return ImageGPU::PIXEL_FORMAT_RGBA16F;
    case OUTPUT_PRECISION_DEFAULT:
        return eInput != ImageGPU::PIXEL_FORMAT_UNDEFINED ? eInput : ImageGPU::PIXEL_FORMAT_RGBA8;
    case OUTPUT_PRECISION_32_BIT_FLOAT:
    case OUTPUT_PRECISION_UNDEFINED:
        break;
    }
    ORVO_FAIL("Not implemented: Unknown outputPrecisionHint");
}

void SimpleFilterGPU::preRender() {
    dropUnfinishedPass();
    bPreparedForRender_ = false;
    try {
        if (!takeBoundImage()) {
            ImageGPU const* const pInputImage = inputImageGPU(0);
            PixelExtentInWorldSpace const pixelExtent =
                pInputImage != nullptr ? pInputImage->pixelExtent() : PixelExtentInWorldSpace(1.0f, 1.0f);
            PositionExtentInPixelSpace const rectangle = outputRectangle(pixelExtent);
            setNewOutputImage(rectangle, outputFormat(), pixelExtent, false);
        }
        if (!hasPixelsToDraw()) {
            return;
        }
        attachOutput();
        clearBeyondNewImage();
        ExtentInPixelSpace const capacity = pOutputImage_->capacityExtent();
        glMatrixMode(GL_PROJECTION);
        glLoadIdentity();
        glOrtho(0.0, capacity.width(), 0.0, capacity.height(), -1.0, 1.0);
        glMatrixMode(GL_MODELVIEW);
        glLoadIdentity();
        glViewport(0, 0, capacity.width(), capacity.height());
        setUpQuad();
    } catch (...) {
        abandonPass();
        throw;
    }
}

void SimpleFilterGPU::setUpQuad() {
    PositionInPixelSpace const& position = oDrawnRegion_.position();
    ExtentInPixelSpace const& extent = oDrawnRegion_.extent();
    o_Rectangle.set(
        PositionInWorldSpace(static_cast<float>(position.x() - pOutputImage_->position().x()),
                             static_cast<float>(position.y() - pOutputImage_->position().y())),
        ExtentInWorldSpace(static_cast<float>(extent.width()), static_cast<float>(extent.height())));

    ImageGPU const* const pInputImage = inputImageGPU(0);
    bool const bHasInput = pInputImage != nullptr && hasPixels(pInputImage->extent());
    ExtentInPixelSpace const baseSize =
        bHasInput ? pInputImage->capacityExtent() : pOutputImage_->capacityExtent();
    PositionInPixelSpace const basePosition =
        bHasInput ? pInputImage->position() : PositionInPixelSpace(0, 0);
    CoordinateSpan const s = spanOf(position.x(), extent.width(), basePosition.x(), baseSize.width());
    CoordinateSpan const t = spanOf(position.y(), extent.height(), basePosition.y(), baseSize.height());

    ImageQuad::coordinate_iterator iTextureCoordinate = o_Rectangle.textureCoordinatesBegin();
    *iTextureCoordinate++ = float2(s.begin_, t.begin_);
    *iTextureCoordinate++ = float2(s.end_, t.begin_);
    *iTextureCoordinate++ = float2(s.end_, t.end_);
    *iTextureCoordinate++ = float2(s.begin_, t.end_);
    ORVO_CHECK(iTextureCoordinate == o_Rectangle.textureCoordinatesEnd());
}

void SimpleFilterGPU::renderAndTearDown() {
    ORVO_ENFORCE(pOutputImage_);
    try {
        if (hasPixelsToDraw()) {
            requireCompleteFramebuffer();
            o_Rectangle.render();
            detachOutput();
        }
        handOnOutput();
        OGL::TextureState::setActiveTextureUnit(0);
        unbindInputs();
    } catch (...) {
        abandonPass();
        throw;
    }
}

void SimpleFilterGPU::attachOutput() {
    ImageFlowController* const pController = imageFlowController();
    ORVO_ENFORCE(pController);
    pFramebuffer_ = pController->framebuffer();
    ORVO_ENFORCE(pFramebuffer_);
    pFramebuffer_->bind();
    pFramebuffer_->attach(pOutputImage_->texture(), 0, 0);
}

void SimpleFilterGPU::clearBeyondNewImage() {
    // Of a bound image the pixels outside the compute region are its owner's.
    if (spNewImage_.get() != nullptr) {
        pOutputImage_->initializeToTransparentBlack();
    }
}

void SimpleFilterGPU::requireCompleteFramebuffer() const {
    unsigned status = 0;
    if (pFramebuffer_->statusOkay(&status)) {
        return;
    }
    std::string sMessage;
    if (status == GL_FRAMEBUFFER_UNSUPPORTED) {
        OGL::Texture2D const& texture = *pOutputImage_->texture();
        sMessage = std::string("Unsupported format (") + OGL::TokenName(texture.target()) + "," +
                   OGL::TokenName(OGL::Texture::InternalFormat2GL(texture.format())) +
                   ") for framebuffer object rendering.";
    } else {
        sMessage = std::string("Framebuffer attachment error: ") + OGL::TokenName(status);
    }
    throw OGL::ExceptionOGL(__FILE__, __LINE__, sMessage.c_str(), status);
}

void SimpleFilterGPU::detachOutput() {
    pFramebuffer_->detach(pOutputImage_->texture(), 0);
    pFramebuffer_->unbind();
    pFramebuffer_ = nullptr;
}

void SimpleFilterGPU::handOnOutput() {
    if (!pImageOutput_->bound()) {
        oOutput_.setData(spNewImage_);
    }
    spNewImage_.reset();
    spOutputImage_.reset();
    pOutputImage_ = nullptr;
}

void SimpleFilterGPU::unbindInputs() {
    for (std::size_t iInput = numberOfImageInputs(); iInput-- > 0;) {
        if (ImageGPU const* const pImage = inputImageGPU(iInput)) {
            pImage->bindDefault();
        }
    }
    if (oInput_.hasData()) {
        oInput_->bindDefault();
    }
}

void SimpleFilterGPU::forgetBindings() const noexcept {
    for (std::size_t iInput = 0; iInput < numberOfImageInputs(); ++iInput) {
        if (ImageGPU const* const pImage = inputImageGPU(iInput)) {
            pImage->forgetBinding();
        }
    }
}

bool SimpleFilterGPU::hasUnfinishedPass() const noexcept { return pOutputImage_ != nullptr; }

void SimpleFilterGPU::dropUnfinishedPass() noexcept {
    if (!hasUnfinishedPass()) {
        return;
    }
    // It may have died with its controller; if not, the next pass takes it over.
    pFramebuffer_ = nullptr;
    abandonPass();
}

void SimpleFilterGPU::abandonPass() noexcept {
    try {
        if (OGL::NativeContext::currentHandle() != nullptr) {
            if (pFramebuffer_ != nullptr && pFramebuffer_->isBound()) {
                detachOutput();
            }
            unbindInputs();
            OGL::TextureState::setActiveTextureUnit(0);
        }
    } catch (...) {
        // The context that the pass ran in is gone, and what it bound with it.
        pFramebuffer_ = nullptr;
    }
    forgetBindings();
    pFramebuffer_ = nullptr;
    pOutputImage_ = nullptr;
    spNewImage_.reset();
    spOutputImage_.reset();
    bPreparedForRender_ = false;
}

} // namespace ORVO
