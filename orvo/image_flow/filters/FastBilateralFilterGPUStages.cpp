// The stages of a frame: pixels into a buffer, buffer into the grid, three blurs, and back to pixels.
#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/image_flow/ScopedTexturePoolAccessors.h"
#include "orvo/image_flow/filters/FastBilateralFilterGPU.h"
#include "orvo/image_flow/filters/bilateral/GPUScopes.h"
#include "orvo/image_flow/filters/bilateral/PixelBuffer.h"
#include "orvo/image_runtime/GLStateUtils.h"
#include "orvo/ogl/Framebuffer.h"
#include "orvo/ogl/Program.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/TextureState.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"
#include "orvo/ogl/internal/Scopes.h"

#include <array>

namespace ORVO {

namespace {

using ImageFlow::bilateral::ScopedInput;
using ImageFlow::bilateral::ScopedProgram;
using ImageFlow::bilateral::ScopedTarget;
using OGL::Texture;

/// Vertices count the pixels of a viewport from its corner.
void setUpProjection(int x, int y, unsigned width, unsigned height) {
    glMatrixMode(GL_PROJECTION);
    glLoadIdentity();
    glOrtho(0.0, width, 0.0, height, -1.0, 1.0);
    glMatrixMode(GL_MODELVIEW);
    glLoadIdentity();
    glViewport(x, y, static_cast<int>(width), static_cast<int>(height));
}

void clearToTransparentBlack() {
    glClearColor(0.0F, 0.0F, 0.0F, 0.0F);
    glClear(GL_COLOR_BUFFER_BIT);
}

/// A texture of the pool whose single texels are read, with zeros outside.
std::unique_ptr<ScopedTexture2D> texelTexture(unsigned width, unsigned height,
                                              Texture::InternalFormat eFormat) {
    static constexpr std::array<float, 4> aZeros{};
    auto pTexture = std::make_unique<ScopedTexture2D>(width, height, eFormat);
    OGL::TextureState::setActiveTextureUnit(0);
    ScopedTexture2DBind const binding(0, pTexture->get());
    pTexture->setFilter(Texture::FILTER_NEAREST, Texture::FILTER_NEAREST);
    pTexture->setWrap(Texture::WRAP_MODE_CLAMP_TO_BORDER, Texture::WRAP_MODE_CLAMP_TO_BORDER);
    pTexture->get()->setBorderColor(aZeros.data());
    return pTexture;
}

void setCoordinates(ImageQuad& quad, float2 const& first, float2 const& last) {
    auto iCoordinate = quad.textureCoordinatesBegin();
    *iCoordinate++ = first;
    *iCoordinate++ = float2(last[0], first[1]);
    *iCoordinate++ = last;
    *iCoordinate++ = float2(first[0], last[1]);
    ORVO_CHECK(iCoordinate == quad.textureCoordinatesEnd());
}

bool isEmptyImage(ImageGPU const& image) { return image.numberOfPixels() == 0; }

/// Reads the bound framebuffer into a buffer: three floats a pixel, rows without gaps.
void readColors(unsigned nBuffer, ExtentInPixelSpace const& extent) {
    OGL::Internal::ScopedPixelStore const store;
    glPixelStorei(GL_PACK_ALIGNMENT, 1);
    glPixelStorei(GL_PACK_ROW_LENGTH, 0);
    glPixelStorei(GL_PACK_SKIP_ROWS, 0);
    glPixelStorei(GL_PACK_SKIP_PIXELS, 0);
    glPixelStorei(GL_PACK_SWAP_BYTES, GL_FALSE);
    OGL::Internal::ScopedBufferBinding const binding(GL_PIXEL_PACK_BUFFER, nBuffer);
    glReadBuffer(GL_COLOR_ATTACHMENT0);
    glReadPixels(0, 0, extent.width(), extent.height(), GL_RGB, GL_FLOAT, nullptr);
    ORVO_OGL_THROW_ON_ERROR("The pixels could not be read back");
}

/// Draws a point for each pixel.
void drawPoints(unsigned nPositions, unsigned nColors, int nPixels) {
    ScopedGLEnableClientState const vertices(GL_VERTEX_ARRAY);
    ScopedGLEnableClientState const colors(GL_COLOR_ARRAY);
    {
        OGL::Internal::ScopedBufferBinding const binding(GL_ARRAY_BUFFER, nPositions);
        glVertexPointer(2, GL_FLOAT, 0, nullptr);
    }
    {
        OGL::Internal::ScopedBufferBinding const binding(GL_ARRAY_BUFFER, nColors);
        glColorPointer(3, GL_FLOAT, 0, nullptr);
    }
    glDrawArrays(GL_POINTS, 0, nPixels);
    // The arrays let go of the buffers; and what the colour is after an array of colours, nobody knows.
    OGL::Internal::ScopedBufferBinding const binding(GL_ARRAY_BUFFER, 0);
    glVertexPointer(4, GL_FLOAT, 0, nullptr);
    glColorPointer(4, GL_FLOAT, 0, nullptr);
    glColor4f(1.0F, 1.0F, 1.0F, 1.0F);
}

} // namespace

void FastBilateralFilterGPU::setUpQuad(ImageGPU const& input) {
    oQuad_.set(PositionInWorldSpace(), ExtentInWorldSpace(static_cast<float>(oRenderExtent_.width()),
                                                          static_cast<float>(oRenderExtent_.height())));
    // In pixels of the input's texture, from its corner; the grids differ where a bound image has its own.
    double const dScaleX = double(pOutputImage_->pixelExtent().width()) / double(input.pixelExtent().width());
    double const dScaleY =
        double(pOutputImage_->pixelExtent().height()) / double(input.pixelExtent().height());
    double const dLeft = oDrawnRegion_.position().x() * dScaleX - input.position().x();
    double const dTop = oDrawnRegion_.position().y() * dScaleY - input.position().y();
    ExtentInPixelSpace const capacity = input.capacityExtent();
    setCoordinates(
        oQuad_,
        float2(static_cast<float>(dLeft / capacity.width()), static_cast<float>(dTop / capacity.height())),
        float2(static_cast<float>((dLeft + oRenderExtent_.width() * dScaleX) / capacity.width()),
               static_cast<float>((dTop + oRenderExtent_.height() * dScaleY) / capacity.height())));
}

void FastBilateralFilterGPU::copyDataFromTextureObjectToVBO(ImageGPU const& input) {
    if (!hasPixelsToDraw()) {
        return;
    }
    auto const width = static_cast<unsigned>(oRenderExtent_.width());
    auto const height = static_cast<unsigned>(oRenderExtent_.height());
    auto const pCopy = texelTexture(width, height, Texture::INTERNAL_FORMAT_RGB32F);
    ScopedTarget const target(*pFramebuffer_, pCopy->get());
    setUpProjection(0, 0, width, height);
    if (isEmptyImage(input)) {
        clearToTransparentBlack();
    } else {
        ScopedInput const bound(input);
        oQuad_.render();
    }
    glFinish();
    readColors(pColorBuffer_->objectID(), oRenderExtent_);
}

std::unique_ptr<ScopedTexture2D> FastBilateralFilterGPU::newGrid() const {
    return texelTexture(nGridWidth_ * nGridDepth_, nGridHeight_, Texture::INTERNAL_FORMAT_RGBA16F);
}

std::unique_ptr<ScopedTexture2D> FastBilateralFilterGPU::scatterInput() {
    ScopedProgram const program(bColorize_ ? oScatterLabProgram_ : oScatterLuminanceProgram_);
    program->setUniform_Unsafe("sigmaValues", 1.0F / fSigmaX_, 1.0F / fSigmaY_, 1.0F / fRangeSigma_);
    program->setUniform_Unsafe("gridSizes", static_cast<float>(nGridWidth_), static_cast<float>(nGridHeight_),
                               static_cast<float>(nGridDepth_));
    program->setUniformSampler2D_Unsafe("input_texture", 0);
    auto pGrid = newGrid();
    ScopedTarget const target(*pFramebuffer_, pGrid->get());
    setUpProjection(0, 0, nGridWidth_ * nGridDepth_, nGridHeight_);
    ScopedGLEnable const blending(GL_BLEND);
    glBlendFunc(GL_ONE, GL_ONE);
    clearToTransparentBlack();
    if (hasPixelsToDraw()) {
        drawPoints(pPositionBuffer_->objectID(), pColorBuffer_->objectID(),
                   oRenderExtent_.width() * oRenderExtent_.height());
    }
    glFinish();
    return pGrid;
}

std::unique_ptr<ScopedTexture2D> FastBilateralFilterGPU::blurSpace1D(ScopedTexture2D const& source,
                                                                     float2 const& delta) {
    return blurInto(oBlurSpaceProgram_, source, delta);
}

std::unique_ptr<ScopedTexture2D> FastBilateralFilterGPU::blurRange(ScopedTexture2D const& source) {
    // A step of one slice: its width among that of all.
    return blurInto(oBlurRangeProgram_, source, float2(1.0F / static_cast<float>(nGridDepth_), 0.0F));
}

std::unique_ptr<ScopedTexture2D> FastBilateralFilterGPU::blurInto(ShaderProgramProxyOGL& oProgram,
                                                                  ScopedTexture2D const& source,
                                                                  float2 const& delta) {
    auto pGrid = newGrid();
    ScopedTarget const target(*pFramebuffer_, pGrid->get());
    ScopedProgram const program(oProgram);
    program->setUniform_Unsafe("delta", delta[0], delta[1]);
    program->setUniform_Unsafe("twoDelta", 2.0F * delta[0], 2.0F * delta[1]);
    program->setUniformSampler2D_Unsafe("input_texture", 0);
    ScopedTexture2DBind const binding(0, source.get());
    unsigned const width = nGridWidth_ * nGridDepth_;
    setUpProjection(0, 0, width, nGridHeight_);
    ImageQuad quad(PositionInWorldSpace(),
                   ExtentInWorldSpace(static_cast<float>(width), static_cast<float>(nGridHeight_)));
    quad.createTextureCoordinates();
    setCoordinates(quad, float2(0.0F, 0.0F), float2(1.0F, 1.0F));
    quad.render();
    glFinish();
    return pGrid;
}

void FastBilateralFilterGPU::slice(ScopedTexture2D const& quotientGrid, ImageGPU const& input) {
    if (!hasPixelsToDraw()) {
        return;
    }
    ScopedTarget const target(*pFramebuffer_, pOutputImage_->texture());
    if (spNewImage_.get() != nullptr) {
        // What the texture has beyond the image; of a bound one it is its owner's.
        pOutputImage_->initializeToTransparentBlack();
    }
    setUpProjection(oDrawnRegion_.position().x() - pOutputImage_->position().x(),
                    oDrawnRegion_.position().y() - pOutputImage_->position().y(),
                    static_cast<unsigned>(oRenderExtent_.width()),
                    static_cast<unsigned>(oRenderExtent_.height()));
    if (isEmptyImage(input)) {
        clearOutput();
        return;
    }
    ScopedProgram const program(bColorize_ ? oSliceLabProgram_ : oSliceLuminanceProgram_);
    float2 const first = *oQuad_.textureCoordinatesBegin();
    float2 const last = *(oQuad_.textureCoordinatesBegin() + 2);
    program->setUniform_Unsafe("sigmaValues", 1.0F / fSigmaX_, 1.0F / fSigmaY_, 1.0F / fRangeSigma_);
    program->setUniform_Unsafe("gridSizes", static_cast<float>(nGridWidth_), static_cast<float>(nGridHeight_),
                               static_cast<float>(nGridDepth_));
    // The coordinates of the quad, back to the pixels of the region.
    program->setUniform_Unsafe("inputSize", static_cast<float>(oRenderExtent_.width()) / (last[0] - first[0]),
                               static_cast<float>(oRenderExtent_.height()) / (last[1] - first[1]));
    program->setUniform_Unsafe("inputOffset", first[0], first[1]);
    program->setUniformSampler2D_Unsafe("input_texture", 0);
    program->setUniformSampler2D_Unsafe("quotient_grid_texture", 1);

    ScopedTexture2DBind const gridBinding(1, quotientGrid.get());
    if (bHardwareFiltersGrid_) {
        quotientGrid.setFilter(Texture::FILTER_LINEAR, Texture::FILTER_LINEAR);
    }
    ScopedInput const bound(input);
    oQuad_.render();
    glFinish();
}

void FastBilateralFilterGPU::clearOutput() {
    ScopedGLEnable const scissors(GL_SCISSOR_TEST);
    glScissor(oDrawnRegion_.position().x() - pOutputImage_->position().x(),
              oDrawnRegion_.position().y() - pOutputImage_->position().y(), oRenderExtent_.width(),
              oRenderExtent_.height());
    clearToTransparentBlack();
}

} // namespace ORVO
