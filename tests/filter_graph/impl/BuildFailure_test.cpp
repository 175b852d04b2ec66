// Every allocation of the calls that build a graph made to fail in turn: a clean std::bad_alloc each time,
// and everything as it was.
#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <functional>
#include <new>

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/filter_graph/filters/StandardFilters.h"
#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/ImageCPU.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/ParameterSet.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/FilterGraphLayers.h"

namespace ORVO::FilterGraph {
namespace {

using ORVO::Test::PlainFilter;

class BuildFailureTest : public testing::Test {
protected:
    /// Runs `call` with its first allocation failing, then with its second, and so on until it goes through;
    /// `check` runs after each failure. Returns the number of failures.
    static std::uint64_t failEach(std::function<void()> const& call, std::function<void()> const& check) {
        for (std::uint64_t n = 1;; ++n) {
            Core::AllocationFailure const failure(n);
            try {
                call();
            } catch (std::bad_alloc const&) {
                EXPECT_TRUE(failure.hasFired());
                check();
                continue;
            }
            EXPECT_FALSE(failure.hasFired()) << "allocation " << n << " failed unnoticed";
            return n - 1;
        }
    }

    ORVO::Test::FilterGraphLayers oLayers_;
    FilterFactory& factory_ = *FilterFactory::Instance();
};

TEST_F(BuildFailureTest, OfTheStandardFilters) {
    factory_.insert(PlainFilter("host"));
    std::uint64_t const n =
        failEach(insertStandardFilters, [this] { EXPECT_EQ(factory_.numberOfPrototypes(), 1u); });
    // Seven prototypes and as many clones, each with an output at least.
    EXPECT_GE(n, 14u);
    EXPECT_GT(factory_.numberOfPrototypes(), 1u);
}

TEST_F(BuildFailureTest, OfFiltersFromTheFactory) {
    insertStandardFilters();
    for (char const* name : {"FastBilateralFilter", "SimpleBilateralCPU", "ConvertToSIMDOptimized"}) {
        std::shared_ptr<IFilter> filter;
        failEach(
            [&] {
                filter = factory_.create({name, "ImageFlow", "Norvane"});
            },
            [&] { EXPECT_FALSE(filter); });
        ASSERT_TRUE(filter) << name;
        EXPECT_EQ(filter->getNumberOfInputs(), 1u) << name;
        EXPECT_EQ(factory_.create({name, "ImageFlow", "Norvane"})->getNumberOfParameters(),
                  filter->getNumberOfParameters())
            << name;
    }
}

TEST_F(BuildFailureTest, OfInputsParametersAndMetadata) {
    PlainFilter filter;
    EXPECT_GE(failEach([&] { filter.addInput("src", 3); }, [&] { EXPECT_EQ(filter.input("src"), nullptr); }),
              1u);
    DataFlow::IntervalParameter<float> const source(1.0F, 0.0F, 2.0F, "gain", "How loud");
    std::unique_ptr<ParameterBase, ORVODeleter<ParameterBase>> parameter;
    // The parameter and its five metadata items.
    EXPECT_GE(failEach([&] { parameter.reset(Internal::ParameterSet::createParameterFromDataFlow(&source)); },
                       [&] { EXPECT_FALSE(parameter); }),
              6u);
    std::unique_ptr<ParameterBase, ORVODeleter<ParameterBase>> clone;
    EXPECT_GE(failEach([&] { clone.reset(parameter->clone()); }, [&] { EXPECT_FALSE(clone); }), 6u);
    EXPECT_EQ(clone->getNumberOfMetadataItems(), 5u);
    filter.addParameter(std::move(parameter));
    filter.addMetadataItem(ORVO_NEW MetadataItem<int>("a", 1));
    filter.addMetadataItem(ORVO_NEW MetadataItem<int>("b", 2));
    std::shared_ptr<Internal::Filter> copy;
    EXPECT_GE(failEach([&] { copy = filter.clone(); }, [&] { EXPECT_FALSE(copy); }), 10u);
    EXPECT_EQ(copy->getNumberOfMetadataItems(), 2u);
}

TEST_F(BuildFailureTest, OfStorageForAnImage) {
    std::array<unsigned char, 64> first{};
    std::array<unsigned char, 64> second{};
    ImageCPU image(ImageDescriptorCPU({1, ImageDescriptor::CHANNEL_TYPE_UINT8}, PixelExtentInWorldSpace()),
                   PositionExtentInPixelSpace(ExtentInPixelSpace(4, 4)), first.data(), 0);
    image.setContentStamp(5);
    EXPECT_GE(failEach([&] { image.setPixelStorage(second.data(), 8); },
                       [&] {
                           EXPECT_EQ(image.getPixelStorage(), first.data());
                           EXPECT_EQ(image.paddedWidthInBytes(), 4u);
                           EXPECT_EQ(image.contentStamp(), 5u);
                       }),
              1u);
    EXPECT_EQ(image.getPixelStorage(), second.data());
}

} // namespace
} // namespace ORVO::FilterGraph
