#include "orvo/image_flow/filters/FastBilateralFilterCPUNode.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "orvo/image_flow/filters/bilateral/BandRunner.h"
#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/images/ImageCPUWriteAccessor.h"

#include <cmath>

namespace ORVO {

namespace {

/// How far a sigma reaches, in pixels; a sigma of NaN reaches nowhere.
float reachOf(float sigma) { return std::isnan(sigma) ? 0.0F : std::ceil(sigma * 2.146F); }

/// The part of an image that a region covers, as an image of its own around the same pixels.
ImageCPU viewOf(ImageCPU& image, PositionExtentInPixelSpace const& region) {
    std::ptrdiff_t const column = static_cast<std::ptrdiff_t>(region.position().x()) - image.position().x();
    std::ptrdiff_t const row = static_cast<std::ptrdiff_t>(region.position().y()) - image.position().y();
    int const pitch = image.capacityExtent().width();
    std::ptrdiff_t const pixel = row * pitch + column;
    std::ptrdiff_t const size = static_cast<std::ptrdiff_t>(pixelSizeBytes(image.pixelFormat()));
    return {image.pixelFormat(), image.pixels() + pixel * size, region, image.pixelExtent(),
            ExtentInPixelSpace(pitch, region.extent().height())};
}

} // namespace

/// Hands the bands of a phase to the controller, which asks the node for their number and has it run them.
class FastBilateralFilterCPUNode::SliceRunner : public ImageFlow::bilateral::BandRunner {
public:
    explicit SliceRunner(FastBilateralFilterCPUNode& oNode) : oNode_(oNode) {}
    ~SliceRunner() override { oNode_.pPhase_ = nullptr; }

    void run(std::size_t nBands, std::size_t nUnits, Body const& body) override {
        Phase const phase = {nUnits, nBands, &body};
        oNode_.pPhase_ = &phase;
        ImageFlowController* const pController = oNode_.imageFlowController();
        ORVO_ENFORCE(pController);
        pController->processSlices(&oNode_);
        oNode_.pPhase_ = nullptr;
    }

private:
    FastBilateralFilterCPUNode& oNode_;
};

FastBilateralFilterCPUNode::FastBilateralFilterCPUNode()
    : ImageFilter("ORVO::FastBilateralFilterCPU", OUTPUT_PRECISION_DEFAULT),
      oInputImage_("InputImage", this),
      oOutputImage_("OutputImage", this),
      oSpatialSigma_(float2(10.0F, 10.0F), float2(0.1F, 0.1F), float2(100.0F, 100.0F), "spatialSigma",
                     "Reach of the smoothing in x and y, in pixels"),
      oRangeSigma_(0.15F, 0.01F, 1.0F, "rangeSigma", "Difference of intensity that counts as an edge"),
      oColorize_(false, "colorize", "Keep the colours; without it the result is grey"),
      pPhase_(nullptr) {
    inputTarget_ = ORVO_TARGET_CPU;
    outputTarget_ = ORVO_TARGET_CPU;
    addImageInput(&oInputImage_);
    setImageOutput(&oOutputImage_);
    registerParameter(&oSpatialSigma_);
    registerParameter(&oRangeSigma_);
    registerParameter(&oColorize_);
}

FastBilateralFilterCPUNode::~FastBilateralFilterCPUNode() = default;

DataFlow::IntervalParameter<float2>& FastBilateralFilterCPUNode::spatialSigma() { return oSpatialSigma_; }

DataFlow::IntervalParameter<float>& FastBilateralFilterCPUNode::rangeSigma() { return oRangeSigma_; }

DataFlow::Parameter<bool>& FastBilateralFilterCPUNode::colorize() { return oColorize_; }

PositionExtentInWorldSpace FastBilateralFilterCPUNode::needed(PositionExtentInWorldSpace const& outputRegion,
                                                              std::string /*inputName*/,
                                                              RegionMap const& /*inputDODs*/) {
    float2 const sigma = oSpatialSigma_.value();
    PositionExtentInWorldSpace region = outputRegion;
    region.outset(float2(reachOf(sigma[0]), reachOf(sigma[1])));
    return region;
}

PositionExtentInWorldSpace FastBilateralFilterCPUNode::changed(PositionExtentInWorldSpace const& inputRegion,
                                                               std::string inputName,
                                                               RegionMap const& inputDODs) {
    return needed(inputRegion, std::move(inputName), inputDODs);
}

DataFlow::Node::BlockedRange FastBilateralFilterCPUNode::rangeToProcess() {
    if (pPhase_ == nullptr) {
        return ImageFilter::rangeToProcess();
    }
    BlockedRange range = {};
    range.unitsPerItem = pPhase_->nUnits;
    range.items = pPhase_->nBands;
    return range;
}

void FastBilateralFilterCPUNode::processSlice(std::size_t begin, std::size_t end) {
    if (pPhase_ == nullptr) {
        ImageFilter::processSlice(begin, end);
        return;
    }
    (*pPhase_->pBody)(begin, end);
}

void FastBilateralFilterCPUNode::internalProcess() {
    prepareForRender();
    bPreparedForRender_ = false;
    DataFlow::ConstDataPointer<ImageCPU> spOutput = spOutputImage_;
    spOutputImage_.reset();
    ImageCPUReadAccessor read(*oInputImage_);
    bool bDone = true;
    if (oOutputRegionInPixels_.extent().width() > 0 && oOutputRegionInPixels_.extent().height() > 0) {
        // A bound image may be larger than the region: what lies outside is not touched.
        ImageCPU view = viewOf(*spOutput, oOutputRegionInPixels_);
        ImageCPUWriteAccessor write(view);
        SliceRunner runner(*this);
        float2 const sigma = oSpatialSigma_.value();
        bDone = oFilter_.applyFilter(&read, &write, oRangeSigma_.value(), sigma[0], sigma[1],
                                     oColorize_.value(), runner);
    }
    DataFlow::OutputConnector* const pOutput = imageOutput();
    ORVO_ENFORCE(pOutput);
    // A frame that was cancelled in between leaves an unfinished image, which is not handed on.
    if (bDone && !pOutput->bound()) {
        oOutputImage_.setData(spOutput);
    }
}

} // namespace ORVO
