/// A graph of a source, one filter and a sink.
#pragma once

#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "orvo/image_flow/sources/ImageCPUInput.h"
#include "orvo/image_flow/sources/ImageCPUOutput.h"
#include "tests/image_flow/support/TestNodes.h"

namespace ORVO::Test {

template <typename Filter>
class FilterRoad {
public:
    FilterRoad() {
        feed(oFilter_, 0, oSource_);
        oController_.addNode(&oSource_);
        oController_.addNode(&oFilter_);
        oController_.setImageSink(oFilter_);
    }
    ~FilterRoad() {
        oFilter_.disconnect();
        oSink_.disconnect();
    }

    ImageCPUInput& source() { return oSource_; }
    Filter& filter() { return oFilter_; }
    ImageFlowController& controller() { return oController_; }

    /// Runs a frame into an image of the graph's own, which lives until the next frame; null if there is no
    /// result.
    ImageCPU const* run(ImageCPU& image, PositionExtentInWorldSpace const& region) {
        if (oFilter_.imageOutput()->connectedInput() == nullptr) {
            feed(oSink_, 0, oFilter_);
            oController_.addNode(&oSink_);
            oController_.setImageSink(oSink_);
        }
        launch(image, region);
        return oSink_.getImageCPU();
    }

    /// Runs a frame into the given image.
    void runInto(ImageCPU& image, ImageCPU& target, PositionExtentInWorldSpace const& region) {
        oFilter_.setBoundOutputImage(&target);
        launch(image, region);
    }

private:
    void launch(ImageCPU& image, PositionExtentInWorldSpace const& region) {
        oController_.flushGraph();
        oSource_.setImageCPUWithNoOwnership(&image);
        oSource_.emit();
        oController_.computeRegions(region);
        oController_.process();
    }

    ImageFlowController oController_;
    ImageCPUInput oSource_;
    Filter oFilter_;
    ImageCPUOutput oSink_;
};

/// The world rectangle of a picture at a pixel extent of 1.
template <typename Picture>
PositionExtentInWorldSpace worldOf(Picture const& picture) {
    return world(float(picture.x), float(picture.y), float(picture.width), float(picture.height));
}

} // namespace ORVO::Test
