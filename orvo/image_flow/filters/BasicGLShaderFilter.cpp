#include "orvo/image_flow/filters/BasicGLShaderFilter.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/ScopedPtr.h"
#include "orvo/image_runtime/ShaderManagerOGL.h"
#include "orvo/image_runtime/ShaderProgramProxyOGLAutoLock.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/FunctionTable.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/Program.h"
#include "orvo/ogl/TextureState.h"
#include "orvo/ogl/TextureUnit.h"
#include "orvo/ogl/internal/GL.h"

#include <algorithm>
#include <array>
#include <cstddef>

namespace ORVO {

namespace {

/// Formats of three and of four channels.
using FormatPair = std::array<ImageGPU::tePixelFormat, 2>;

constexpr FormatPair a8Bit{ImageGPU::PIXEL_FORMAT_RGB8, ImageGPU::PIXEL_FORMAT_RGBA8};
constexpr FormatPair a16Bit{ImageGPU::PIXEL_FORMAT_RGB16, ImageGPU::PIXEL_FORMAT_RGBA16};
constexpr FormatPair a16BitFloat{ImageGPU::PIXEL_FORMAT_RGB16F, ImageGPU::PIXEL_FORMAT_RGBA16F};
constexpr FormatPair a32BitFloat{ImageGPU::PIXEL_FORMAT_RGB32F, ImageGPU::PIXEL_FORMAT_RGBA32F};

/// The format of an image of at least three channels.
ImageGPU::tePixelFormat formatFor(ImageFilter::teOutputPrecisionHint eHint, std::size_t nChannels) {
    bool const bHalf = eHint == ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT;
    if (nChannels > 4) {
        ORVO_FAIL(bHalf ? "Not implemented: Only 1/2/3/4 channels supported in "
                          "GlyphcastFilterGPU::internalProcess()"
                        : "Not implemented: Only 1/2/3/4 channels supported");
    }
    std::size_t const iFormat = nChannels - 3;
    if (bHalf) {
        return OGL::ExtensionManager::Instance()->supports16BitFloat() ? a16BitFloat[iFormat]
                                                                       : a32BitFloat[iFormat];
    }
    return eHint == ImageFilter::OUTPUT_PRECISION_16_BIT_INT ? a16Bit[iFormat] : a8Bit[iFormat];
}

void setIfFound(OGL::Program& program, int iLocation, float x, float y) {
    if (iLocation != -1) {
        program.setUniform_Unsafe(iLocation, x, y);
    }
}

} // namespace

BasicGLShaderFilter::BasicGLShaderFilter(char const* name, char const* fragmentSource, int numChannelsOutput)
    : SimpleFilterGPU(name, true),
      sFragmentSource_(fragmentSource != nullptr ? fragmentSource : ""),
      bCompiled_(true),
      bExactOutput_(false),
      texUnitCount_(firstTexUnit),
      iOutOffset_(-1),
      iOutPixelExtent_(-1),
      nUniformsOfLink_(0) {
    nForcedChannels_ = static_cast<std::uint64_t>(numChannelsOutput);
    if (sFragmentSource_.empty()) {
        return;
    }
    try {
        compilePrograms();
    } catch (...) {
        bCompiled_ = false;
    }
}

BasicGLShaderFilter::~BasicGLShaderFilter() {
    for (DataFlow::ConstInput<ImageGPU>* pInput : vpInputs_) {
        trackedDelete(pInput);
    }
}

bool BasicGLShaderFilter::willRunInHardware() { return bCompiled_; }

void BasicGLShaderFilter::evaluateParameters() {}

void BasicGLShaderFilter::addInput(char const* name) {
    ORVO_ENFORCE(name);
    ScopedPtr<DataFlow::ConstInput<ImageGPU>> pInput(ORVO_NEW DataFlow::ConstInput<ImageGPU>(name, this));
    vpInputs_.reserve(vpInputs_.size() + 1);
    addImageInput(pInput.get());
    vpInputs_.push_back(pInput.release());
}

void BasicGLShaderFilter::addParameter(std::shared_ptr<DataFlow::ParameterBase> const& spParameter) {
    ORVO_ENFORCE(spParameter.get());
    vspParameters_.reserve(vspParameters_.size() + 1);
    registerParameter(spParameter.get());
    vspParameters_.push_back(spParameter);
}

void BasicGLShaderFilter::addUniformArray(char const* name, float* data, unsigned count) {
    ORVO_ENFORCE(name);
    ShaderProgramProxyOGLAutoLock const lock(oProgram_);
    lock.getProgram()->enable();
    vspUniformArrays_.reserve(vspUniformArrays_.size() + 1);
    vspUniformArrays_.push_back(
        UniformArray::construct(*lock.getProgram(), name, data, count, static_cast<unsigned>(texUnitCount_)));
    ++texUnitCount_;
}

void BasicGLShaderFilter::compilePrograms() {
    ShaderManagerOGL* const pManager = ShaderManagerOGL::Instance();
    ORVO_ENFORCE(pManager);
    oProgram_.add(FragmentShaderSourceOGL(sFragmentSource_));
    pManager->RegisterShaderProgram(&oProgram_);
}

void BasicGLShaderFilter::allocateOutputImageGPU() {
    if (takeBoundImage()) {
        return;
    }
    ImageGPU const* const pInputImage = inputImageGPU(0);
    PixelExtentInWorldSpace const pixelExtent =
        pInputImage != nullptr ? pInputImage->pixelExtent() : PixelExtentInWorldSpace(1.0f, 1.0f);
    ImageGPU::tePixelFormat const eFormat =
        formatFor(outputPrecisionHint(), std::max<std::size_t>(getNumChannelsOutput(), 3));
    PositionExtentInPixelSpace const rectangle = outputRectangle(pixelExtent);
    OGL::TextureState::setActiveTextureUnit(0);
    setNewOutputImage(rectangle, eFormat, pixelExtent, bExactOutput_);
}

void BasicGLShaderFilter::preProcess() {
    dropUnfinishedPass();
    try {
        Node::preProcess();
        allocateOutputImageGPU();
        ShaderProgramProxyOGLAutoLock const lock(oProgram_);
        OGL::Program& program = *lock.getProgram();
        program.enable();
        lookUpUniforms(program);
        texUnitCount_ = firstTexUnit;
        for (std::size_t iInput = 0; iInput < vpInputs_.size(); ++iInput) {
            ImageGPU const* const pImage = vpInputs_[iInput]->get();
            ORVO_ENFORCE(pImage);
            bindInput(*pImage, aInputUniforms_[iInput], program);
        }
    } catch (...) {
        abandonPass();
        throw;
    }
}

void BasicGLShaderFilter::lookUpUniforms(OGL::Program const& program) {
    if (program.linkNumber() == nUniformsOfLink_ && aInputUniforms_.size() == vpInputs_.size()) {
        return;
    }
    nUniformsOfLink_ = 0;
    aInputUniforms_.clear();
    for (DataFlow::ConstInput<ImageGPU> const* pInput : vpInputs_) {
        auto const locationOf = [&](char const* pSuffix) {
            return program.getUniformLocation((pInput->name() + pSuffix).c_str());
        };
        aInputUniforms_.push_back({locationOf("_pixelExtent"), locationOf("_pixelAspectRatio"),
                                   locationOf("_sampler"), locationOf("_delta"), locationOf("_offset")});
    }
    iOutOffset_ = program.getUniformLocation("_outOffset");
    iOutPixelExtent_ = program.getUniformLocation("_outPixelExtent");
    nUniformsOfLink_ = program.linkNumber();
}

void BasicGLShaderFilter::bindInput(ImageGPU const& image, InputUniforms const& uniforms,
                                    OGL::Program& program) {
    bool const bBound = image.boundTexUnit() > -1;
    auto const unit = static_cast<unsigned>(bBound ? image.boundTexUnit() : texUnitCount_);
    OGL::TextureState::setActiveTextureUnit(unit);
    image.bind(unit);
    if (!bBound) {
        ++texUnitCount_;
    }
    image.enable(unit);

    PixelExtentInWorldSpace const pixelExtent = image.pixelExtent();
    setIfFound(program, uniforms.iPixelExtent_, pixelExtent.width(), pixelExtent.height());
    if (uniforms.iPixelAspectRatio_ != -1) {
        program.setUniform_Unsafe(uniforms.iPixelAspectRatio_, pixelExtent.width() / pixelExtent.height());
    }
    static constexpr std::array<float, 4> aTransparentBlack{};
    image.setFilter(GL_LINEAR, GL_LINEAR);
    image.setWrap(GL_CLAMP_TO_BORDER, GL_CLAMP_TO_BORDER);
    image.setBorderColor(aTransparentBlack.data());
    if (uniforms.iSampler_ != -1) {
        program.setUniformSampler2D_Unsafe(uniforms.iSampler_, static_cast<int>(unit));
    }
    ExtentInWorldSpace const size = pixelToWorldSpace(image.capacityExtent(), pixelExtent);
    setIfFound(program, uniforms.iDelta_, 1.0f / size.width(), 1.0f / size.height());
    PositionInWorldSpace const offset = pixelToWorldSpace(image.position(), pixelExtent);
    setIfFound(program, uniforms.iOffset_, offset.x(), offset.y());
}

void BasicGLShaderFilter::internalProcess() {
    ORVO_ENFORCE(pOutputImage_);
    bPreparedForRender_ = false;
    try {
        ShaderProgramProxyOGLAutoLock const lock(oProgram_);
        OGL::Program& program = *lock.getProgram();
        program.enable();
        OGL::TextureState::setActiveTextureUnit(0);
        OGL::TextureUnit::Unit(0).enable2D();
        if (hasPixelsToDraw()) {
            attachOutput();
            requireCompleteFramebuffer();
            // What the driver finds wrong with the program does not keep it from drawing.
            program.validate();
            clearBeyondNewImage();
            draw(program);
        }
        releaseUnits();
        ORVO_CHECK(texUnitCount_ == firstTexUnit);
        if (pFramebuffer_ != nullptr) {
            detachOutput();
        }
        program.disable();
        OGL::TextureState::setActiveTextureUnit(0);
        handOnOutput();
    } catch (...) {
        abandonPass();
        throw;
    }
}

void BasicGLShaderFilter::draw(OGL::Program& program) {
    PositionExtentInPixelSpace const& image = pOutputImage_->positionExtent();
    double const x = image.position().x();
    double const y = image.position().y();
    glMatrixMode(GL_MODELVIEW);
    glLoadIdentity();
    glMatrixMode(GL_PROJECTION);
    glLoadIdentity();
    glOrtho(x, x + image.extent().width(), y, y + image.extent().height(), 0.0, 1.0);
    glViewport(0, 0, image.extent().width(), image.extent().height());

    PixelExtentInWorldSpace const pixelExtent = pOutputImage_->pixelExtent();
    PositionInWorldSpace const offset = pixelToWorldSpace(image.position(), pixelExtent);
    setIfFound(program, iOutOffset_, offset.x(), offset.y());
    setIfFound(program, iOutPixelExtent_, pixelExtent.width(), pixelExtent.height());

    // The drawn rectangle lies in the image at (left, bottom) to (right, top); vertices are pixel-space
    // positions.
    auto const left = static_cast<float>(oDrawnRegion_.position().x() - image.position().x());
    auto const bottom = static_cast<float>(oDrawnRegion_.position().y() - image.position().y());
    float const right = left + static_cast<float>(oDrawnRegion_.extent().width());
    float const top = bottom + static_cast<float>(oDrawnRegion_.extent().height());
    std::array<float2, 4> const aCorners{float2(left, bottom), float2(left, top), float2(right, top),
                                         float2(right, bottom)};
    OGL::FunctionTable const& table = *OGL::ExtensionManager::Instance()->table();
    glBegin(GL_QUADS);
    for (float2 const& corner : aCorners) {
        table.glMultiTexCoord2f(GL_TEXTURE0, corner.x, corner.y);
        glVertex2f(static_cast<float>(x + corner.x), static_cast<float>(y + corner.y));
    }
    glEnd();
}

void BasicGLShaderFilter::releaseUnits() {
    while (!vspUniformArrays_.empty()) {
        vspUniformArrays_.pop_back();
        --texUnitCount_;
    }
    for (DataFlow::ConstInput<ImageGPU> const* pInput : vpInputs_) {
        ImageGPU const* const pImage = pInput->get();
        if (pImage == nullptr || pImage->boundTexUnit() < 0) {
            continue;
        }
        --texUnitCount_;
        auto const unit = static_cast<unsigned>(pImage->boundTexUnit());
        OGL::TextureState::setActiveTextureUnit(unit);
        OGL::TextureUnit::Unit(unit).disable2D();
        pImage->bindDefault();
    }
}

void BasicGLShaderFilter::abandonPass() noexcept {
    try {
        releaseUnits();
        if (OGL::NativeContext::currentHandle() != nullptr) {
            glUseProgram(0);
        }
    } catch (...) {
        // The context that the pass ran in is gone, and what it bound with it.
        vspUniformArrays_.clear();
    }
    texUnitCount_ = firstTexUnit;
    SimpleFilterGPU::abandonPass();
}

bool BasicGLShaderFilter::hasUnfinishedPass() const noexcept {
    return SimpleFilterGPU::hasUnfinishedPass() || !vspUniformArrays_.empty();
}

} // namespace ORVO
