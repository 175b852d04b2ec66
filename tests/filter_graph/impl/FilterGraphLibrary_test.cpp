#include "orvo/filter_graph/impl/FilterGraphLibrary.h"

#include <gtest/gtest.h>

#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/internal/ImageFlowFilterWrapper.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/Expect.h"
#include "tests/support/ExpectFilterGraph.h"
#include "tests/support/Layers.h"

namespace ORVO::FilterGraph {
namespace {

using Options = Library::InitializationOptions;

TEST(FilterGraphLibraryTest, NamesTheAllocationModes) {
    EXPECT_EQ(static_cast<int>(Library::ALLOCATE_ON_DEMAND), 0);
    EXPECT_EQ(static_cast<int>(Library::ALLOCATE_BEFORE_LAUNCH), 1);
    EXPECT_EQ(Options().getAllocationMode(), Library::ALLOCATE_ON_DEMAND);
    EXPECT_EQ(Options(Library::ALLOCATE_BEFORE_LAUNCH).getAllocationMode(), Library::ALLOCATE_BEFORE_LAUNCH);
    Options options;
    options.setAllocationMode(Library::ALLOCATE_BEFORE_LAUNCH);
    EXPECT_EQ(options.getAllocationMode(), Library::ALLOCATE_BEFORE_LAUNCH);
}

TEST(FilterGraphLibraryTest, DemandsEachLayerInOrder) {
    ORVO_EXPECT_INTERNAL(Library::initialize(Options()), "ORVO::Core::Library::isInitialized()");
    Core::AutoInitializer const core;
    ORVO_EXPECT_INTERNAL(Library::initialize(Options()), "ORVO::OGL::Library::isInitialized()");
    OGL::AutoInitializer const ogl;
    ORVO_EXPECT_INTERNAL(Library::initialize(Options()), "ORVO::DataFlow::Library::isInitialized()");
    ImageRuntime::AutoInitializer const imageRuntime(static_cast<OGL::Context const*>(nullptr),
                                                     VideoMemory::Configuration());
    DataFlow::AutoInitializer const dataFlow;
    ORVO_EXPECT_INTERNAL(Library::initialize(Options()), "ORVO::ImageFlow::Library::isInitialized()");
    EXPECT_FALSE(Library::isInitialized());
    ORVO_EXPECT_INTERNAL(FilterFactory::Instance(), "isInitialized()");

    ImageFlow::AutoInitializer const imageFlow(false);
    Library::initialize(Options());
    EXPECT_TRUE(Library::isInitialized());
    Library::terminate();
    EXPECT_FALSE(Library::isInitialized());
}

TEST(FilterGraphLibraryTest, RefusesASecondStartAndASecondStop) {
    ORVO::Test::ImageFlowLayers const layers;
    Library::initialize(Options());
    FilterFactory* const pFactory = FilterFactory::Instance();
    ORVO_EXPECT_INTERNAL(Library::initialize(Options(Library::ALLOCATE_BEFORE_LAUNCH)), "!isInitialized_");
    EXPECT_EQ(FilterFactory::Instance(), pFactory);
    EXPECT_EQ(Library::getInitializationOptions().getAllocationMode(), Library::ALLOCATE_ON_DEMAND);
    Library::terminate();
    ORVO_EXPECT_INTERNAL(Library::terminate(), "isInitialized_");
}

TEST(FilterGraphLibraryTest, KeepsACopyOfTheOptions) {
    ORVO::Test::ImageFlowLayers const layers;
    Options options(Library::ALLOCATE_BEFORE_LAUNCH);
    AutoInitializer const library(options);
    options.setAllocationMode(Library::ALLOCATE_ON_DEMAND);
    EXPECT_EQ(Library::getInitializationOptions().getAllocationMode(), Library::ALLOCATE_BEFORE_LAUNCH);
}

TEST(FilterGraphLibraryTest, StopsOnlyWhileTheLowerLayersStand) {
    ORVO::Test::ImageFlowLayers const layers;
    Library::initialize(Options());
    ImageFlow::Library::terminate();
    ORVO_EXPECT_INTERNAL(Library::terminate(), "ORVO::ImageFlow::Library::isInitialized()");
    EXPECT_TRUE(Library::isInitialized());
    DataFlow::Library::terminate();
    ORVO_EXPECT_INTERNAL(Library::terminate(), "ORVO::DataFlow::Library::isInitialized()");
    ImageRuntime::Library::terminate();
    OGL::Library::terminate();
    ORVO_EXPECT_INTERNAL(Library::terminate(), "ORVO::OGL::Library::isInitialized()");
    Core::Library::terminate();
    ORVO_EXPECT_INTERNAL(Library::terminate(), "ORVO::Core::Library::isInitialized()");
    EXPECT_TRUE(Library::isInitialized());

    Core::Library::initialize();
    OGL::Library::initialize();
    ImageRuntime::Library::initialize(static_cast<OGL::Context const*>(nullptr),
                                      VideoMemory::Configuration());
    DataFlow::Library::initialize();
    ImageFlow::Library::initialize(false);
    Library::terminate();
    EXPECT_FALSE(Library::isInitialized());
}

TEST(FilterGraphLibraryTest, StartsWithAnEmptyFactoryEachTime) {
    ORVO::Test::ImageFlowLayers const layers;
    {
        AutoInitializer const library{Options()};
        EXPECT_EQ(FilterFactory::Instance()->numberOfPrototypes(), 0u);
        FilterFactory::Instance()->insert(ORVO::Test::PlainFilter("left behind"));
    }
    AutoInitializer const library{Options()};
    EXPECT_EQ(FilterFactory::Instance()->numberOfPrototypes(), 0u);
}

TEST(FilterGraphLibraryTest, LeavesFiltersAliveWhenItStops) {
    ORVO::Test::ImageFlowLayers const layers;
    std::shared_ptr<IFilter> filter;
    {
        AutoInitializer const library{Options()};
        FilterFactory::Instance()->insert(ORVO::Test::PlainFilter("survivor"));
        filter = FilterFactory::Instance()->create({"survivor", "test", "ORVO"});
    }
    ORVO_EXPECT_INTERNAL(FilterFactory::Instance(), "isInitialized()");
    EXPECT_EQ(filter->identifier().name(), "survivor");
}

TEST(FilterGraphAutoInitializerTest, StopsTheLibraryAtTheEndOfItsScope) {
    ORVO::Test::ImageFlowLayers const layers;
    {
        AutoInitializer const library{Options()};
        EXPECT_TRUE(Library::isInitialized());
    }
    EXPECT_FALSE(Library::isInitialized());
}

TEST(FilterGraphAutoInitializerTest, LeavesTheLibraryUpOnceReleased) {
    ORVO::Test::ImageFlowLayers const layers;
    {
        AutoInitializer library{Options()};
        library.release();
    }
    EXPECT_TRUE(Library::isInitialized());
    Library::terminate();
}

TEST(FilterGraphAutoInitializerTest, ThrowsWhatInitializeThrowsAndSwallowsWhatTerminateThrows) {
    ORVO::Test::ImageFlowLayers const layers;
    {
        AutoInitializer const library{Options()};
        ORVO_EXPECT_INTERNAL(AutoInitializer{Options()}, "!isInitialized_");
        EXPECT_TRUE(Library::isInitialized());
        Library::terminate();
    }
    EXPECT_FALSE(Library::isInitialized());
}

TEST(SetNumberOfThreadsTest, HandsTheNumberToTheControllers) {
    std::size_t const before = DataFlow::Controller::getNumberOfThreads();
    setNumberOfThreads(3);
    EXPECT_EQ(DataFlow::Controller::getNumberOfThreads(), 3u);
    setNumberOfThreads(before);
    EXPECT_EQ(DataFlow::Controller::getNumberOfThreads(), before);
}

TEST(BuiltInFiltersTest, AreInsertedAndRemovedByTheHost) {
    ORVO::Test::FilterGraphLayers const layers;
    FilterFactory& factory = *FilterFactory::Instance();
    Library::insertORVOFilters();
    ASSERT_EQ(factory.numberOfPrototypes(), 1u);
    IFilter::Identifier const identifier =
        factory.prototype({"VantleFilterGPU", "ImageFlow", "Norvane"})->identifier();
    EXPECT_EQ(identifier.version(), 1);
    EXPECT_FALSE(identifier.ioDataDescriptors().isInitialized());
    EXPECT_TRUE(dynamic_cast<Internal::ImageFlowFilterWrapper const*>(factory.find(identifier)));
    // Its node runs in OpenGL alone: without it, a filter without an interface.
    std::shared_ptr<IFilter> const filter = factory.create(identifier);
    EXPECT_EQ(filter->getNumberOfInputs(), 0u);
    EXPECT_EQ(filter->getNumberOfParameters(), 0u);
    ORVO_EXPECT_FILTERGRAPH(Library::insertORVOFilters(),
                            "Cannot insert filter into the factory :  id Filter name:VantleFilterGPU\n"
                            "Filter namespace:ImageFlow\nFilter vendor:Norvane\nFilter version:1\n"
                            " already exists");
    Library::removeORVOFilters();
    EXPECT_EQ(factory.numberOfPrototypes(), 0u);
    ORVO_EXPECT_INTERNAL(Library::removeORVOFilters(), "iter != aFilters_.end()");
}

} // namespace
} // namespace ORVO::FilterGraph
