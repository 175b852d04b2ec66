#pragma once

#include <array>
#include <cstdint>
#include <map>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "tests/filter_graph/AnyImage.h"
#include "tests/support/FrameTest.h"

namespace ORVO::Test {

/// A graph of up to 30 filters with several sources and fan-out, which can be changed at random, and an
/// evaluation of its own: each filter is computed from scratch over its whole domain, by recursion, with the
/// arithmetic of the test filters and nothing of the library. Bilateral filters, whose result hangs on the
/// region that a frame computes, are run over that region by the algorithm itself, and colour transforms are
/// asked from the engine: both without a graph.
///
/// Every filter reaches the output, as a processor asks of a graph. Each has a rank above those of its
/// consumers, so that no connection closes a cycle.
class RandomGraph {
public:
    enum eKind { SOURCE, GENERATOR, ADD, GAIN, BLUR, MIX, SIMD_GAIN, BILATERAL, TRANSFORMER, KINDS };

    /// Whether the filters of the library may stand in a graph beside those of the tests.
    enum eFilters { TEST_FILTERS, ALL_FILTERS };

    RandomGraph(std::uint32_t seed, IAdapter::eRegionSyncMode mode, std::size_t maxFilters = 30,
                eFilters filters = ALL_FILTERS);

    SinkPtr const& sink() const { return spSink_; }
    std::size_t numberOfFilters() const { return aNodes_.size(); }
    std::size_t numberOf(eKind kind) const;

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
        bool colorize = false; // bilateral filters; `value` is their range sigma, `width` and `height` theirs
        std::array<std::uint32_t, 2> codes{}; // of the spaces that a transformer goes between
        RasterValues interest;                // what the frame asks of it, without values
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

    RasterValues grown(RasterValues rect, Node const& node) const;
    void findInterests();
    RasterValues evaluate(Node const& node, std::map<Node const*, RasterValues>& known);
    RasterValues evaluateBilateral(Node const& node, RasterValues const& input, RasterValues result) const;
    RasterValues evaluateTransformer(Node const& node, RasterValues input) const;
    RasterValues evaluateDomain(Node const& node, std::vector<RasterValues> const& inputs) const;
    float evaluatePixel(Node const& node, std::vector<RasterValues> const& inputs, int x, int y,
                        std::size_t channel) const;
    float quantised(float value) const;
    RasterValues expectedOutput();

    std::minstd_rand oRandom_;
    IAdapter::eRegionSyncMode eMode_;
    std::size_t nMaxFilters_;
    eFilters eFilters_;
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
