#include "orvo/image_flow/filters/FastBilateralFilterGPU.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SaturatingCast.h"
#include "orvo/image_flow/ScopedTexturePoolAccessors.h"
#include "orvo/image_flow/filters/bilateral/GPUPrograms.h"
#include "orvo/image_flow/filters/bilateral/GPUScopes.h"
#include "orvo/image_flow/filters/bilateral/PixelBuffer.h"
#include "orvo/image_runtime/GLStateUtils.h"
#include "orvo/image_runtime/ShaderManagerOGL.h"
#include "orvo/ogl/ExceptionOGL.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/Framebuffer.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/TextureState.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"
#include "orvo/ogl/internal/ScopedFramebufferBindings.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <utility>

namespace ORVO {

namespace {

using ImageFlow::bilateral::PixelBuffer;
using ImageFlow::bilateral::ScopedTarget;

/// Cells of the grid beyond those of the image: four at either end, and one.
constexpr int nPaddingCells = 9;
/// Largest number of cells along a side, beyond what any driver has textures for.
constexpr int nMostCells = 1 << 30;

/// Cells along a side that is so many sigmas long.
unsigned cellsOf(float sigmas) {
    int const nCells = std::clamp(saturatingCast<int>(std::trunc(sigmas)), 0, nMostCells);
    return static_cast<unsigned>(nCells + nPaddingCells);
}

/// How far a sigma reaches, in pixels; a sigma of NaN reaches nowhere.
float gpuReachOf(float sigma) { return std::isnan(sigma) ? 0.0F : std::ceil(sigma * 2.146F); }

void addSources(ShaderProgramProxyOGL& oProgram, std::string const& sVertex, std::string const& sFragment) {
    oProgram.add(FragmentShaderSourceOGL(sFragment));
    oProgram.add(VertexShaderSourceOGL(sVertex));
    ShaderManagerOGL* const pManager = ShaderManagerOGL::Instance();
    ORVO_ENFORCE(pManager);
    pManager->RegisterShaderProgram(&oProgram);
}

void clearErrorsOfContext() noexcept {
    if (OGL::NativeContext::currentHandle() != nullptr) {
        OGL::Internal::clearErrors();
    }
}

/// Unit 0 with 2D texturing enabled and the active one; at the end it is as it was.
void enableInputUnit(GLStateStack& states) {
    states.push_back(ORVO_NEW ScopedActiveTextureUnitRestore());
    OGL::TextureState::setActiveTextureUnit(0);
    // The controller has enabled unit 0 for the length of the frame: the next node needs it, too.
    if (glIsEnabled(GL_TEXTURE_2D) == GL_FALSE) {
        states.push_back(ORVO_NEW ScopedTexture2DEnablerWithActivation(0));
    }
}

/// Unit 1 with 2D texturing enabled, unit 0 still the active one.
void enableGridUnit(GLStateStack& states) {
    states.push_back(ORVO_NEW ScopedTexture2DEnablerWithActivation(1));
    OGL::TextureState::setActiveTextureUnit(0);
}

} // namespace

FastBilateralFilterGPU::FastBilateralFilterGPU()
    : ImageFilter("ImageFilter", OUTPUT_PRECISION_DEFAULT),
      spSpatialSigma_(DataFlow::IntervalParameter<float2>::create(
          float2(10.0F, 10.0F), float2(0.1F, 0.1F), float2(100.0F, 100.0F), "spatialSigma",
          "Reach of the smoothing in x and y, in pixels")),
      spRangeSigma_(DataFlow::IntervalParameter<float>::create(
          0.15F, 0.01F, 1.0F, "rangeSigma", "Difference of intensity that counts as an edge")),
      spColorize_(std::make_shared<DataFlow::Parameter<bool>>(
          false, "colorize", "Keep the colours; without it the result is grey")),
      bRunInHardware_(true),
      oInput_("InputImage", this),
      oOutput_("OutputImage", this),
      pOutputImage_(nullptr),
      oRenderExtent_(0, 0),
      oQuad_(PositionInWorldSpace(), ExtentInWorldSpace(0.0F, 0.0F)),
      nGridHeight_(0),
      nGridWidth_(0),
      nGridDepth_(0),
      fRangeSigma_(0.0F),
      fSigmaX_(0.0F),
      fSigmaY_(0.0F),
      bHardwareFiltersGrid_(false),
      bColorize_(false) {
    inputTarget_ = ORVO_TARGET_GL;
    outputTarget_ = ORVO_TARGET_GL;
    addImageInput(&oInput_);
    setImageOutput(&oOutput_);
    oQuad_.createTextureCoordinates();
    registerParameter(spSpatialSigma_.get());
    registerParameter(spRangeSigma_.get());
    registerParameter(spColorize_.get());
    // What a host left pending says nothing of what is tried here.
    clearErrorsOfContext();
    try {
        pFramebuffer_ = std::make_unique<OGL::Framebuffer>();
        probeFloatTargets();
        compilePrograms();
    } catch (...) {
        bRunInHardware_ = false;
        // Nobody asked for what failed here: the next frame in the context must not find it.
        clearErrorsOfContext();
    }
    if (!bRunInHardware_) {
        // Programs may be missing: without a framebuffer no frame begins.
        pFramebuffer_.reset();
    }
}

FastBilateralFilterGPU::~FastBilateralFilterGPU() = default;

void FastBilateralFilterGPU::probeFloatTargets() {
    OGL::ExtensionManager const& manager = *OGL::ExtensionManager::Instance();
    bool const bSupported = manager.supportsFloatingPointTextures() &&
                            (manager.isSupported(OGL::EXTENSION_ARB_FRAMEBUFFER_OBJECT) ||
                             manager.isSupported(OGL::EXTENSION_ATI_TEXTURE_FLOAT));
    if (!bSupported) {
        bRunInHardware_ = false;
        return;
    }
    constexpr unsigned nSize = 16;
    {
        OGL::Internal::ScopedFramebufferBindings const bindings;
        OGL::Texture2D texture(OGL::Texture::INTERNAL_FORMAT_RGB16F, nSize, nSize, false, nullptr);
        ScopedTarget const target(*pFramebuffer_, &texture);
    }
    ORVO_OGL_THROW_ON_ERROR("The driver refuses a texture of floats to draw to");
}

void FastBilateralFilterGPU::compilePrograms() {
    namespace programs = ImageFlow::bilateral;
    // Hardware of this vendor filters the grid's textures, and the programs that rely on it are chosen here.
    bHardwareFiltersGrid_ =
        OGL::ExtensionManager::Instance()->vendor() == OGL::ExtensionManager::VENDOR_NVIDIA;
    std::string const sPassThrough = programs::passThroughVertexProgram();
    addSources(oScatterLuminanceProgram_, programs::scatterVertexProgram(false),
               programs::scatterFragmentProgram());
    addSources(oScatterLabProgram_, programs::scatterVertexProgram(true), programs::scatterFragmentProgram());
    addSources(oBlurSpaceProgram_, sPassThrough, programs::blurFragmentProgram());
    addSources(oBlurRangeProgram_, sPassThrough, programs::blurAndDivideFragmentProgram());
    addSources(oSliceLuminanceProgram_, sPassThrough,
               programs::sliceFragmentProgram(false, bHardwareFiltersGrid_));
    addSources(oSliceLabProgram_, sPassThrough, programs::sliceFragmentProgram(true, bHardwareFiltersGrid_));
}

DataFlow::IntervalParameter<float2>& FastBilateralFilterGPU::spatialSigma() { return *spSpatialSigma_; }

DataFlow::IntervalParameter<float>& FastBilateralFilterGPU::rangeSigma() { return *spRangeSigma_; }

DataFlow::Parameter<bool>& FastBilateralFilterGPU::colorize() { return *spColorize_; }

bool FastBilateralFilterGPU::willRunInHardware() { return bRunInHardware_; }

PositionExtentInWorldSpace FastBilateralFilterGPU::needed(PositionExtentInWorldSpace const& outputRegion,
                                                          std::string /*inputName*/,
                                                          RegionMap const& /*inputDODs*/) {
    float2 const sigma = spSpatialSigma_->value();
    PositionExtentInWorldSpace region = outputRegion;
    region.outset(float2(gpuReachOf(sigma[0]), gpuReachOf(sigma[1])));
    return region;
}

PositionExtentInWorldSpace FastBilateralFilterGPU::changed(PositionExtentInWorldSpace const& inputRegion,
                                                           std::string inputName,
                                                           RegionMap const& inputDODs) {
    return needed(inputRegion, std::move(inputName), inputDODs);
}

bool FastBilateralFilterGPU::canCreateTextureForRender(PositionExtentInWorldSpace const& region) {
    ORVO_OGL_REQUIRE_CONTEXT();
    float2 const sigma = spSpatialSigma_->value();
    std::uint64_t const nGridH = cellsOf((region.extent().height() - 1.0F) / sigma[1]);
    std::uint64_t const nGridW = cellsOf((region.extent().width() - 1.0F) / sigma[0]);
    std::uint64_t const nGridD = cellsOf(1.0F / spRangeSigma_->value());
    GLint nLargest = 0;
    glGetIntegerv(GL_MAX_TEXTURE_SIZE, &nLargest);
    auto const nLimit = static_cast<std::uint64_t>(std::max(nLargest, 0));
    return nGridH <= nLimit && nGridW * nGridD <= nLimit;
}

void FastBilateralFilterGPU::internalProcess() {
    bPreparedForRender_ = false;
    ORVO_ENFORCE(pFramebuffer_);
    ImageGPU const& input = *oInput_;
    try {
        GLStateStack states;
        enableInputUnit(states);
        // A frame that failed may have left a program behind, if the driver took its context away.
        glUseProgram(0);
        readParameters();
        setUpOutput(input);
        setUpQuad(input);
        setUpGrid();
        setUpBuffers();
        copyDataFromTextureObjectToVBO(input);
        // Not before: the copy draws without a program, where whatever a host has bound to the unit counts.
        enableGridUnit(states);
        // Each stage's grid goes back to the pool when the next one has read it.
        auto const width = static_cast<float>(nGridWidth_ * nGridDepth_);
        auto pGrid = scatterInput();
        pGrid = blurSpace1D(*pGrid, float2(1.0F / width, 0.0F));
        pGrid = blurSpace1D(*pGrid, float2(0.0F, 1.0F / static_cast<float>(nGridHeight_)));
        pGrid = blurRange(*pGrid);
        slice(*pGrid, input);
        if (!oOutput_.bound()) {
            oOutput_.setData(spNewImage_);
        }
    } catch (...) {
        spNewImage_.reset();
        pOutputImage_ = nullptr;
        throw;
    }
    spNewImage_.reset();
    spOutputImage_.reset();
    pOutputImage_ = nullptr;
}

void FastBilateralFilterGPU::readParameters() {
    float2 const sigma = spSpatialSigma_->value();
    fRangeSigma_ = spRangeSigma_->value();
    fSigmaX_ = sigma[0];
    fSigmaY_ = sigma[1];
    bColorize_ = spColorize_->value();
}

void FastBilateralFilterGPU::setUpOutput(ImageGPU const& input) {
    PositionExtentInWorldSpace const& outRect = computeRegionParameter().value();
    ORVO_CHECK(!outRect.isInfinite());
    bool const bBound = oOutput_.bound();
    PixelExtentInWorldSpace const pixelExtent = bBound ? outputPixelExtent() : input.pixelExtent();
    PositionExtentInPixelSpace const rectangle = worldToPixelSpace(outRect, pixelExtent);
    bool const bDefined = rectangle.extent().isDefined();
    oDrawnRegion_ = bDefined
                        ? rectangle
                        : PositionExtentInPixelSpace(PositionInPixelSpace(0, 0), ExtentInPixelSpace(0, 0));
    oRenderExtent_ = oDrawnRegion_.extent();
    if (bBound) {
        updateOutputRegionInPixels();
        pOutputImage_ = boundOutputImageGPU();
        return;
    }
    oOutputRegionInPixels_ = oDrawnRegion_;
    // Other hints than this one do not widen the output.
    ImageGPU::tePixelFormat const eFormat = outputPrecisionHint() == OUTPUT_PRECISION_16_BIT_FLOAT
                                                ? ImageGPU::PIXEL_FORMAT_RGBA16F
                                                : ImageGPU::PIXEL_FORMAT_RGBA8;
    spNewImage_.setDataWithReleasableOwnership(
        ORVO_NEW ImageGPU(oDrawnRegion_, eFormat, pixelExtent, !bDefined));
    pOutputImage_ = spNewImage_.get();
}

bool FastBilateralFilterGPU::hasPixelsToDraw() const {
    return oRenderExtent_.width() > 0 && oRenderExtent_.height() > 0;
}

void FastBilateralFilterGPU::setUpGrid() {
    auto const width = static_cast<float>(oRenderExtent_.width());
    auto const height = static_cast<float>(oRenderExtent_.height());
    nGridWidth_ = cellsOf((width - 1.0F) / fSigmaX_);
    nGridHeight_ = cellsOf((height - 1.0F) / fSigmaY_);
    nGridDepth_ = cellsOf(1.0F / fRangeSigma_);
    // Beyond all drivers, and beyond what the product's type holds.
    ORVO_CHECK_PARAMETER(std::uint64_t(nGridWidth_) * nGridDepth_ <= std::uint64_t(nMostCells),
                         "Texture size is too large");
}

void FastBilateralFilterGPU::setUpBuffers() {
    if (pPositionBuffer_ == nullptr || !pPositionBuffer_->serves(oRenderExtent_)) {
        pPositionBuffer_.reset();
        pPositionBuffer_ = PixelBuffer::ofPositions(oRenderExtent_);
    }
    if (pColorBuffer_ == nullptr || !pColorBuffer_->serves(oRenderExtent_)) {
        pColorBuffer_.reset();
        pColorBuffer_ =
            std::make_unique<PixelBuffer>(oRenderExtent_, 3, nullptr, OGL::Buffer::USAGE_DYNAMIC_DRAW);
    }
}

} // namespace ORVO
