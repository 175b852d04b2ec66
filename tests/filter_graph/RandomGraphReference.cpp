// What a random graph must give, computed without a graph.
#include "tests/filter_graph/RandomGraph.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <sstream>

#include "orvo/image_flow/filters/FastBilateralCPUFilter.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/images/ImageCPUWriteAccessor.h"
#include "tests/filter_graph/support/ColourGraph.h"

namespace ORVO::Test {

using FilterGraph::ImageDescriptor;

namespace {

constexpr float kSpoiled = 77.0f;

ImageCPU::tePixelFormat formatOf(ImageDescriptor::eChannelType type, std::size_t nChannels) {
    bool const bBytes = type == ImageDescriptor::CHANNEL_TYPE_UINT8;
    return nChannels == 3 ? (bBytes ? ImageCPU::PIXEL_FORMAT_RGB8 : ImageCPU::PIXEL_FORMAT_RGB32F)
                          : (bBytes ? ImageCPU::PIXEL_FORMAT_RGBA8 : ImageCPU::PIXEL_FORMAT_RGBA32F);
}

/// An image of the library on the pixels of a client's.
ImageCPU wrapped(AnyImage& image, ImageCPU::tePixelFormat format) {
    RasterValues const& rect = image.rect();
    ExtentInPixelSpace const extent(rect.width, rect.height);
    return {format, image.bytes(), PositionExtentInPixelSpace(PositionInPixelSpace(rect.x, rect.y), extent),
            PixelExtentInWorldSpace(), extent};
}

/// What two rectangles have in common, without values.
RasterValues common(RasterValues const& a, RasterValues const& b) {
    RasterValues result = a;
    result.values.clear();
    result.x = std::max(a.x, b.x);
    result.y = std::max(a.y, b.y);
    result.width = std::max(std::min(a.x + a.width, b.x + b.width) - result.x, 0);
    result.height = std::max(std::min(a.y + a.height, b.y + b.height) - result.y, 0);
    return result;
}

/// The values of the rectangle as packed R, G, B and A.
template <typename T>
std::vector<T> packed(RasterValues const& picture) {
    std::vector<T> aPixels;
    for (std::size_t i = 0; i < picture.values.size(); ++i) {
        aPixels.push_back(static_cast<T>(picture.values[i]));
        if (picture.channels == 3 && i % 3 == 2) {
            aPixels.push_back(T());
        }
    }
    return aPixels;
}

template <typename T>
void transform(RasterValues& picture, std::array<std::uint32_t, 2> const& codes) {
    std::vector<T> const aPixels = transformed(packed<T>(picture), codes[0], codes[1]);
    for (std::size_t i = 0; i < picture.values.size(); ++i) {
        picture.values[i] = aPixels[i / picture.channels * 4 + i % picture.channels];
    }
}

/// The smallest rectangle around both; an empty one adds nothing.
RasterValues around(RasterValues const& a, RasterValues const& b) {
    if (a.width == 0 || a.height == 0) {
        return b;
    }
    if (b.width == 0 || b.height == 0) {
        return a;
    }
    RasterValues result = a;
    result.x = std::min(a.x, b.x);
    result.y = std::min(a.y, b.y);
    result.width = std::max(a.x + a.width, b.x + b.width) - result.x;
    result.height = std::max(a.y + a.height, b.y + b.height) - result.y;
    return result;
}

} // namespace

float RandomGraph::quantised(float value) const {
    float const highest = eType_ == ImageDescriptor::CHANNEL_TYPE_UINT8 ? 255.0f : 65535.0f;
    return eType_ == ImageDescriptor::CHANNEL_TYPE_FLOAT32
               ? value
               : std::min(std::max(std::nearbyint(value), 0.0f), highest);
}

RasterValues RandomGraph::grown(RasterValues rect, Node const& node) const {
    auto const reach = [&](float sigma) {
        // As far as the filter says, which is told in world space.
        return static_cast<int>(std::ceil(sigma * 2.146f) / fPixelSize_);
    };
    int const marginX = node.kind == BLUR ? node.count : node.kind == BILATERAL ? reach(node.width) : 0;
    int const marginY = node.kind == BLUR ? node.count : node.kind == BILATERAL ? reach(node.height) : 0;
    rect.x -= marginX;
    rect.y -= marginY;
    rect.width += 2 * marginX;
    rect.height += 2 * marginY;
    return rect;
}

void RandomGraph::findInterests() {
    std::vector<Node*> aByRank;
    for (auto const& pNode : aNodes_) {
        pNode->interest = RasterValues();
        aByRank.push_back(pNode.get());
    }
    std::sort(aByRank.begin(), aByRank.end(), [](auto const* a, auto const* b) { return a->rank < b->rank; });
    pTop_->interest = oRequested_;
    for (Node* const pNode : aByRank) {
        for (Node* const pInput : pNode->aInputs) {
            pInput->interest = around(pInput->interest, grown(pNode->interest, *pNode));
        }
    }
}

RasterValues RandomGraph::evaluateBilateral(Node const& node, RasterValues const& input,
                                            RasterValues result) const {
    result.values.resize(static_cast<std::size_t>(result.width) * static_cast<std::size_t>(result.height) *
                         nChannels_);
    RasterValues const computed = common(result, node.interest);
    if (computed.width == 0 || computed.height == 0) {
        return result;
    }
    AnyImage source(eType_, fPixelSize_, input);
    AnyImage target(eType_, fPixelSize_, computed);
    ImageCPU const sourceImage = wrapped(source, formatOf(eType_, nChannels_));
    ImageCPU targetImage = wrapped(target, formatOf(eType_, nChannels_));
    ImageCPUReadAccessor reader(sourceImage);
    ImageCPUWriteAccessor writer(targetImage);
    FastBilateralCPUFilter().applyFilter(&reader, &writer, node.value, node.width, node.height,
                                         node.colorize);
    RasterValues const filtered = target.load();
    for (int y = computed.y; y < computed.y + computed.height; ++y) {
        for (int x = computed.x; x < computed.x + computed.width; ++x) {
            for (std::size_t channel = 0; channel < nChannels_; ++channel) {
                result.values[result.index(x, y, channel)] = filtered.at(x, y, channel);
            }
        }
    }
    return result;
}

RasterValues RandomGraph::evaluateTransformer(Node const& node, RasterValues input) const {
    if (eType_ == ImageDescriptor::CHANNEL_TYPE_UINT8) {
        transform<std::uint8_t>(input, node.codes);
    } else {
        transform<std::uint16_t>(input, node.codes);
    }
    return input;
}

RasterValues RandomGraph::evaluateDomain(Node const& node, std::vector<RasterValues> const& inputs) const {
    RasterValues domain;
    if (node.kind == SOURCE) {
        domain = node.spImage->rect();
    } else if (node.kind == GENERATOR) {
        domain.width = static_cast<int>(node.width);
        domain.height = static_cast<int>(node.height);
    } else {
        for (RasterValues const& input : inputs) {
            domain = around(domain, grown(input, node));
        }
    }
    domain.channels = nChannels_;
    domain.values.clear();
    return domain;
}

float RandomGraph::evaluatePixel(Node const& node, std::vector<RasterValues> const& inputs, int x, int y,
                                 std::size_t channel) const {
    switch (node.kind) {
    case GENERATOR:
        return node.value + 0.5f * static_cast<float>(x) + static_cast<float>(y) +
               static_cast<float>(channel);
    case ADD:
        return inputs[0].at(x, y, channel) + node.value;
    case GAIN:
    case SIMD_GAIN:
        return inputs[0].at(x, y, channel) * node.value;
    case MIX:
        return inputs[0].at(x, y, channel) * (1.0f - node.value) + inputs[1].at(x, y, channel) * node.value;
    case BLUR: {
        float sum = 0.0f;
        for (int row = y - node.count; row <= y + node.count; ++row) {
            for (int column = x - node.count; column <= x + node.count; ++column) {
                sum += inputs[0].at(column, row, channel);
            }
        }
        auto const side = static_cast<float>(2 * node.count + 1);
        return sum / (side * side);
    }
    case SOURCE:
    case BILATERAL:
    case TRANSFORMER:
    case KINDS:
        break;
    }
    return 0.0f;
}

RasterValues RandomGraph::evaluate(Node const& node, std::map<Node const*, RasterValues>& known) {
    auto const iKnown = known.find(&node);
    if (iKnown != known.end()) {
        return iKnown->second;
    }
    std::vector<RasterValues> inputs;
    for (Node const* const pInput : node.aInputs) {
        inputs.push_back(evaluate(*pInput, known));
    }
    RasterValues result = evaluateDomain(node, inputs);
    if (node.kind == SOURCE) {
        result = node.spImage->load();
    } else if (node.kind == BILATERAL) {
        result = evaluateBilateral(node, inputs[0], result);
    } else if (node.kind == TRANSFORMER) {
        result = evaluateTransformer(node, inputs[0]);
    } else {
        for (int y = result.y; y < result.y + result.height; ++y) {
            for (int x = result.x; x < result.x + result.width; ++x) {
                for (std::size_t channel = 0; channel < nChannels_; ++channel) {
                    result.values.push_back(quantised(evaluatePixel(node, inputs, x, y, channel)));
                }
            }
        }
    }
    return known[&node] = result;
}

void RandomGraph::spoilOutput() {
    RasterValues spoiled = spOutput_->load();
    std::fill(spoiled.values.begin(), spoiled.values.end(), kSpoiled);
    spOutput_->store(spoiled);
}

RasterValues RandomGraph::expectedOutput() {
    findInterests();
    std::map<Node const*, RasterValues> known;
    RasterValues const result = evaluate(*pTop_, known);
    RasterValues expected = spOutput_->load();
    for (int y = expected.y; y < expected.y + expected.height; ++y) {
        for (int x = expected.x; x < expected.x + expected.width; ++x) {
            for (std::size_t channel = 0; channel < nChannels_; ++channel) {
                bool const bWritten = oRequested_.contains(x, y) && result.contains(x, y);
                expected.values[expected.index(x, y, channel)] =
                    bWritten ? result.at(x, y, channel) : kSpoiled;
            }
        }
    }
    return expected;
}

std::size_t RandomGraph::numberOf(eKind kind) const {
    return static_cast<std::size_t>(std::count_if(aNodes_.begin(), aNodes_.end(),
                                                  [kind](auto const& pNode) { return pNode->kind == kind; }));
}

bool RandomGraph::isOutputRight() {
    std::vector<float> const expected = expectedOutput().values;
    std::vector<float> const computed = spOutput_->load().values;
    return std::memcmp(expected.data(), computed.data(), expected.size() * sizeof(float)) == 0;
}

std::string RandomGraph::describeDifference() {
    static char const* const kNames[] = {"source", "generator", "add",       "gain",       "blur",
                                         "mix",    "simd gain", "bilateral", "transformer"};
    RasterValues const expected = expectedOutput();
    RasterValues const computed = spOutput_->load();
    std::ostringstream text;
    for (std::size_t i = 0; i < expected.values.size(); ++i) {
        if (std::memcmp(&expected.values[i], &computed.values[i], sizeof(float)) != 0) {
            auto const pixel = static_cast<int>(i / nChannels_);
            text << "pixel (" << expected.x + pixel % expected.width << ", "
                 << expected.y + pixel / expected.width << "), channel " << i % nChannels_ << ": computed "
                 << computed.values[i] << ", expected " << expected.values[i] << "\n";
            break;
        }
    }
    text << "output " << expected.x << ", " << expected.y << ", " << expected.width << " x "
         << expected.height << ", type " << static_cast<int>(eType_) << ", " << nChannels_ << " channels\n";
    for (auto const& pNode : aNodes_) {
        text << pNode.get() << " " << kNames[pNode->kind] << " " << pNode->value << " " << pNode->count
             << " from";
        for (Node const* const pInput : pNode->aInputs) {
            text << " " << pInput;
        }
        text << "\n";
    }
    return text.str();
}

} // namespace ORVO::Test
