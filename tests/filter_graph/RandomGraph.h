#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "tests/support/FrameTest.h"

namespace ORVO::Test {

/// A rectangle of pixels with its values, as the reference computes them.
struct RasterValues {
    int x = 0;
    int y = 0;
    int width = 0;
    int height = 0;
    std::size_t channels = 1;
    std::vector<float> values;

    bool contains(int px, int py) const { return px >= x && py >= y && px < x + width && py < y + height; }
    std::size_t index(int px, int py, std::size_t channel) const;

    /// 0 outside.
    float at(int px, int py, std::size_t channel) const;
};

/// A client image of one of the channel types, with pixels of its own.
class AnyImage {
public:
    AnyImage(FilterGraph::ImageDescriptor::eChannelType type, float pixelSize, RasterValues const& picture);

    FilterGraph::ImageCPU* handle() { return &oHandle_; }
    RasterValues const& rect() const { return oRect_; }

    void store(RasterValues const& picture);
    RasterValues load() const;

private:
    FilterGraph::ImageDescriptor::eChannelType eType_;
    RasterValues oRect_; // without values
    std::vector<unsigned char> aBytes_;
    FilterGraph::ImageCPU oHandle_;
};

/// A graph of up to 30 filters with several sources and fan-out, which can be changed at random, and an
/// evaluation of its own: each filter is computed from scratch over its whole domain, by recursion, with the
/// arithmetic of the test filters and nothing of the library.
///
/// Every filter reaches the output, as a processor asks of a graph. Each has a rank above those of its
/// consumers, so that no connection closes a cycle.
class RandomGraph {
public:
    enum eKind { SOURCE, GENERATOR, ADD, GAIN, BLUR, MIX, SIMD_GAIN, KINDS };

    RandomGraph(std::uint32_t seed, IAdapter::eRegionSyncMode mode, std::size_t maxFilters = 30);

    SinkPtr const& sink() const { return spSink_; }
    std::size_t numberOfFilters() const { return aNodes_.size(); }

    /// Makes between one and four changes: parameters, pixels, images, regions, connections.
    void change();

    /// Gives one filter other parameters.
    void changeParameter();

    /// Fills the bound output image with a value that no frame computes.
    void spoilOutput();

    /// Whether the output image holds what the reference computes, bit for bit, and is untouched elsewhere.
    bool isOutputRight();

    /// The first pixel that is wrong, and the filters, for a person.
    std::string describeDifference();

private:
    struct Node {
        eKind kind = SOURCE;
        int rank = 0;
        FilterPtr spFilter; // none for sources
        SourcePtr spSource; // sources alone
        std::shared_ptr<AnyImage> spImage;
        std::vector<Node*> aInputs; // the producers
        float value = 0.0f;
        int count = 0;      // radius of blurs
        float width = 0.0f; // generators, in pixels
        float height = 0.0f;
    };

    static char const* inputName(Node const& node, std::size_t iInput);
    static std::size_t numberOfInputs(eKind kind);

    int random(int low, int high);
    bool chance(int percent) { return random(1, 100) <= percent; }
    float randomValue();
    RasterValues randomRect();

    Node* makeNode(int rank);
    eKind randomKind();
    void randomiseParameters(Node& node);
    void bindNewImage(Node& node);
    void bindNewOutput();
    void repaint(Node& node);
    Node* producerFor(int consumerRank);
    void connect(Node& producer, Node& consumer, std::size_t iInput);
    void fillInputs(Node& node);
    void reconnect();
    void removeUnreachable();

    RasterValues evaluate(Node const& node, std::map<Node const*, RasterValues>& known);
    RasterValues evaluateDomain(Node const& node, std::vector<RasterValues> const& inputs) const;
    float evaluatePixel(Node const& node, std::vector<RasterValues> const& inputs, int x, int y,
                        std::size_t channel) const;
    float quantised(float value) const;
    RasterValues expectedOutput();

    std::minstd_rand oRandom_;
    IAdapter::eRegionSyncMode eMode_;
    std::size_t nMaxFilters_;
    FilterGraph::ImageDescriptor::eChannelType eType_;
    std::size_t nChannels_;
    float fPixelSize_;
    bool bSIMD_;
    std::uint64_t nStamp_ = 0;
    int nBlurs_ = 0;

    std::vector<std::unique_ptr<Node>> aNodes_;
    Node* pTop_ = nullptr; // what feeds the sink
    SinkPtr spSink_;
    std::shared_ptr<AnyImage> spOutput_;
    RasterValues oRequested_; // what the sink is asked for, without values
    std::vector<std::shared_ptr<AnyImage>> aOldImages_;
};

} // namespace ORVO::Test
