#include "tests/filter_graph/RandomGraph.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <set>
#include <sstream>

namespace ORVO::Test {

using FilterGraph::ImageDescriptor;

namespace {

constexpr float kSpoiled = 77.0f;

std::size_t bytesOf(ImageDescriptor::eChannelType type) {
    return type == ImageDescriptor::CHANNEL_TYPE_UINT8      ? 1
           : type == ImageDescriptor::CHANNEL_TYPE_UINT15_1 ? 2
                                                            : 4;
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

PositionExtentInWorldSpace worldOf(RasterValues const& rect, float pixelSize) {
    return {
        PositionInWorldSpace(static_cast<float>(rect.x) * pixelSize, static_cast<float>(rect.y) * pixelSize),
        ExtentInWorldSpace(static_cast<float>(rect.width) * pixelSize,
                           static_cast<float>(rect.height) * pixelSize)};
}

} // namespace

std::size_t RasterValues::index(int px, int py, std::size_t channel) const {
    return (static_cast<std::size_t>(py - y) * static_cast<std::size_t>(width) +
            static_cast<std::size_t>(px - x)) *
               channels +
           channel;
}

float RasterValues::at(int px, int py, std::size_t channel) const {
    return contains(px, py) ? values[index(px, py, channel)] : 0.0f;
}

// ---- Images

AnyImage::AnyImage(ImageDescriptor::eChannelType type, float pixelSize, RasterValues const& picture)
    : eType_(type),
      oRect_(picture),
      aBytes_(static_cast<std::size_t>(picture.width) * static_cast<std::size_t>(picture.height) *
              picture.channels * bytesOf(type)),
      oHandle_(FilterGraph::ImageDescriptorCPU({picture.channels, type},
                                               PixelExtentInWorldSpace(pixelSize, pixelSize)),
               PositionExtentInPixelSpace(PositionInPixelSpace(picture.x, picture.y),
                                          ExtentInPixelSpace(picture.width, picture.height)),
               aBytes_.data(), 0) {
    oRect_.values.clear();
    store(picture);
}

void AnyImage::store(RasterValues const& picture) {
    for (std::size_t i = 0; i < picture.values.size(); ++i) {
        unsigned char* const pChannel = aBytes_.data() + i * bytesOf(eType_);
        float const value = picture.values[i];
        if (eType_ == ImageDescriptor::CHANNEL_TYPE_UINT8) {
            *pChannel = static_cast<unsigned char>(value);
        } else if (eType_ == ImageDescriptor::CHANNEL_TYPE_UINT15_1) {
            auto const word = static_cast<std::uint16_t>(value);
            std::memcpy(pChannel, &word, sizeof word);
        } else {
            std::memcpy(pChannel, &value, sizeof value);
        }
    }
}

RasterValues AnyImage::load() const {
    RasterValues picture = oRect_;
    picture.values.resize(aBytes_.size() / bytesOf(eType_));
    for (std::size_t i = 0; i < picture.values.size(); ++i) {
        unsigned char const* const pChannel = aBytes_.data() + i * bytesOf(eType_);
        if (eType_ == ImageDescriptor::CHANNEL_TYPE_UINT8) {
            picture.values[i] = *pChannel;
        } else if (eType_ == ImageDescriptor::CHANNEL_TYPE_UINT15_1) {
            std::uint16_t word = 0;
            std::memcpy(&word, pChannel, sizeof word);
            picture.values[i] = word;
        } else {
            std::memcpy(&picture.values[i], pChannel, sizeof(float));
        }
    }
    return picture;
}

// ---- Building

RandomGraph::RandomGraph(std::uint32_t seed, IAdapter::eRegionSyncMode mode, std::size_t maxFilters)
    : oRandom_(seed),
      eMode_(mode),
      nMaxFilters_(maxFilters),
      spSink_(FilterGraph::createOutputAdapter(mode)) {
    oRandom_.discard(7);
    eType_ = chance(60)   ? ImageDescriptor::CHANNEL_TYPE_FLOAT32
             : chance(50) ? ImageDescriptor::CHANNEL_TYPE_UINT8
                          : ImageDescriptor::CHANNEL_TYPE_UINT15_1;
    nChannels_ = static_cast<std::size_t>(random(1, 4));
    fPixelSize_ = chance(70) ? 1.0f : 0.5f;
    // The converters to and from the SIMD-optimised layout scale integers, which the other test filters do
    // not.
    bSIMD_ = eType_ == ImageDescriptor::CHANNEL_TYPE_FLOAT32;
    bindNewOutput();
    nMaxFilters_ = static_cast<std::size_t>(random(1, static_cast<int>(maxFilters)));
    pTop_ = makeNode(1);
    Connect(pTop_->spFilter, spSink_);
    fillInputs(*pTop_);
}

int RandomGraph::random(int low, int high) {
    return low + static_cast<int>(oRandom_() % static_cast<std::uint32_t>(high - low + 1));
}

float RandomGraph::randomValue() {
    // Quarters: sums of few of them are exact, products and means are not, which is as it should be.
    return 0.25f * static_cast<float>(random(0, 40));
}

RasterValues RandomGraph::randomRect() {
    RasterValues rect;
    rect.x = random(-4, 4);
    rect.y = random(-4, 4);
    rect.width = random(1, 9);
    rect.height = random(1, 9);
    rect.channels = nChannels_;
    return rect;
}

std::size_t RandomGraph::numberOfInputs(eKind kind) {
    return kind == SOURCE || kind == GENERATOR ? 0 : kind == MIX ? 2 : 1;
}

char const* RandomGraph::inputName(Node const& node, std::size_t iInput) {
    return node.kind != MIX ? "input" : iInput == 0 ? "a" : "b";
}

RandomGraph::eKind RandomGraph::randomKind() {
    if (aNodes_.size() >= nMaxFilters_) {
        return chance(75) ? SOURCE : GENERATOR;
    }
    for (;;) {
        auto const kind = static_cast<eKind>(random(SOURCE, KINDS - 1));
        bool const bAllowed = (kind != SIMD_GAIN || bSIMD_) && (kind != BLUR || nBlurs_ < 4) &&
                              // Sources end a branch: fewer of them make larger graphs.
                              (numberOfInputs(kind) > 0 || chance(35));
        if (bAllowed) {
            return kind;
        }
    }
}

RandomGraph::Node* RandomGraph::makeNode(int rank) {
    auto pNode = std::make_unique<Node>();
    // The filter that feeds the sink is no source: its image would be converted, and not be taken as plain
    // numbers.
    do {
        pNode->kind = randomKind();
    } while (rank == 1 && pNode->kind == SOURCE);
    pNode->rank = rank;
    switch (pNode->kind) {
    case SOURCE:
        pNode->spSource = FilterGraph::createInputAdapter(eMode_);
        bindNewImage(*pNode);
        break;
    case GENERATOR:
        pNode->spFilter = makeFilter<GeneratorNode>("generator");
        setParameter(*pNode->spFilter, "channels", static_cast<int>(nChannels_));
        break;
    case ADD:
        pNode->spFilter = makeFilter<AddConstantNode>("add");
        break;
    case GAIN:
        pNode->spFilter = makeFilter<GainNode>("gain");
        break;
    case BLUR:
        ++nBlurs_;
        pNode->spFilter = makeFilter<BlurNode>("blur");
        break;
    case MIX:
        pNode->spFilter = makeFilter<MixNode>("mix");
        break;
    case SIMD_GAIN:
    case KINDS:
        pNode->spFilter = makeFilter<SIMDGainNode>("simd gain");
        break;
    }
    randomiseParameters(*pNode);
    pNode->aInputs.resize(numberOfInputs(pNode->kind));
    aNodes_.push_back(std::move(pNode));
    return aNodes_.back().get();
}

void RandomGraph::randomiseParameters(Node& node) {
    node.value = randomValue();
    switch (node.kind) {
    case GENERATOR:
        node.width = static_cast<float>(random(1, 9));
        node.height = static_cast<float>(random(1, 9));
        setParameter(*node.spFilter, "value", node.value);
        setParameter(*node.spFilter, "width", node.width * fPixelSize_);
        setParameter(*node.spFilter, "height", node.height * fPixelSize_);
        break;
    case ADD:
        setParameter(*node.spFilter, "value", node.value);
        break;
    case GAIN:
    case SIMD_GAIN:
        node.value *= 0.125f;
        setParameter(*node.spFilter, "gain", node.value);
        break;
    case BLUR:
        node.count = random(0, 2);
        setParameter(*node.spFilter, "radius", node.count);
        break;
    case MIX:
        node.value *= 0.1f;
        setParameter(*node.spFilter, "amount", node.value);
        break;
    case SOURCE:
    case KINDS:
        break;
    }
}

void RandomGraph::bindNewImage(Node& node) {
    if (node.spImage) {
        aOldImages_.push_back(node.spImage);
    }
    node.spImage = std::make_shared<AnyImage>(eType_, fPixelSize_, randomRect());
    repaint(node);
    node.spSource->setImage(node.spImage->handle());
    if (eMode_ == IAdapter::REGION_SYNC_EXPLICIT) {
        node.spSource->setDomainOfDefinition(worldOf(node.spImage->rect(), fPixelSize_));
    }
}

void RandomGraph::repaint(Node& node) {
    RasterValues picture = node.spImage->rect();
    picture.values.resize(static_cast<std::size_t>(picture.width) * static_cast<std::size_t>(picture.height) *
                          picture.channels);
    for (float& value : picture.values) {
        value = eType_ == ImageDescriptor::CHANNEL_TYPE_FLOAT32 ? randomValue()
                                                                : static_cast<float>(random(0, 200));
    }
    node.spImage->store(picture);
    node.spImage->handle()->setContentStamp(chance(70) ? ++nStamp_ : 0);
}

void RandomGraph::bindNewOutput() {
    if (spOutput_) {
        aOldImages_.push_back(spOutput_);
    }
    RasterValues const rect = randomRect();
    spOutput_ = std::make_shared<AnyImage>(eType_, fPixelSize_, rect);
    spSink_->setImage(spOutput_->handle());
    oRequested_ = rect;
    if (eMode_ == IAdapter::REGION_SYNC_EXPLICIT) {
        oRequested_.width = random(1, rect.width);
        oRequested_.height = random(1, rect.height);
        spSink_->setRegionOfInterest(worldOf(oRequested_, fPixelSize_));
    }
}

RandomGraph::Node* RandomGraph::producerFor(int consumerRank) {
    if (chance(35)) {
        std::vector<Node*> aCandidates;
        for (auto const& pNode : aNodes_) {
            if (pNode->rank > consumerRank) {
                aCandidates.push_back(pNode.get());
            }
        }
        if (!aCandidates.empty()) {
            return aCandidates[static_cast<std::size_t>(random(0, static_cast<int>(aCandidates.size()) - 1))];
        }
    }
    Node* const pNode = makeNode(consumerRank + random(1, 3));
    fillInputs(*pNode);
    return pNode;
}

void RandomGraph::connect(Node& producer, Node& consumer, std::size_t iInput) {
    FilterGraph::Input* const pInput = consumer.spFilter->input(inputName(consumer, iInput));
    if (producer.spSource) {
        Connect(producer.spSource, pInput);
    } else {
        Connect(producer.spFilter, pInput);
    }
    consumer.aInputs[iInput] = &producer;
}

void RandomGraph::fillInputs(Node& node) {
    for (std::size_t iInput = 0; iInput < node.aInputs.size(); ++iInput) {
        connect(*producerFor(node.rank), node, iInput);
    }
}

// ---- Changing

void RandomGraph::change() {
    for (int nChanges = random(1, 4); nChanges > 0; --nChanges) {
        Node& node = *aNodes_[static_cast<std::size_t>(random(0, static_cast<int>(aNodes_.size()) - 1))];
        int const what = random(1, 100);
        if (what <= 45) {
            randomiseParameters(node);
        } else if (what <= 55 && node.kind == SOURCE) {
            repaint(node);
        } else if (what <= 70 && node.kind == SOURCE) {
            bindNewImage(node);
        } else if (what <= 80) {
            bindNewOutput();
        } else if (what <= 90) {
            reconnect();
        }
    }
}

void RandomGraph::changeParameter() {
    randomiseParameters(*aNodes_[static_cast<std::size_t>(random(0, static_cast<int>(aNodes_.size()) - 1))]);
}

void RandomGraph::reconnect() {
    std::vector<Node*> aConsumers;
    for (auto const& pNode : aNodes_) {
        if (!pNode->aInputs.empty()) {
            aConsumers.push_back(pNode.get());
        }
    }
    if (aConsumers.empty()) {
        return;
    }
    Node& consumer =
        *aConsumers[static_cast<std::size_t>(random(0, static_cast<int>(aConsumers.size()) - 1))];
    auto const iInput = static_cast<std::size_t>(random(0, static_cast<int>(consumer.aInputs.size()) - 1));
    Disconnect(consumer.spFilter->input(inputName(consumer, iInput)));
    connect(*producerFor(consumer.rank), consumer, iInput);
    removeUnreachable();
}

void RandomGraph::removeUnreachable() {
    std::set<Node const*> reachable;
    std::vector<Node const*> aPending{pTop_};
    while (!aPending.empty()) {
        Node const* const pNode = aPending.back();
        aPending.pop_back();
        if (reachable.insert(pNode).second) {
            aPending.insert(aPending.end(), pNode->aInputs.begin(), pNode->aInputs.end());
        }
    }
    // Consumers before producers: a filter that dies disconnects its inputs.
    std::sort(aNodes_.begin(), aNodes_.end(), [](auto const& a, auto const& b) { return a->rank < b->rank; });
    auto const isGone = [&](auto const& pNode) { return reachable.count(pNode.get()) == 0; };
    for (auto const& pNode : aNodes_) {
        if (isGone(pNode)) {
            nBlurs_ -= pNode->kind == BLUR ? 1 : 0;
            if (pNode->spImage) {
                aOldImages_.push_back(pNode->spImage);
            }
        }
    }
    aNodes_.erase(std::remove_if(aNodes_.begin(), aNodes_.end(), isGone), aNodes_.end());
}

// ---- The reference

float RandomGraph::quantised(float value) const {
    float const highest = eType_ == ImageDescriptor::CHANNEL_TYPE_UINT8 ? 255.0f : 65535.0f;
    return eType_ == ImageDescriptor::CHANNEL_TYPE_FLOAT32
               ? value
               : std::min(std::max(std::nearbyint(value), 0.0f), highest);
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
            RasterValues grown = input;
            int const margin = node.kind == BLUR ? node.count : 0;
            grown.x -= margin;
            grown.y -= margin;
            grown.width += 2 * margin;
            grown.height += 2 * margin;
            domain = around(domain, grown);
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

bool RandomGraph::isOutputRight() {
    std::vector<float> const expected = expectedOutput().values;
    std::vector<float> const computed = spOutput_->load().values;
    return std::memcmp(expected.data(), computed.data(), expected.size() * sizeof(float)) == 0;
}

std::string RandomGraph::describeDifference() {
    static char const* const kNames[] = {"source", "generator", "add", "gain", "blur", "mix", "simd gain"};
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
