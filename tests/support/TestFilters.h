/// Small filters for tests of the compiler and of frames. All of them work on CPU images with 1 to 4 channels
/// of 8-bit, 16-bit or float values, which are taken as the plain numbers that are stored. Reading outside an
/// image gives 0.
#pragma once

#include <array>
#include <atomic>
#include <cstddef>
#include <memory>
#include <string>

#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/filter_graph/internal/ImageFlowFilter.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/images/ImageCPU.h"

namespace ORVO::Test {

/// One channel of one pixel, by its position in pixel space; 0 outside the image.
float readChannel(ImageCPU const& image, int x, int y, std::size_t channel);

/// Sets it, rounded to the nearest number that the format has.
void writeChannel(ImageCPU& image, int x, int y, std::size_t channel, float value);

/// What all test nodes share: an output "output", and a parameter "id" under which the node counts its runs.
class TestNode : public ImageFilter {
public:
    static constexpr std::size_t kIds = 64;

    /// Runs of all nodes whose "id" is `id`, since the last `resetRuns`.
    static int runs(int id);
    static void resetRuns();

    void processSlice(std::size_t begin, std::size_t end) override;

protected:
    explicit TestNode(char const* name);

    /// The value of one channel of one pixel of the output, in pixel space.
    virtual float value(int x, int y, std::size_t channel) const = 0;

    void internalProcess() override;

    DataFlow::ConstOutput<ImageCPU> oOutput_;
    DataFlow::Parameter<int> oId_;
};

/// A test node with the one input "input".
class UnaryNode : public TestNode {
protected:
    explicit UnaryNode(char const* name);

    float value(int x, int y, std::size_t channel) const override;
    float inputAt(int x, int y, std::size_t channel) const { return readChannel(*oInput_, x, y, channel); }

    DataFlow::ConstInput<ImageCPU> oInput_;
};

/// input + "value".
class AddConstantNode : public UnaryNode {
public:
    AddConstantNode();

protected:
    float value(int x, int y, std::size_t channel) const override;

private:
    DataFlow::Parameter<float> oValue_;
};

/// input * "gain".
class GainNode : public UnaryNode {
public:
    GainNode();

protected:
    float value(int x, int y, std::size_t channel) const override;

private:
    DataFlow::Parameter<float> oGain_;
};

/// The mean over a square of 2 * "radius" + 1 pixels, row by row: it needs more of its input than it gives.
class BlurNode : public UnaryNode {
public:
    BlurNode();

    PositionExtentInWorldSpace needed(PositionExtentInWorldSpace const& outputRegion, std::string inputName,
                                      RegionMap const& inputDODs) override;
    PositionExtentInWorldSpace changed(PositionExtentInWorldSpace const& inputRegion, std::string inputName,
                                       RegionMap const& inputDODs) override;

protected:
    float value(int x, int y, std::size_t channel) const override;

private:
    PositionExtentInWorldSpace grown(PositionExtentInWorldSpace region) const;

    DataFlow::Parameter<int> oRadius_;
};

/// a * (1 - "amount") + b * "amount", with the inputs "a" and "b".
class MixNode : public TestNode {
public:
    MixNode();

protected:
    float value(int x, int y, std::size_t channel) const override;

private:
    DataFlow::ConstInput<ImageCPU> oInputA_;
    DataFlow::ConstInput<ImageCPU> oInputB_;
    DataFlow::Parameter<float> oAmount_;
};

/// No input: "value" + x / 2 + y + channel on the world rectangle of "width" by "height" at the origin.
/// "channels" is the number of its channels.
class GeneratorNode : public TestNode {
public:
    GeneratorNode();

    PositionExtentInWorldSpace generated(RegionMap const& inputDODs) override;

protected:
    std::size_t getNumChannelsOutput() override;
    float value(int x, int y, std::size_t channel) const override;

private:
    DataFlow::Parameter<float> oValue_;
    DataFlow::Parameter<float> oWidth_;
    DataFlow::Parameter<float> oHeight_;
    DataFlow::Parameter<int> oChannels_;
};

/// input, unless "mode" asks for a failure.
class ThrowingNode : public UnaryNode {
public:
    /// Values of "mode".
    enum eMode { QUIET = 0, IN_PROCESS = 1, IN_SLICE = 2, FOREIGN_IN_SLICE = 3, FOREIGN_IN_PROCESS = 4 };

    ThrowingNode();
    void processSlice(std::size_t begin, std::size_t end) override;

protected:
    void internalProcess() override;

private:
    DataFlow::Parameter<int> oMode_;
};

/// input, after a sleep of "microseconds" in each slice, and not before the gate is open.
class SlowNode : public UnaryNode {
public:
    SlowNode();
    void processSlice(std::size_t begin, std::size_t end) override;

    /// A closed gate holds every slice of every slow node.
    static void closeGate() { bGateClosed.store(true); }
    static void openGate() { bGateClosed.store(false); }

    /// Number of slices that have begun since the start of the program.
    static int slicesBegun() { return nSlicesBegun.load(); }

private:
    static std::atomic<bool> bGateClosed;
    static std::atomic<int> nSlicesBegun;

    DataFlow::Parameter<int> oMicroseconds_;
};

/// input * "gain", on images in the SIMD-optimised layout: fails where its input or output is in another.
class SIMDGainNode : public UnaryNode {
public:
    SIMDGainNode();
    bool isSIMD() const override;

protected:
    void internalProcess() override;
    float value(int x, int y, std::size_t channel) const override;

private:
    DataFlow::Parameter<float> oGain_;
};

/// A filter of the node class `Node`, initialised, on the CPU, whose identifier has the given name.
template <typename Node>
std::shared_ptr<FilterGraph::Internal::Filter> makeFilter(std::string const& name = "test filter") {
    FilterGraph::Internal::ImageFlowFilter<Node> prototype(
        FilterGraph::IFilter::Identifier(name, "test", "ORVO", 1), ORVO_TARGET_CPU);
    prototype.initialize();
    return prototype.clone();
}

/// Sets a parameter of a filter.
template <typename T>
void setParameter(FilterGraph::IFilter& filter, std::string const& name, T const& value);

extern template void setParameter<int>(FilterGraph::IFilter&, std::string const&, int const&);
extern template void setParameter<float>(FilterGraph::IFilter&, std::string const&, float const&);

} // namespace ORVO::Test
