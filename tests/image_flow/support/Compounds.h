/// Nodes that run a graph of their own around another node.
#pragma once

#include "tests/image_flow/support/TestNodes.h"

#include <memory>
#include <string>
#include <utility>

#include "orvo/image_flow/controllers/Bedding.h"
#include "orvo/image_flow/nodes/CompoundFilterBase.h"
#include "orvo/image_flow/sources/ImageGPUInput.h"
#include "orvo/image_flow/sources/ImageGPUOutput.h"

namespace ORVO::Test {

/// Images in host memory, and how they go in and out of a graph.
struct HostRoad {
    using Image = ImageCPU;
    using Source = ImageCPUInput;
    using Sink = ImageCPUOutput;
    static constexpr TargetPlatform eTarget = ORVO_TARGET_CPU;
    static void give(Source& source, Image* pImage) { source.setImageCPUWithNoOwnership(pImage); }
    static Image* take(Sink& sink) { return sink.releaseImageCPU(); }
};

/// The same for textures.
struct TextureRoad {
    using Image = ImageGPU;
    using Source = ImageGPUInput;
    using Sink = ImageGPUOutput;
    static constexpr TargetPlatform eTarget = ORVO_TARGET_GL;
    static void give(Source& source, Image* pImage) { source.setImageGPUWithNoOwnership(pImage); }
    static Image* take(Sink& sink) { return sink.releaseImageGPU(); }
};

/// A filter that does what the filter inside it does: source -> that filter -> sink.
template <typename Road>
class CompoundOf : public ImageFilter, public CompoundFilterBase {
public:
    explicit CompoundOf(std::unique_ptr<ImageFilter> upInner)
        : ImageFilter("Compound", OUTPUT_PRECISION_DEFAULT),
          oInput_("in", this),
          oOutput_("out", this),
          upInner_(std::move(upInner)) {
        inputTarget_ = Road::eTarget;
        outputTarget_ = Road::eTarget;
        addImageInput(&oInput_);
        setImageOutput(&oOutput_);
        feed(*upInner_, 0, oSource_);
        feed(oSink_, 0, *upInner_);
        addNode(&oSource_);
        addNode(upInner_.get());
        addNode(&oSink_);
        plantMasterTree(oSink_);
    }
    ~CompoundOf() override {
        oSink_.disconnect();
        upInner_->disconnect();
        disconnect();
    }

    bool willRunInHardware() override { return Road::eTarget == ORVO_TARGET_GL; }
    PositionExtentInWorldSpace needed(PositionExtentInWorldSpace const& outputRegion, std::string,
                                      RegionMap const& inputDODs) override {
        return upInner_->needed(outputRegion, upInner_->imageInput(0)->name(), inputDODs);
    }
    PositionExtentInWorldSpace changed(PositionExtentInWorldSpace const& inputRegion, std::string,
                                       RegionMap const& inputDODs) override {
        return upInner_->changed(inputRegion, upInner_->imageInput(0)->name(), inputDODs);
    }

    /// Lets the inner graph, and those inside it, run in a context.
    void setContext(OGL::Context const& context) {
        pBedding_->setContextGPU_DEPRECATED_1_0(context);
        if (auto* const pInner = dynamic_cast<CompoundOf*>(upInner_.get()))
            pInner->setContext(context);
    }

    ImageFilter& inner() { return *upInner_; }
    ImageFlowController& innerController() { return *CompoundFilterBase::pController_; }

    using CompoundFilterBase::aEmitters_;
    using CompoundFilterBase::aImageFilters_;
    using CompoundFilterBase::eHint_;
    using CompoundFilterBase::internalProcess;
    using CompoundFilterBase::propagatePrecisionHint;

    void internalProcess() override {
        bPreparedForRender_ = false;
        propagatePrecisionHint(outputPrecisionHint());
        Road::give(oSource_, const_cast<typename Road::Image*>(oInput_.get()));
        CompoundFilterBase::internalProcess(computeRegionParameter().value());
        oOutput_.setData(Road::take(oSink_));
        oSource_.clear();
    }

private:
    DataFlow::ConstInput<typename Road::Image> oInput_;
    DataFlow::ConstOutput<typename Road::Image> oOutput_;
    typename Road::Source oSource_;
    typename Road::Sink oSink_;
    std::unique_ptr<ImageFilter> upInner_;
};

using HostCompound = CompoundOf<HostRoad>;
using TextureCompound = CompoundOf<TextureRoad>;

/// A filter in a compound in a compound.
template <typename Road>
std::unique_ptr<CompoundOf<Road>> nestedTwice(std::unique_ptr<ImageFilter> upInner) {
    return std::make_unique<CompoundOf<Road>>(std::make_unique<CompoundOf<Road>>(std::move(upInner)));
}

} // namespace ORVO::Test
