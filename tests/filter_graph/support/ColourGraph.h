/// A graph of one source, colour transformers and a sink, on images of R, G, B and A, or of other channels.
#pragma once

#include <cstdint>
#include <random>
#include <vector>

#include "orvo/colour_engine/ProfileCodes.h"
#include "orvo/colour_engine/VantlePackingSpec.h"
#include "orvo/colour_engine/VantleProcedures.h"
#include "orvo/filter_graph/filters/ColorspaceTransformer.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/image_flow/colour/CVantle.h"
#include "tests/support/FrameTest.h"
#include "tests/support/RecordingEngine.h"

namespace ORVO::Test {

using FilterGraph::Internal::Filters::ColorspaceTransformer;

/// Before all layers come up.
struct WithRecordingEngine {
    WithRecordingEngine() { RecordingEngine::install(); }
};

inline void setCodes(FilterGraph::IFilter& filter, std::uint32_t source, std::uint32_t destination) {
    filter.parameter("srcProfile")->as<int>().setValue(static_cast<int>(source));
    filter.parameter("dstProfile")->as<int>().setValue(static_cast<int>(destination));
}

inline FilterPtr makeTransformer(std::uint32_t source, std::uint32_t destination) {
    FilterPtr const spFilter = std::make_shared<ColorspaceTransformer>();
    setCodes(*spFilter, source, destination);
    return spFilter;
}

/// A client image in host memory, without padding: bytes, or words from 0 to 32768.
template <typename T>
class PackedImage {
public:
    PackedImage(int width, int height, std::size_t nChannels = 4)
        : aPixels_(nChannels * static_cast<std::size_t>(width) * static_cast<std::size_t>(height)),
          oHandle_(FilterGraph::ImageDescriptorCPU({nChannels, kType}, PixelExtentInWorldSpace()),
                   PositionExtentInPixelSpace(PositionInPixelSpace(0, 0), ExtentInPixelSpace(width, height)),
                   reinterpret_cast<unsigned char const*>(aPixels_.data()), 0) {}
    PackedImage(PackedImage const&) = delete;
    PackedImage& operator=(PackedImage const&) = delete;

    /// Never resized: the handle points at them.
    std::vector<T>& pixels() { return aPixels_; }
    FilterGraph::ImageCPU* handle() { return &oHandle_; }

    /// The same picture for the same seed.
    void fillAtRandom(unsigned seed) {
        std::mt19937 random(seed);
        for (T& value : aPixels_)
            value = static_cast<T>(random() % (kWhite + 1));
    }

    static constexpr std::uint32_t kWhite = sizeof(T) == 1 ? 255 : 32768;

private:
    static constexpr auto kType = sizeof(T) == 1 ? FilterGraph::ImageDescriptor::CHANNEL_TYPE_UINT8
                                                 : FilterGraph::ImageDescriptor::CHANNEL_TYPE_UINT15_1;

    std::vector<T> aPixels_;
    FilterGraph::ImageCPU oHandle_;
};

/// What the engine makes of packed R, G, B and A, without any graph; alpha stays.
template <typename T>
std::vector<T> transformed(std::vector<T> const& aPixels, std::uint32_t source, std::uint32_t destination) {
    VantleProfile* pSource = nullptr;
    VantleProfile* pDestination = nullptr;
    VantleTransform* pTransform = nullptr;
    EXPECT_EQ(0U, CVantle::ProfileFromCode(&pSource, source));
    EXPECT_EQ(0U, CVantle::ProfileFromCode(&pDestination, destination));
    EXPECT_EQ(0U,
              CVantle::MakeColorTransform(&pTransform, pSource, pDestination, VANTLE_INTENT_PERCEPTUAL, 0));
    std::vector<T> aResult = aPixels;
    auto const columns = static_cast<std::uint32_t>(aPixels.size() / 4);
    _t_Vantle_PackingSpec spec{};
    spec.space = _t_Vantle_PackingSpec::SPACE_RGB;
    spec.channels = 3;
    spec.bytesPerChannel = sizeof(T);
    for (std::size_t i = 0; i < 3; ++i) {
        spec.planes[i].base = aResult.data() + i;
        spec.planes[i].columnBytes = 4 * sizeof(T);
        spec.planes[i].rowBytes = static_cast<std::int32_t>(columns * 4 * sizeof(T));
    }
    EXPECT_EQ(0U, CVantle::ApplyGeneral(pTransform, &spec, &spec, 1, columns, nullptr));
    CVantle::UnReferenceTransform(pTransform);
    CVantle::UnReferenceProfile(pSource);
    CVantle::UnReferenceProfile(pDestination);
    return aResult;
}

/// source -> transformers -> sink, between images in host memory.
template <typename T>
struct PackedColourGraph {
    /// @param pContext for frames on OpenGL.
    PackedColourGraph(int width, int height, std::vector<FilterPtr> const& aFilters, std::size_t nInput = 4,
                      std::size_t nOutput = 4, OGL::Context const* pContext = nullptr)
        : aFilters_(aFilters),
          oInput_(width, height, nInput),
          oOutput_(width, height, nOutput),
          spProcessor_(FilterGraph::createProcessor(spSink_, pContext)) {
        spSource_->setImage(oInput_.handle());
        spSink_->setImage(oOutput_.handle());
        FilterGraph::Connect(spSource_, aFilters_.front());
        for (std::size_t i = 1; i < aFilters_.size(); ++i)
            FilterGraph::Connect(aFilters_[i - 1], aFilters_[i]);
        FilterGraph::Connect(aFilters_.back(), spSink_);
    }

    std::vector<FilterPtr> aFilters_;
    PackedImage<T> oInput_;
    PackedImage<T> oOutput_;
    SourcePtr spSource_ = FilterGraph::createInputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
    SinkPtr spSink_ = FilterGraph::createOutputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
    std::shared_ptr<FilterGraph::IProcessor> spProcessor_;
};

/// The largest difference between values at the same place.
template <typename T>
long largestDifference(std::vector<T> const& a, std::vector<T> const& b) {
    long nLargest = a.size() == b.size() ? 0 : 1L << 30;
    for (std::size_t i = 0; i < std::min(a.size(), b.size()); ++i)
        nLargest = std::max(nLargest, std::labs(static_cast<long>(a[i]) - static_cast<long>(b[i])));
    return nLargest;
}

} // namespace ORVO::Test
