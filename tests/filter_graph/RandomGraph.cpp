#include "tests/filter_graph/RandomGraph.h"

#include <algorithm>
#include <set>

#include "orvo/filter_graph/filters/Bilateral.h"
#include "tests/filter_graph/support/ColourGraph.h"

namespace ORVO::Test {

using FilterGraph::ImageDescriptor;

namespace {

PositionExtentInWorldSpace worldOf(RasterValues const& rect, float pixelSize) {
    return {
        PositionInWorldSpace(static_cast<float>(rect.x) * pixelSize, static_cast<float>(rect.y) * pixelSize),
        ExtentInWorldSpace(static_cast<float>(rect.width) * pixelSize,
                           static_cast<float>(rect.height) * pixelSize)};
}

} // namespace

// ---- Building

RandomGraph::RandomGraph(std::uint32_t seed, IAdapter::eRegionSyncMode mode, std::size_t maxFilters,
                         eFilters filters)
    : oRandom_(seed),
      eMode_(mode),
      nMaxFilters_(maxFilters),
      eFilters_(filters),
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
    if (node.kind == BILATERAL || node.kind == TRANSFORMER) {
        return "src";
    }
    return node.kind != MIX ? "input" : iInput == 0 ? "a" : "b";
}

RandomGraph::eKind RandomGraph::randomKind() {
    if (aNodes_.size() >= nMaxFilters_) {
        return chance(75) ? SOURCE : GENERATOR;
    }
    for (;;) {
        auto const kind = static_cast<eKind>(random(SOURCE, KINDS - 1));
        // What the two filters of the library take; they cost more than all others together.
        bool const bLibrary = eFilters_ == ALL_FILTERS && nChannels_ >= 3;
        bool const bBilateral = bLibrary && eType_ != ImageDescriptor::CHANNEL_TYPE_UINT15_1 && chance(25);
        bool const bTransformer = bLibrary && eType_ != ImageDescriptor::CHANNEL_TYPE_FLOAT32 && chance(25);
        bool const bAllowed = (kind != SIMD_GAIN || bSIMD_) && (kind != BLUR || nBlurs_ < 4) &&
                              (kind != BILATERAL || bBilateral) && (kind != TRANSFORMER || bTransformer) &&
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
    case BILATERAL:
        pNode->spFilter = std::make_shared<FilterGraph::Internal::Bilateral>();
        break;
    case TRANSFORMER:
        pNode->spFilter = std::make_shared<ColorspaceTransformer>();
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
    case BILATERAL:
        node.width = static_cast<float>(random(1, 6)) * 0.5f;
        node.height = static_cast<float>(random(1, 6)) * 0.5f;
        node.value = 0.1f * static_cast<float>(random(1, 5));
        node.colorize = chance(50);
        node.spFilter->parameter("spatialSigma")->as<float2>().setValue(float2(node.width, node.height));
        node.spFilter->parameter("rangeSigma")->as<float>().setValue(node.value);
        node.spFilter->parameter("colorize")->as<bool>().setValue(node.colorize);
        break;
    case TRANSFORMER:
        for (std::uint32_t& code : node.codes) {
            code = chance(50) ? ColourEngine::PROFILE_SRGB : ColourEngine::PROFILE_WIDE_GAMUT;
        }
        setCodes(*node.spFilter, node.codes[0], node.codes[1]);
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

} // namespace ORVO::Test
