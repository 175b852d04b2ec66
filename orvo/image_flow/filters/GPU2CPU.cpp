#include "orvo/image_flow/filters/GPU2CPU.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/image_flow/sources/PixelArea.h"
#include "orvo/image_flow/sources/ScopedReadFramebuffer.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"
#include "orvo/ogl/internal/Scopes.h"

#include <optional>

namespace ORVO {

namespace {

using CPU = ImageCPU;
using GPU = ImageGPU;

/// The host format of a texture's format, by its name.
CPU::tePixelFormat formatCPU(GPU::tePixelFormat format) {
    switch (format) {
    case GPU::PIXEL_FORMAT_RGBA8:
        return CPU::PIXEL_FORMAT_RGBA8;
    case GPU::PIXEL_FORMAT_RGBA16F:
        return CPU::PIXEL_FORMAT_RGBA16F;
    case GPU::PIXEL_FORMAT_RGBA32F:
        return CPU::PIXEL_FORMAT_RGBA32F;
    case GPU::PIXEL_FORMAT_RGB8:
        return CPU::PIXEL_FORMAT_RGB8;
    case GPU::PIXEL_FORMAT_RGB16F:
        return CPU::PIXEL_FORMAT_RGB16F;
    case GPU::PIXEL_FORMAT_RGB32F:
        return CPU::PIXEL_FORMAT_RGB32F;
    case GPU::PIXEL_FORMAT_LUMINANCE8:
        return CPU::PIXEL_FORMAT_LUMINANCE8;
    case GPU::PIXEL_FORMAT_LUMINANCE16F:
        return CPU::PIXEL_FORMAT_LUMINANCE16F;
    case GPU::PIXEL_FORMAT_LUMINANCE32F:
        return CPU::PIXEL_FORMAT_LUMINANCE32F;
    case GPU::PIXEL_FORMAT_LUMINANCE_ALPHA8:
        return CPU::PIXEL_FORMAT_LUMINANCE_ALPHA8;
    case GPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F:
        return CPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F;
    case GPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F:
        return CPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F;
    case GPU::PIXEL_FORMAT_UNDEFINED:
        ORVO_FAIL("!\"PIXEL_FORMAT_UNDEFINED\"");
    case GPU::PIXEL_FORMAT_RGBA16:
    case GPU::PIXEL_FORMAT_RGB16:
    case GPU::PIXEL_FORMAT_LUMINANCE16:
    case GPU::PIXEL_FORMAT_LUMINANCE_ALPHA16:
        break;
    }
    ORVO_FAIL("Not implemented: pixelFormat in GPU2CPU::internalProcess()");
}

/// What OpenGL is asked for, so that the pixels come as a host format has them.
struct ReadFormat {
    GLenum nFormat_;
    GLenum nType_;
};

ReadFormat readFormat(CPU::tePixelFormat format) {
    switch (format) {
    case CPU::PIXEL_FORMAT_RGB8:
        return {GL_RGB, GL_UNSIGNED_BYTE};
    case CPU::PIXEL_FORMAT_RGBA8:
        return {GL_RGBA, GL_UNSIGNED_BYTE};
    case CPU::PIXEL_FORMAT_RGB32F:
        return {GL_RGB, GL_FLOAT};
    case CPU::PIXEL_FORMAT_RGBA32F:
        return {GL_RGBA, GL_FLOAT};
    case CPU::PIXEL_FORMAT_RGB16F:
        return {GL_RGB, GL_HALF_FLOAT};
    case CPU::PIXEL_FORMAT_RGBA16F:
        return {GL_RGBA, GL_HALF_FLOAT};
    // Luminance would be the sum of red, green and blue.
    case CPU::PIXEL_FORMAT_LUMINANCE8:
        return {GL_RED, GL_UNSIGNED_BYTE};
    case CPU::PIXEL_FORMAT_LUMINANCE32F:
        return {GL_RED, GL_FLOAT};
    case CPU::PIXEL_FORMAT_LUMINANCE16F:
        return {GL_RED, GL_HALF_FLOAT};
    case CPU::PIXEL_FORMAT_LUMINANCE_ALPHA8:
        return {GL_LUMINANCE_ALPHA, GL_UNSIGNED_BYTE};
    case CPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F:
        return {GL_LUMINANCE_ALPHA, GL_FLOAT};
    case CPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F:
        return {GL_LUMINANCE_ALPHA, GL_HALF_FLOAT};
    case CPU::PIXEL_FORMAT_BGR8:
    case CPU::PIXEL_FORMAT_BGRA8:
    case CPU::PIXEL_FORMAT_RGB16:
    case CPU::PIXEL_FORMAT_RGBA16:
    case CPU::PIXEL_FORMAT_LUMINANCE16:
    case CPU::PIXEL_FORMAT_LUMINANCE_ALPHA16:
    case CPU::PIXEL_FORMAT_UNDEFINED:
        break;
    }
    ORVO_FAIL("Not implemented: pixelFormat in GPU2CPU::convert()");
}

/// Takes green and blue out of the sum that luminance is made of, for a scope in which pixels are transferred
/// as they are.
class ScopedRedAsLuminance {
public:
    ScopedRedAsLuminance() { scaleGreenAndBlue(0.0F); }
    ~ScopedRedAsLuminance() { scaleGreenAndBlue(1.0F); }
    ScopedRedAsLuminance(ScopedRedAsLuminance const&) = delete;
    ScopedRedAsLuminance& operator=(ScopedRedAsLuminance const&) = delete;

private:
    static void scaleGreenAndBlue(float factor) {
        glPixelTransferf(GL_GREEN_SCALE, factor);
        glPixelTransferf(GL_BLUE_SCALE, factor);
    }
};

/// Reads the area from the bound framebuffer, which is that of `from`.
void readPixels(PixelArea const& area, ImageGPU const& from, ImageCPU& to, ReadFormat const& format) {
    OGL::Internal::ScopedPixelStore const pixelStore;
    std::optional<ScopedRedAsLuminance> oRedAsLuminance;
    if (format.nFormat_ == GL_LUMINANCE_ALPHA) {
        oRedAsLuminance.emplace();
    }
    OGL::Internal::ScopedBufferBinding const noBuffer(GL_PIXEL_PACK_BUFFER, 0);
    ExtentInPixelSpace const extent = area.extent();
    int const pitch = to.capacityExtent().width();
    glPixelStorei(GL_PACK_SWAP_BYTES, GL_FALSE);
    glPixelStorei(GL_PACK_ALIGNMENT, 1);
    glPixelStorei(GL_PACK_ROW_LENGTH, pitch == extent.width() ? 0 : pitch);
    glPixelStorei(GL_PACK_SKIP_ROWS, area.placeIn(to).y());
    glPixelStorei(GL_PACK_SKIP_PIXELS, area.placeIn(to).x());
    PositionInPixelSpace const source = area.placeIn(from);
    glReadPixels(source.x(), source.y(), extent.width(), extent.height(), format.nFormat_, format.nType_,
                 to.pixels());
}

} // namespace

GPU2CPU::GPU2CPU()
    : ImageFilter("GPU2CPU", OUTPUT_PRECISION_DEFAULT),
      o_InputImage("InputImage", this),
      o_OutputImage("OutputImage", this) {
    inputTarget_ = ORVO_TARGET_GL;
    outputTarget_ = ORVO_TARGET_CPU;
    addImageInput(&o_InputImage);
    setImageOutput(&o_OutputImage);
}

GPU2CPU::~GPU2CPU() = default;

void GPU2CPU::allocateOutputImage() {
    updateOutputRegionInPixels();
    takeBoundOutputImage();
}

void GPU2CPU::internalProcess() {
    prepareForRender();
    bPreparedForRender_ = false;
    try {
        allocateOutputImageCPU();
        convert();
    } catch (...) {
        resultCPU_.reset();
        throw;
    }
    spOutputImage_.reset();
    if (!o_OutputImage.bound()) {
        o_OutputImage.setData(resultCPU_);
    }
    resultCPU_.reset();
}

void GPU2CPU::allocateOutputImageCPU() {
    if (o_OutputImage.bound()) {
        resultCPU_ = spOutputImage_;
        return;
    }
    ImageGPU const& input = *o_InputImage;
    resultCPU_.setDataWithReleasableOwnership(ORVO_NEW ImageCPU(
        formatCPU(input.pixelFormat()), input.positionExtent(), input.pixelExtent(), input.capacityExtent()));
}

void GPU2CPU::convert() {
    ReadFormat const format = readFormat(resultCPU_->pixelFormat());
    PositionExtentInPixelSpace const computeRegion =
        worldToPixelSpace(computeRegionParameter().value(), o_InputImage->pixelExtent());
    ORVO_CHECK(resultCPU_->pixelExtent() == o_InputImage->pixelExtent());
    if (computeRegion.extent().width() <= 0 || computeRegion.extent().height() <= 0) {
        return;
    }
    ORVO_CHECK(resultCPU_->position().x() <= computeRegion.position().x());
    ORVO_CHECK(resultCPU_->position().y() <= computeRegion.position().y());
    ORVO_CHECK(resultCPU_->extent().width() >= computeRegion.extent().width());
    ORVO_CHECK(resultCPU_->extent().height() >= computeRegion.extent().height());
    ImageGPU const& input = *o_InputImage;
    PixelArea area(computeRegion);
    area.clipTo(input);
    area.clipTo(*resultCPU_);
    if (area.isEmpty()) {
        return;
    }
    // A framebuffer takes no const texture, though it only reads it.
    ScopedReadFramebuffer const framebuffer(const_cast<OGL::Texture2D&>(*input.texture()));
    readPixels(area, input, *resultCPU_, format);
    ORVO_OGL_THROW_ON_ERROR("The image could not be read back");
}

} // namespace ORVO
