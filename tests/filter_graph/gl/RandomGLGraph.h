/// Random graphs on OpenGL of the library's filters, and what they must give.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "tests/image_flow/support/GPUBilateralReference.h"
#include "tests/support/gl/GLFrameTest.h"

namespace ORVO::Test {

/// A rectangle of pixels: R, G, B and A of 8 bits, row by row.
struct BytePicture {
    PositionExtentInPixelSpace region{PositionInPixelSpace(0, 0), ExtentInPixelSpace(0, 0)};
    std::vector<std::uint8_t> bytes;

    BytePicture croppedTo(PositionExtentInPixelSpace const& part) const;
    Texels texels() const;
};

/// A client image in host memory or in a texture.
class ClientImage {
public:
    ClientImage(PositionExtentInPixelSpace const& region, bool bTexture);

    bool isTexture() const { return upTexture_ != nullptr; }
    FilterGraph::ImageBase* handle();
    void write(std::vector<std::uint8_t> const& aBytes);
    BytePicture read() const;

private:
    PositionExtentInPixelSpace oRegion_;
    std::unique_ptr<ByteImage> upBytes_;
    std::unique_ptr<TextureImage> upTexture_;
};

/// What can stand in a graph. A kind that is made of others is found in none of the benches.
enum class GLKind {
    SOURCE,
    ADD,
    MIX,
    PREMULTIPLY,
    SCALE_DOWN,
    CHECKER_BOARD,
    TONE_MAPPING,
    GAMUT_COMPOSITE,
    BILATERAL_NODE,
    BILATERAL,
    TRANSFORMER,
    UNPREMULTIPLY, // for the benches alone
};

/// Each kind of filter in a graph of its own, between textures: what it gives for pictures and a region.
class FilterBenches {
public:
    using Setting = std::function<void(FilterGraph::IFilter&)>;

    explicit FilterBenches(OGL::Context const* pContext) : pContext_(pContext) {}

    BytePicture run(GLKind eKind, Setting const& setting, std::vector<BytePicture> const& aInputs,
                    PositionExtentInPixelSpace const& region);

private:
    struct Bench {
        FilterPtr spFilter;
        std::vector<SourcePtr> aSources;
        SinkPtr spSink;
        std::shared_ptr<FilterGraph::IProcessor> spProcessor;
        std::vector<std::unique_ptr<ClientImage>> aupImages; // bound until the next run
    };

    Bench& benchOf(GLKind eKind);

    OGL::Context const* pContext_;
    std::map<GLKind, Bench> aBenches_;
};

/// A graph of up to 12 filters with several sources and fan-out, which is changed at random, and what it must
/// give: that of its filters, each run by itself on what those in front of it gave. What the bilateral filter
/// and the colour transformer gave on their benches is held against their formulas and the engine. Two steps
/// of 8 bits are allowed for: textures between filters are larger than those of clients, so that coordinates
/// in them are rounded otherwise.
///
/// Every picture holds the pixel (0, 0), so that no region is empty.
class RandomGLGraph {
public:
    RandomGLGraph(std::uint32_t seed, FilterBenches& benches);

    SinkPtr const& sink() const { return spSink_; }

    /// Makes between one and three changes: parameters, pixels, images, connections.
    void change();

    /// Fills the bound output image with a value, then compares it after a frame. Empty if it is right.
    void spoilOutput();
    std::string difference();

    std::size_t numberOf(GLKind eKind) const;

private:
    struct Node {
        GLKind kind = GLKind::SOURCE;
        int rank = 0; // above those of its consumers
        FilterPtr spFilter;
        SourcePtr spSource;
        std::shared_ptr<ClientImage> spImage;
        FilterBenches::Setting setting = [](FilterGraph::IFilter&) {};
        gpuBilateral::Settings bilateral;
        std::uint32_t aCodes[2] = {0, 0};
        std::vector<Node*> aInputs;
        // Of the frame that is evaluated
        PositionExtentInWorldSpace domain;
        PositionExtentInWorldSpace interest;
        BytePicture result;
    };

    int random(int low, int high);
    bool chance(int percent) { return random(1, 100) <= percent; }
    float randomShare() { return static_cast<float>(random(0, 8)) / 8.0F; }
    PositionExtentInPixelSpace randomRegion();

    Node* makeNode(int rank);
    void randomiseParameters(Node& node);
    void bindNewImage(Node& node);
    void repaint(Node& node);
    void bindNewOutput();
    Node* producerFor(int consumerRank);
    void connect(Node& producer, Node& consumer, std::size_t iInput);
    void fillInputs(Node& node);
    void reconnect();
    void removeUnreachable();

    static bool isBilateral(Node const& node);
    static PositionExtentInWorldSpace grown(PositionExtentInWorldSpace region, Node const& node);
    static PositionExtentInPixelSpace computed(Node const& node);
    void evaluateRegions();
    void evaluate(Node& node);
    BytePicture evaluateFilter(Node const& node, std::vector<BytePicture> const& aInputs);
    BytePicture evaluateBilateral(Node const& node, BytePicture const& input);
    std::string describe() const;

    std::minstd_rand oRandom_;
    FilterBenches& benches_;
    std::size_t nMaxFilters_;
    std::uint64_t nStamp_ = 0;
    std::vector<std::unique_ptr<Node>> aNodes_;
    Node* pTop_ = nullptr; // what feeds the sink
    SinkPtr spSink_;
    std::shared_ptr<ClientImage> spOutput_;
    std::vector<std::shared_ptr<ClientImage>> aOldImages_;
};

} // namespace ORVO::Test
