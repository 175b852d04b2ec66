/// Image nodes and graphs for tests, with everything that a subclass of ImageFilter can reach made public.
#pragma once

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/connectors/Connect.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_flow/sources/ImageCPUInput.h"
#include "orvo/image_flow/sources/ImageCPUOutput.h"

#include <algorithm>
#include <atomic>
#include <cstring>
#include <initializer_list>
#include <limits>
#include <memory>
#include <string>
#include <vector>

namespace ORVO::Test {

inline PositionExtentInWorldSpace world(float x, float y, float width, float height) {
    return {PositionInWorldSpace(x, y), ExtentInWorldSpace(width, height)};
}

inline PositionExtentInPixelSpace pixels(int x, int y, int width, int height) {
    return {PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height)};
}

inline PositionExtentInWorldSpace infiniteWorld() {
    float const infinity = std::numeric_limits<float>::infinity();
    return PositionExtentInWorldSpace(ExtentInWorldSpace(infinity, infinity));
}

/// The storage of a float image: row `y`, column `x` in pixel space.
inline float* pixelAt(ImageCPU& image, int x, int y) {
    auto const n = static_cast<std::ptrdiff_t>(nChannels(image.pixelFormat()));
    return reinterpret_cast<float*>(image.pixels()) +
           (std::ptrdiff_t(y - image.position().y()) * image.capacityExtent().width() + x -
            image.position().x()) *
               n;
}

inline float const* pixelAt(ImageCPU const& image, int x, int y) {
    return pixelAt(const_cast<ImageCPU&>(image), x, y);
}

/// A CPU node with any number of inputs "in0", "in1", ... and, unless told otherwise, the output "out". On
/// images of 32-bit floats it adds `fOffset_` to the mean of its inputs over a window of `iRadius_` pixels
/// around each pixel, cut off at the edges of the inputs.
class TestFilter : public ImageFilter {
public:
    explicit TestFilter(std::size_t nInputs = 1, bool bOutput = true, char const* name = "TestFilter",
                        teOutputPrecisionHint hint = OUTPUT_PRECISION_32_BIT_FLOAT)
        : ImageFilter(name, hint), oOutput_("out", this), oOffset_(0.0f, "offset") {
        inputTarget_ = ORVO_TARGET_CPU;
        outputTarget_ = ORVO_TARGET_CPU;
        nForcedChannels_ = 1;
        for (std::size_t i = 0; i < nInputs; ++i) {
            aInputs_.push_back(
                std::make_unique<DataFlow::ConstInput<ImageCPU>>("in" + std::to_string(i), this));
            addImageInput(aInputs_.back().get());
        }
        if (bOutput) {
            setImageOutput(&oOutput_);
        }
        registerParameter(&oOffset_);
    }

    ~TestFilter() override { disconnect(); }

    PositionExtentInWorldSpace needed(PositionExtentInWorldSpace const& outputRegion, std::string inputName,
                                      RegionMap const& inputDODs) override {
        ++nNeeded_;
        return grown(ImageFilter::needed(outputRegion, inputName, inputDODs));
    }

    PositionExtentInWorldSpace changed(PositionExtentInWorldSpace const& inputRegion, std::string inputName,
                                       RegionMap const& inputDODs) override {
        aChanged_.push_back(inputName);
        return grown(ImageFilter::changed(inputRegion, inputName, inputDODs));
    }

    void processSlice(std::size_t begin, std::size_t end) override {
        nRows_ += end - begin;
        if (bThrow_) {
            ORVO_FAIL("slice failed");
        }
        if (pImageOutput_ == nullptr) {
            return;
        }
        int const left = oOutputRegionInPixels_.position().x();
        int const right = left + oOutputRegionInPixels_.extent().width();
        int const top = oOutputRegionInPixels_.position().y();
        for (int y = top + int(begin); y < top + int(end); ++y) {
            for (int x = left; x < right; ++x) {
                for (std::size_t c = 0; c < nForcedChannels_; ++c) {
                    pixelAt(*spOutputImage_, x, y)[c] = compute(x, y, c);
                }
            }
        }
    }

    void internalProcess() override {
        ++nRuns_;
        ImageFilter::internalProcess();
    }

    float compute(int x, int y, std::size_t c) const {
        double sum = 0;
        double n = 0;
        for (auto const& upInput : aInputs_) {
            ImageCPU const& image = **upInput;
            int const x0 = std::max(x - iRadius_, image.position().x());
            int const x1 = std::min(x + iRadius_ + 1, image.position().x() + image.extent().width());
            int const y0 = std::max(y - iRadius_, image.position().y());
            int const y1 = std::min(y + iRadius_ + 1, image.position().y() + image.extent().height());
            for (int v = y0; v < y1; ++v) {
                for (int u = x0; u < x1; ++u) {
                    sum += double(pixelAt(image, u, v)[c]);
                    n += 1;
                }
            }
        }
        return float((n == 0 ? 0.0 : sum / n) + double(oOffset_.value()));
    }

    PositionExtentInWorldSpace grown(PositionExtentInWorldSpace region) const {
        auto const iter = spPixelExtentSet_->aOutputPixelExtents_.find("out");
        PixelExtentInWorldSpace const pixel =
            iter == spPixelExtentSet_->aOutputPixelExtents_.end() ? PixelExtentInWorldSpace() : iter->second;
        region.outset(float2(float(iRadius_) * pixel.width(), float(iRadius_) * pixel.height()));
        return region;
    }

    DataFlow::ConstInput<ImageCPU>& in(std::size_t i = 0) { return *aInputs_[i]; }
    DataFlow::ConstOutput<ImageCPU>& out() { return oOutput_; }

    using ImageFilter::aParentROIs_;
    using ImageFilter::bPreparedForRender_;
    using ImageFilter::getNumChannelsOutput;
    using ImageFilter::inputTarget_;
    using ImageFilter::nChannels_;
    using ImageFilter::nForcedChannels_;
    using ImageFilter::oOutputRegionInPixels_;
    using ImageFilter::outputPixelExtent;
    using ImageFilter::outputPrecisionHint;
    using ImageFilter::outputTarget_;
    using ImageFilter::pixelFormatFor;
    using ImageFilter::postProcess;
    using ImageFilter::preparedForRender;
    using ImageFilter::preProcess;
    using ImageFilter::spComputeRegion_;
    using ImageFilter::spOutputImage_;
    using ImageFilter::spOutputPrecision_;
    using ImageFilter::spPixelExtentSet;

    int iRadius_ = 0;
    bool bThrow_ = false;
    int nRuns_ = 0;
    int nNeeded_ = 0;
    std::atomic<std::size_t> nRows_{0};
    std::vector<std::string> aChanged_;
    std::vector<std::unique_ptr<DataFlow::ConstInput<ImageCPU>>> aInputs_;
    DataFlow::ConstOutput<ImageCPU> oOutput_;
    DataFlow::Parameter<float> oOffset_;
};

/// Connects, on a clone of the output where that is taken already.
inline void feed(ImageFilter& consumer, std::size_t iInput, ImageFilter& producer) {
    DataFlow::OutputConnector* pOutput = producer.imageOutput();
    if (pOutput->connectedInput() != nullptr) {
        pOutput = producer.cloneImageOutput();
    }
    DataFlow::Connect(*consumer.imageInput(iInput), *pOutput);
}

/// Gives the nodes to a controller, in this order, and tells it the sink.
inline void plant(ImageFlowController& controller, std::initializer_list<DataFlow::Node*> nodes,
                  ImageFilter& sink) {
    for (DataFlow::Node* pNode : nodes) {
        controller.addNode(pNode);
    }
    controller.setImageSink(sink);
}

/// A node of another kind with an image output "out".
class ForeignNode : public DataFlow::Node {
public:
    ForeignNode() : Node("foreign"), oOutput_("out", this) { addOutput(&oOutput_); }
    ~ForeignNode() override { disconnect(); }
    DataFlow::ConstOutput<ImageCPU> oOutput_;
};

/// A new image of one-channel floats; `value(x, y)` is called in pixel space.
template <typename Value>
std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>> floatImage(PositionExtentInPixelSpace const& region,
                                                            Value value) {
    std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>> upImage(ORVO_NEW ImageCPU(
        ImageCPU::PIXEL_FORMAT_LUMINANCE32F, region, PixelExtentInWorldSpace(), ExtentInPixelSpace()));
    for (int y = 0; y < region.extent().height(); ++y) {
        for (int x = 0; x < region.extent().width(); ++x) {
            int const px = region.position().x() + x;
            int const py = region.position().y() + y;
            *pixelAt(*upImage, px, py) = value(px, py);
        }
    }
    return upImage;
}

/// Tells sources to run once more.
inline void emitAll(ImageFlowController& controller) {
    for (auto iter = controller.nodesBegin(); iter != controller.nodesEnd(); ++iter) {
        if ((*iter)->canEmit()) {
            (*iter)->emit();
        }
    }
}

/// Disconnects a node before its connectors go.
class NodeScope {
public:
    explicit NodeScope(DataFlow::Node& node) : node_(node) {}
    ~NodeScope() { node_.disconnect(); }
    NodeScope(NodeScope const&) = delete;
    NodeScope& operator=(NodeScope const&) = delete;

private:
    DataFlow::Node& node_;
};

} // namespace ORVO::Test
