#include "tests/support/TestFilters.h"

#include <chrono>
#include <cmath>
#include <cstring>
#include <stdexcept>
#include <thread>

#include "orvo/core/Check.h"
#include "orvo/core/spaces/Spaces.h"
#include "orvo/core/utility/SaturatingCast.h"
#include "orvo/filter_graph/impl/Parameter.h"

namespace ORVO::Test {

namespace {

std::array<std::atomic<int>, TestNode::kIds> aRuns;

/// The first byte of a channel, or null outside the image.
unsigned char* channelAddress(ImageCPU const& image, int x, int y, std::size_t channel) {
    PositionExtentInPixelSpace const rect = image.positionExtent();
    int const column = x - rect.position().x();
    int const row = y - rect.position().y();
    if (column < 0 || row < 0 || column >= rect.extent().width() || row >= rect.extent().height()) {
        return nullptr;
    }
    auto const pitch = static_cast<std::size_t>(image.capacityExtent().width());
    std::size_t const pixel = static_cast<std::size_t>(row) * pitch + static_cast<std::size_t>(column);
    std::size_t const offset =
        pixel * pixelSizeBytes(image.pixelFormat()) + channel * (channelSizeBits(image.pixelFormat()) / 8);
    return const_cast<unsigned char*>(image.pixels()) + offset;
}

template <typename T>
float loadAs(unsigned char const* pAddress) {
    T value;
    std::memcpy(&value, pAddress, sizeof value);
    return static_cast<float>(value);
}

template <typename T>
void storeAs(unsigned char* pAddress, T value) {
    std::memcpy(pAddress, &value, sizeof value);
}

} // namespace

float readChannel(ImageCPU const& image, int x, int y, std::size_t channel) {
    unsigned char const* const pAddress = channelAddress(image, x, y, channel);
    if (!pAddress) {
        return 0.0f;
    }
    switch (channelSizeBits(image.pixelFormat())) {
    case 8:
        return loadAs<std::uint8_t>(pAddress);
    case 16:
        return loadAs<std::uint16_t>(pAddress);
    default:
        return loadAs<float>(pAddress);
    }
}

void writeChannel(ImageCPU& image, int x, int y, std::size_t channel, float value) {
    unsigned char* const pAddress = channelAddress(image, x, y, channel);
    ORVO_ENFORCE(pAddress);
    switch (channelSizeBits(image.pixelFormat())) {
    case 8:
        storeAs(pAddress, saturatingCast<std::uint8_t>(std::nearbyint(value)));
        break;
    case 16:
        storeAs(pAddress, saturatingCast<std::uint16_t>(std::nearbyint(value)));
        break;
    default:
        storeAs(pAddress, value);
    }
}

TestNode::TestNode(char const* name)
    : ImageFilter(name, OUTPUT_PRECISION_DEFAULT), oOutput_("output", this), oId_(0, "id") {
    inputTarget_ = ORVO_TARGET_CPU;
    outputTarget_ = ORVO_TARGET_CPU;
    setImageOutput(&oOutput_);
    registerParameter(&oId_);
}

int TestNode::runs(int id) { return aRuns.at(static_cast<std::size_t>(id)).load(); }

void TestNode::resetRuns() {
    for (auto& nRuns : aRuns) {
        nRuns.store(0);
    }
}

void TestNode::internalProcess() {
    ++aRuns.at(static_cast<std::size_t>(oId_.value()));
    ImageFilter::internalProcess();
}

void TestNode::processSlice(std::size_t begin, std::size_t end) {
    ImageCPU& image = *spOutputImage_;
    int const beginX = oOutputRegionInPixels_.position().x();
    int const endX = beginX + oOutputRegionInPixels_.extent().width();
    int const top = oOutputRegionInPixels_.position().y();
    std::size_t const channels = nChannels(image.pixelFormat());
    for (int y = top + static_cast<int>(begin); y < top + static_cast<int>(end); ++y) {
        for (int x = beginX; x < endX; ++x) {
            for (std::size_t channel = 0; channel < channels; ++channel) {
                writeChannel(image, x, y, channel, value(x, y, channel));
            }
        }
    }
}

UnaryNode::UnaryNode(char const* name) : TestNode(name), oInput_("input", this) { addImageInput(&oInput_); }

float UnaryNode::value(int x, int y, std::size_t channel) const { return inputAt(x, y, channel); }

AddConstantNode::AddConstantNode() : UnaryNode("AddConstant"), oValue_(1.0f, "value") {
    registerParameter(&oValue_);
}

float AddConstantNode::value(int x, int y, std::size_t channel) const {
    return inputAt(x, y, channel) + oValue_.value();
}

GainNode::GainNode() : UnaryNode("Gain"), oGain_(1.0f, "gain") { registerParameter(&oGain_); }

float GainNode::value(int x, int y, std::size_t channel) const {
    return inputAt(x, y, channel) * oGain_.value();
}

BlurNode::BlurNode() : UnaryNode("Blur"), oRadius_(1, "radius") { registerParameter(&oRadius_); }

PositionExtentInWorldSpace BlurNode::grown(PositionExtentInWorldSpace region) const {
    auto const radius = static_cast<float>(oRadius_.value());
    PixelExtentInWorldSpace const pixel = outputPixelExtent();
    region.outset(float2(radius * pixel.width(), radius * pixel.height()));
    return region;
}

PositionExtentInWorldSpace BlurNode::needed(PositionExtentInWorldSpace const& outputRegion, std::string,
                                            RegionMap const&) {
    return grown(outputRegion);
}

PositionExtentInWorldSpace BlurNode::changed(PositionExtentInWorldSpace const& inputRegion, std::string,
                                             RegionMap const&) {
    return grown(inputRegion);
}

float BlurNode::value(int x, int y, std::size_t channel) const {
    int const radius = oRadius_.value();
    float sum = 0.0f;
    for (int row = y - radius; row <= y + radius; ++row) {
        for (int column = x - radius; column <= x + radius; ++column) {
            sum += inputAt(column, row, channel);
        }
    }
    auto const side = static_cast<float>(2 * radius + 1);
    return sum / (side * side);
}

MixNode::MixNode() : TestNode("Mix"), oInputA_("a", this), oInputB_("b", this), oAmount_(0.5f, "amount") {
    addImageInput(&oInputA_);
    addImageInput(&oInputB_);
    registerParameter(&oAmount_);
}

float MixNode::value(int x, int y, std::size_t channel) const {
    float const amount = oAmount_.value();
    return readChannel(*oInputA_, x, y, channel) * (1.0f - amount) +
           readChannel(*oInputB_, x, y, channel) * amount;
}

GeneratorNode::GeneratorNode()
    : TestNode("Generator"),
      oValue_(0.0f, "value"),
      oWidth_(4.0f, "width"),
      oHeight_(4.0f, "height"),
      oChannels_(1, "channels") {
    registerParameter(&oValue_);
    registerParameter(&oWidth_);
    registerParameter(&oHeight_);
    registerParameter(&oChannels_);
}

PositionExtentInWorldSpace GeneratorNode::generated(RegionMap const&) {
    return PositionExtentInWorldSpace(ExtentInWorldSpace(oWidth_.value(), oHeight_.value()));
}

std::size_t GeneratorNode::getNumChannelsOutput() { return static_cast<std::size_t>(oChannels_.value()); }

float GeneratorNode::value(int x, int y, std::size_t channel) const {
    return oValue_.value() + 0.5f * static_cast<float>(x) + static_cast<float>(y) +
           static_cast<float>(channel);
}

ThrowingNode::ThrowingNode() : UnaryNode("Throwing"), oMode_(QUIET, "mode") { registerParameter(&oMode_); }

void ThrowingNode::internalProcess() {
    if (oMode_.value() == IN_PROCESS) {
        ORVO_FAIL("thrown in process");
    }
    if (oMode_.value() == FOREIGN_IN_PROCESS) {
        throw std::runtime_error("foreign, thrown in process");
    }
    TestNode::internalProcess();
}

void ThrowingNode::processSlice(std::size_t begin, std::size_t end) {
    if (oMode_.value() == IN_SLICE) {
        ORVO_FAIL("thrown in slice");
    }
    if (oMode_.value() == FOREIGN_IN_SLICE) {
        throw std::runtime_error("foreign, thrown in slice");
    }
    TestNode::processSlice(begin, end);
}

std::atomic<bool> SlowNode::bGateClosed{false};
std::atomic<int> SlowNode::nSlicesBegun{0};

SlowNode::SlowNode() : UnaryNode("Slow"), oMicroseconds_(0, "microseconds") {
    registerParameter(&oMicroseconds_);
}

void SlowNode::processSlice(std::size_t begin, std::size_t end) {
    ++nSlicesBegun;
    while (bGateClosed.load()) {
        std::this_thread::sleep_for(std::chrono::microseconds(50));
    }
    if (oMicroseconds_.value() > 0) {
        std::this_thread::sleep_for(std::chrono::microseconds(oMicroseconds_.value()));
    }
    TestNode::processSlice(begin, end);
}

SIMDGainNode::SIMDGainNode() : UnaryNode("SIMDGain"), oGain_(1.0f, "gain") { registerParameter(&oGain_); }

bool SIMDGainNode::isSIMD() const { return true; }

void SIMDGainNode::internalProcess() {
    ORVO_CHECK(oInput_->isInSIMDOptimizedFormat());
    prepareForRender();
    ORVO_CHECK(spOutputImage_->isInSIMDOptimizedFormat());
    TestNode::internalProcess();
}

float SIMDGainNode::value(int x, int y, std::size_t channel) const {
    return inputAt(x, y, channel) * oGain_.value();
}

template <typename T>
void setParameter(FilterGraph::IFilter& filter, std::string const& name, T const& value) {
    FilterGraph::ParameterBase* const pParameter = filter.parameter(name);
    ORVO_ENFORCE(pParameter);
    pParameter->as<T>().setValue(value);
}

template void setParameter<int>(FilterGraph::IFilter&, std::string const&, int const&);
template void setParameter<float>(FilterGraph::IFilter&, std::string const&, float const&);

} // namespace ORVO::Test
