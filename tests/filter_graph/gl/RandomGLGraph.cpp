#include "tests/filter_graph/gl/RandomGLGraph.h"

#include <algorithm>
#include <set>
#include <sstream>

#include "orvo/core/spaces/Conversions.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/ImageFlowFilter.h"
#include "orvo/image_flow/filters/BasicGLShaderFilter.h"
#include "tests/filter_graph/support/ColourGraph.h"

namespace ORVO::Test {

using FilterGraph::IFilter;

namespace {

constexpr std::uint8_t kSpoiledByte = 77;

constexpr char const* kMixText = "uniform sampler2D a_sampler;\n"
                                 "uniform vec2 a_offset;\n"
                                 "uniform vec2 a_delta;\n"
                                 "uniform sampler2D b_sampler;\n"
                                 "uniform vec2 b_offset;\n"
                                 "uniform vec2 b_delta;\n"
                                 "uniform vec2 _outOffset;\n"
                                 "uniform vec2 _outPixelExtent;\n"
                                 "void main() {\n"
                                 "    vec2 place = gl_TexCoord[0].xy*_outPixelExtent + _outOffset;\n"
                                 "    gl_FragData[0] = 0.4*texture2D(a_sampler, (place-a_offset)*a_delta) +\n"
                                 "                     0.6*texture2D(b_sampler, (place-b_offset)*b_delta);\n"
                                 "}\n";

/// (2 a + 3 b) / 5: of bytes that is never in the middle between two of them.
class MixShader : public BasicGLShaderFilter {
public:
    MixShader() : BasicGLShaderFilter("MixShader", kMixText, 4) {
        addInput("a");
        addInput("b");
    }
};

FilterPtr makeMixShader() {
    FilterGraph::Internal::ImageFlowFilter<MixShader> prototype({"mix", "test", "ORVO", 1}, ORVO_TARGET_GL);
    prototype.initialize();
    return prototype.clone();
}

FilterPtr createFilter(char const* name, char const* nameSpace = "ImageFlow",
                       char const* vendor = "Norvane") {
    return FilterGraph::FilterFactory::Instance()->create({name, nameSpace, vendor});
}

FilterPtr makeFilterOf(GLKind eKind) {
    switch (eKind) {
    case GLKind::ADD:
        return makeAddShader();
    case GLKind::MIX:
        return makeMixShader();
    case GLKind::PREMULTIPLY:
        return createFilter("premultiply", "ORVO");
    case GLKind::UNPREMULTIPLY:
        return createFilter("unpremultiply", "ORVO");
    case GLKind::SCALE_DOWN:
        return createFilter("scaleDown4channel", "ORVO");
    case GLKind::CHECKER_BOARD:
        return createFilter("MirelCheckerBoardGPU");
    case GLKind::TONE_MAPPING:
        return createFilter("MirelToneMappingGPU");
    case GLKind::GAMUT_COMPOSITE:
        return createFilter("MirelGamutComposite");
    case GLKind::BILATERAL_NODE:
        return createFilter("FastBilateralFilter");
    case GLKind::BILATERAL:
        return createFilter("FastBilateralBlur", "Motion Loft", "Norvane Works");
    case GLKind::TRANSFORMER:
        return createFilter("ColorspaceTransformer", "com.norvane.orvo");
    case GLKind::SOURCE:
        break;
    }
    return nullptr;
}

template <typename T>
void setValue(IFilter& filter, char const* name, T const& value) {
    filter.parameter(name)->as<T>().setValue(value);
}

std::vector<FilterGraph::Input*> inputsOf(IFilter& filter) {
    std::vector<FilterGraph::Input*> aInputs;
    for (FilterGraph::Input* const pInput : filter.inputs()) {
        aInputs.push_back(pInput);
    }
    return aInputs;
}

long largestByteDifference(BytePicture const& picture, Texels const& expected) {
    Texels const actual = picture.texels();
    return std::lround(255 * gpuBilateral::largestDifference(actual, expected, true) - 1e-3);
}

std::size_t byteOf(PositionExtentInPixelSpace const& region, int x, int y) {
    return 4 * (static_cast<std::size_t>(y - region.position().y()) *
                    static_cast<std::size_t>(region.extent().width()) +
                static_cast<std::size_t>(x - region.position().x()));
}

} // namespace

// ---- Pictures

BytePicture BytePicture::croppedTo(PositionExtentInPixelSpace const& part) const {
    BytePicture result{part, {}};
    for (int y = part.position().y(); y < part.position().y() + part.extent().height(); ++y) {
        auto const begin =
            bytes.begin() + static_cast<std::ptrdiff_t>(byteOf(region, part.position().x(), y));
        result.bytes.insert(result.bytes.end(), begin, begin + 4 * part.extent().width());
    }
    return result;
}

Texels BytePicture::texels() const {
    return Texels(region).fill([&](int x, int y) {
        Pixel pixel{};
        for (std::size_t c = 0; c < 4; ++c) {
            pixel[c] = bytes[byteOf(region, x, y) + c] / 255.0;
        }
        return pixel;
    });
}

ClientImage::ClientImage(PositionExtentInPixelSpace const& region, bool bTexture) : oRegion_(region) {
    int const x = region.position().x();
    int const y = region.position().y();
    if (bTexture) {
        upTexture_ = std::make_unique<TextureImage>(x, y, region.extent().width(), region.extent().height());
    } else {
        upBytes_ = std::make_unique<ByteImage>(x, y, region.extent().width(), region.extent().height());
    }
}

FilterGraph::ImageBase* ClientImage::handle() {
    return upTexture_ ? static_cast<FilterGraph::ImageBase*>(upTexture_->handle()) : upBytes_->handle();
}

void ClientImage::write(std::vector<std::uint8_t> const& aBytes) {
    if (upTexture_) {
        upTexture_->write(aBytes);
    } else {
        upBytes_->write(aBytes);
    }
}

BytePicture ClientImage::read() const {
    return {oRegion_, upTexture_ ? upTexture_->read() : upBytes_->bytes()};
}

// ---- Benches

FilterBenches::Bench& FilterBenches::benchOf(GLKind eKind) {
    Bench& bench = aBenches_[eKind];
    if (!bench.spFilter) {
        bench.spFilter = makeFilterOf(eKind);
        bench.spSink = FilterGraph::createOutputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
        for (FilterGraph::Input* const pInput : inputsOf(*bench.spFilter)) {
            bench.aSources.push_back(FilterGraph::createInputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE));
            Connect(bench.aSources.back(), pInput);
        }
        Connect(bench.spFilter, bench.spSink);
        bench.spProcessor = FilterGraph::createProcessor(bench.spSink, pContext_);
    }
    return bench;
}

BytePicture FilterBenches::run(GLKind eKind, Setting const& setting, std::vector<BytePicture> const& aInputs,
                               PositionExtentInPixelSpace const& region) {
    Bench& bench = benchOf(eKind);
    setting(*bench.spFilter);
    std::vector<std::unique_ptr<ClientImage>> aupImages;
    for (std::size_t i = 0; i < aInputs.size(); ++i) {
        aupImages.push_back(std::make_unique<ClientImage>(aInputs[i].region, true));
        aupImages.back()->write(aInputs[i].bytes);
        bench.aSources[i]->setImage(aupImages.back()->handle());
    }
    aupImages.push_back(std::make_unique<ClientImage>(region, true));
    bench.spSink->setImage(aupImages.back()->handle());
    // The images of the last run are looked at once more when the next one begins.
    bench.aupImages.swap(aupImages);
    OptimizationOptions options = glOptions();
    options.setCachingMode(OptimizationOptions::CACHING_OFF);
    bench.spProcessor->processFrame(options);
    return bench.aupImages.back()->read();
}

// ---- Building

RandomGLGraph::RandomGLGraph(std::uint32_t seed, FilterBenches& benches)
    : oRandom_(seed),
      benches_(benches),
      spSink_(FilterGraph::createOutputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE)) {
    oRandom_.discard(7);
    nMaxFilters_ = static_cast<std::size_t>(random(1, 12));
    bindNewOutput();
    pTop_ = makeNode(1);
    Connect(pTop_->spFilter, spSink_);
    fillInputs(*pTop_);
}

int RandomGLGraph::random(int low, int high) {
    return low + static_cast<int>(oRandom_() % static_cast<std::uint32_t>(high - low + 1));
}

PositionExtentInPixelSpace RandomGLGraph::randomRegion() {
    int const x = random(-4, 0);
    int const y = random(-4, 0);
    return {PositionInPixelSpace(x, y), ExtentInPixelSpace(random(5, 12), random(5, 12))};
}

RandomGLGraph::Node* RandomGLGraph::makeNode(int rank) {
    auto pNode = std::make_unique<Node>();
    pNode->rank = rank;
    if (rank == 1 || (aNodes_.size() < nMaxFilters_ && chance(70))) {
        pNode->kind = static_cast<GLKind>(random(int(GLKind::ADD), int(GLKind::TRANSFORMER)));
    }
    if (pNode->kind == GLKind::SOURCE) {
        pNode->spSource = FilterGraph::createInputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
        bindNewImage(*pNode);
    } else {
        pNode->spFilter = makeFilterOf(pNode->kind);
        pNode->aInputs.resize(inputsOf(*pNode->spFilter).size());
        randomiseParameters(*pNode);
    }
    aNodes_.push_back(std::move(pNode));
    return aNodes_.back().get();
}

void RandomGLGraph::randomiseParameters(Node& node) {
    auto const colour = [this] {
        return float4(randomShare(), randomShare(), randomShare(), 0.5F + randomShare() / 2);
    };
    switch (node.kind) {
    case GLKind::ADD:
        node.setting = [value = float(random(-20, 20)) / 255.0F](IFilter& f) { setValue(f, "value", value); };
        break;
    case GLKind::CHECKER_BOARD:
        node.setting = [a = colour(), b = colour(), size = float2(float(random(1, 4)), float(random(1, 4))),
                        gamma = chance(50) ? 1.0F : 2.25F](IFilter& f) {
            setValue(f, "colorA", a);
            setValue(f, "colorB", b);
            setValue(f, "checkerSize", size);
            setValue(f, "compositeGamma", gamma);
        };
        break;
    case GLKind::TONE_MAPPING:
        node.setting = [bExposure = chance(60), exposure = float(random(-4, 4)) / 4.0F](IFilter& f) {
            setValue(f, "exposureGammaOrHDRCompression", bExposure);
            setValue(f, "exposure", exposure);
        };
        break;
    case GLKind::GAMUT_COMPOSITE:
        node.setting = [color = colour(), opacity = randomShare()](IFilter& f) {
            setValue(f, "color", color);
            setValue(f, "opacity", opacity);
        };
        break;
    case GLKind::BILATERAL:
    case GLKind::BILATERAL_NODE:
        node.bilateral = {random(2, 6) / 2.0, random(2, 6) / 2.0, chance(50) ? 0.25F : 0.4F, chance(50)};
        node.setting = [s = node.bilateral](IFilter& f) {
            setValue(f, "spatialSigma", float2(float(s.sigmaX), float(s.sigmaY)));
            setValue(f, "rangeSigma", s.rangeSigma);
            setValue(f, "colorize", s.colorize);
        };
        break;
    case GLKind::TRANSFORMER: {
        constexpr std::uint32_t aSpaces[] = {ColourEngine::PROFILE_SRGB, ColourEngine::PROFILE_DISPLAY_P3,
                                             ColourEngine::PROFILE_WIDE_GAMUT};
        for (std::uint32_t& code : node.aCodes) {
            code = aSpaces[random(0, 2)];
        }
        node.setting = [source = node.aCodes[0], destination = node.aCodes[1]](IFilter& f) {
            setCodes(f, source, destination);
        };
        break;
    }
    case GLKind::SOURCE:
    case GLKind::MIX:
    case GLKind::PREMULTIPLY:
    case GLKind::UNPREMULTIPLY:
    case GLKind::SCALE_DOWN:
        break;
    }
    if (node.spFilter) {
        node.setting(*node.spFilter);
    }
}

void RandomGLGraph::bindNewImage(Node& node) {
    if (node.spImage) {
        aOldImages_.push_back(node.spImage);
    }
    node.spImage = std::make_shared<ClientImage>(randomRegion(), chance(50));
    repaint(node);
    node.spSource->setImage(node.spImage->handle());
}

void RandomGLGraph::repaint(Node& node) {
    // Far from black, where tone mapping divides by nothing, and hardly transparent.
    std::vector<std::uint8_t> aBytes = node.spImage->read().bytes;
    for (std::size_t i = 0; i < aBytes.size(); ++i) {
        aBytes[i] = static_cast<std::uint8_t>(i % 4 == 3 ? random(160, 255) : random(60, 200));
    }
    node.spImage->write(aBytes);
    node.spImage->handle()->setContentStamp(chance(70) ? ++nStamp_ : 0);
}

void RandomGLGraph::bindNewOutput() {
    if (spOutput_) {
        aOldImages_.push_back(spOutput_);
    }
    spOutput_ = std::make_shared<ClientImage>(randomRegion(), chance(50));
    spSink_->setImage(spOutput_->handle());
}

RandomGLGraph::Node* RandomGLGraph::producerFor(int consumerRank) {
    std::vector<Node*> aCandidates;
    for (auto const& pNode : aNodes_) {
        if (pNode->rank > consumerRank) {
            aCandidates.push_back(pNode.get());
        }
    }
    if (!aCandidates.empty() && chance(35)) {
        return aCandidates[static_cast<std::size_t>(random(0, static_cast<int>(aCandidates.size()) - 1))];
    }
    Node* const pNode = makeNode(consumerRank + random(1, 3));
    fillInputs(*pNode);
    return pNode;
}

void RandomGLGraph::connect(Node& producer, Node& consumer, std::size_t iInput) {
    FilterGraph::Input* const pInput = inputsOf(*consumer.spFilter)[iInput];
    if (producer.spSource) {
        Connect(producer.spSource, pInput);
    } else {
        Connect(producer.spFilter, pInput);
    }
    consumer.aInputs[iInput] = &producer;
}

void RandomGLGraph::fillInputs(Node& node) {
    for (std::size_t iInput = 0; iInput < node.aInputs.size(); ++iInput) {
        // Beyond an input that is smaller than the other the composite repeats what its texture happens to
        // have at its edge: both inputs get one picture.
        bool const bSame = node.kind == GLKind::GAMUT_COMPOSITE && iInput > 0;
        connect(bSame ? *node.aInputs[0] : *producerFor(node.rank), node, iInput);
    }
}

// ---- Changing

void RandomGLGraph::change() {
    for (int nChanges = random(1, 3); nChanges > 0; --nChanges) {
        Node& node = *aNodes_[static_cast<std::size_t>(random(0, static_cast<int>(aNodes_.size()) - 1))];
        int const what = random(1, 100);
        if (node.kind == GLKind::SOURCE && what <= 40) {
            repaint(node);
        } else if (node.kind == GLKind::SOURCE && what <= 60) {
            bindNewImage(node);
        } else if (what <= 75) {
            randomiseParameters(node);
        } else if (what <= 85) {
            bindNewOutput();
        } else {
            reconnect();
        }
    }
}

void RandomGLGraph::reconnect() {
    std::vector<Node*> aConsumers;
    for (auto const& pNode : aNodes_) {
        if (!pNode->aInputs.empty() && pNode->kind != GLKind::GAMUT_COMPOSITE) {
            aConsumers.push_back(pNode.get());
        }
    }
    if (aConsumers.empty()) {
        return;
    }
    Node& consumer =
        *aConsumers[static_cast<std::size_t>(random(0, static_cast<int>(aConsumers.size()) - 1))];
    auto const iInput = static_cast<std::size_t>(random(0, static_cast<int>(consumer.aInputs.size()) - 1));
    Disconnect(inputsOf(*consumer.spFilter)[iInput]);
    connect(*producerFor(consumer.rank), consumer, iInput);
    removeUnreachable();
}

void RandomGLGraph::removeUnreachable() {
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
        if (isGone(pNode) && pNode->spImage) {
            aOldImages_.push_back(pNode->spImage);
        }
    }
    aNodes_.erase(std::remove_if(aNodes_.begin(), aNodes_.end(), isGone), aNodes_.end());
}

// ---- What it must give

bool RandomGLGraph::isBilateral(Node const& node) {
    return node.kind == GLKind::BILATERAL || node.kind == GLKind::BILATERAL_NODE;
}

PositionExtentInWorldSpace RandomGLGraph::grown(PositionExtentInWorldSpace region, Node const& node) {
    if (isBilateral(node)) {
        region.outset(float2(std::ceil(float(node.bilateral.sigmaX) * 2.146F),
                             std::ceil(float(node.bilateral.sigmaY) * 2.146F)));
    }
    return region;
}

PositionExtentInPixelSpace RandomGLGraph::computed(Node const& node) {
    PositionExtentInWorldSpace region = node.domain;
    region.intersect(node.interest);
    return worldToPixelSpace(region, PixelExtentInWorldSpace());
}

void RandomGLGraph::evaluateRegions() {
    std::sort(aNodes_.begin(), aNodes_.end(), [](auto const& a, auto const& b) { return a->rank < b->rank; });
    // Producers before consumers, then the other way round.
    for (auto iNode = aNodes_.rbegin(); iNode != aNodes_.rend(); ++iNode) {
        Node& node = **iNode;
        node.interest = PositionExtentInWorldSpace();
        node.domain = PositionExtentInWorldSpace();
        if (node.kind == GLKind::SOURCE) {
            node.domain = pixelToWorldSpace(node.spImage->read().region, PixelExtentInWorldSpace());
        }
        for (Node const* const pInput : node.aInputs) {
            node.domain.include(grown(pInput->domain, node));
        }
    }
    pTop_->interest = pixelToWorldSpace(spOutput_->read().region, PixelExtentInWorldSpace());
    for (auto const& pNode : aNodes_) {
        for (Node* const pInput : pNode->aInputs) {
            pInput->interest.include(grown(pNode->interest, *pNode));
        }
    }
}

BytePicture RandomGLGraph::evaluateBilateral(Node const& node, BytePicture const& input) {
    BytePicture result = benches_.run(GLKind::BILATERAL_NODE, node.setting, {input}, computed(node));
    // Independent of any graph: the formulas in double precision.
    EXPECT_LE(
        largestByteDifference(result, gpuBilateral::filtered(input.texels(), computed(node), node.bilateral)),
        2);
    return result;
}

BytePicture RandomGLGraph::evaluateFilter(Node const& node, std::vector<BytePicture> const& aInputs) {
    if (node.kind == GLKind::BILATERAL_NODE) {
        return evaluateBilateral(node, aInputs[0]);
    }
    if (node.kind == GLKind::BILATERAL) {
        // The filter between its companions, of which the first gives as much more as the filter reaches.
        PositionExtentInWorldSpace asked = grown(node.interest, node);
        asked.intersect(node.aInputs[0]->domain);
        BytePicture const premultiplied = benches_.run(
            GLKind::PREMULTIPLY, [](IFilter&) {}, aInputs,
            worldToPixelSpace(asked, PixelExtentInWorldSpace()));
        return benches_.run(
            GLKind::UNPREMULTIPLY, [](IFilter&) {}, {evaluateBilateral(node, premultiplied)}, computed(node));
    }
    BytePicture result = benches_.run(node.kind, node.setting, aInputs, computed(node));
    if (node.kind == GLKind::TRANSFORMER) {
        std::vector<std::uint8_t> const aEngine =
            transformed(aInputs[0].croppedTo(result.region).bytes, node.aCodes[0], node.aCodes[1]);
        EXPECT_LE(largestDifference(result.bytes, aEngine), 1);
    }
    return result;
}

void RandomGLGraph::evaluate(Node& node) {
    if (node.kind == GLKind::SOURCE) {
        node.result = node.spImage->read();
        return;
    }
    std::vector<BytePicture> aInputs;
    for (Node const* const pInput : node.aInputs) {
        aInputs.push_back(pInput->result);
    }
    node.result = evaluateFilter(node, aInputs);
}

void RandomGLGraph::spoilOutput() {
    spOutput_->write(std::vector<std::uint8_t>(spOutput_->read().bytes.size(), kSpoiledByte));
}

std::string RandomGLGraph::difference() {
    evaluateRegions();
    for (auto iNode = aNodes_.rbegin(); iNode != aNodes_.rend(); ++iNode) {
        evaluate(**iNode);
    }
    BytePicture const actual = spOutput_->read();
    BytePicture expected{actual.region, std::vector<std::uint8_t>(actual.bytes.size(), kSpoiledByte)};
    PositionExtentInPixelSpace const written = computed(*pTop_);
    Texels const inside(written);
    std::ostringstream text;
    std::size_t nWrong = 0;
    for (int y = actual.region.position().y();
         y < actual.region.position().y() + actual.region.extent().height(); ++y) {
        for (int x = actual.region.position().x();
             x < actual.region.position().x() + actual.region.extent().width(); ++x) {
            for (std::size_t c = 0; c < 4; ++c) {
                int const wanted =
                    inside.contains(x, y) ? pTop_->result.bytes[byteOf(written, x, y) + c] : kSpoiledByte;
                int const given = actual.bytes[byteOf(actual.region, x, y) + c];
                // No pixel that was not to be written may differ at all.
                int const allowed = inside.contains(x, y) ? 2 : 0;
                if (std::abs(given - wanted) > allowed && nWrong++ == 0) {
                    text << "(" << x << ", " << y << ")[" << c << "]: " << given << ", not " << wanted;
                }
            }
        }
    }
    return nWrong == 0 ? "" : text.str() + "; " + std::to_string(nWrong) + " values\n" + describe();
}

std::string RandomGLGraph::describe() const {
    std::ostringstream text;
    for (auto const& pNode : aNodes_) {
        text << pNode.get() << " kind " << int(pNode->kind) << " at " << computed(*pNode) << " from";
        for (Node const* const pInput : pNode->aInputs) {
            text << " " << pInput;
        }
        text << "\n";
    }
    return text.str();
}

std::size_t RandomGLGraph::numberOf(GLKind eKind) const {
    return static_cast<std::size_t>(std::count_if(
        aNodes_.begin(), aNodes_.end(), [eKind](auto const& pNode) { return pNode->kind == eKind; }));
}

} // namespace ORVO::Test
