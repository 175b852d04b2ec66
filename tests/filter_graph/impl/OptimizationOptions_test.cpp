// The options of a frame and the states that it can be in: numbers, defaults, and what counts as equal.
#include "orvo/filter_graph/impl/OptimizationOptions.h"

#include <gtest/gtest.h>

#include <iterator>

#include "orvo/filter_graph/impl/IProcessorBase.h"

namespace ORVO::FilterGraph {
namespace {

using Options = OptimizationOptions;

TEST(OptimizationOptionsTest, HaveTheirDefaults) {
    Options const options;
    EXPECT_EQ(static_cast<int>(options.processingMode()), 0);
    EXPECT_EQ(static_cast<int>(options.concatenationMode()), 1);
    EXPECT_EQ(static_cast<int>(options.debuggingMode()), 0);
    EXPECT_EQ(static_cast<int>(options.cachingMode()), 1);
    EXPECT_EQ(static_cast<int>(options.intermediateBufferPrecision()), 0);
}

TEST(OptimizationOptionsTest, KeepWhatTheyAreGiven) {
    Options options;
    options.setProcessingMode(Options::CPU_PROCESSING);
    options.setConcatenationMode(Options::CONCATENATION_OFF);
    options.setDebuggingMode(Options::DEBUGGING_SINGLE_THREAD);
    options.setCachingMode(Options::CACHING_OFF);
    options.setIntermediateBufferPrecision(Options::INTERMEDIATE_PRECISION_32_BIT_FLOAT);
    EXPECT_EQ(static_cast<int>(options.processingMode()), 1);
    EXPECT_EQ(static_cast<int>(options.concatenationMode()), 0);
    EXPECT_EQ(static_cast<int>(options.debuggingMode()), 1);
    EXPECT_EQ(static_cast<int>(options.cachingMode()), 0);
    EXPECT_EQ(static_cast<int>(options.intermediateBufferPrecision()), 2);
    // Also what is no value: it is refused, or ignored, where it is used.
    options.setCachingMode(static_cast<Options::eCachingMode>(77));
    EXPECT_EQ(static_cast<int>(options.cachingMode()), 77);
}

TEST(OptimizationOptionsTest, AreEqualIfAllFiveFieldsAre) {
    Options other[5];
    other[0].setProcessingMode(Options::CPU_PROCESSING);
    other[1].setConcatenationMode(Options::CONCATENATION_OFF);
    other[2].setDebuggingMode(Options::DEBUGGING_SINGLE_THREAD);
    other[3].setCachingMode(Options::CACHING_OFF);
    other[4].setIntermediateBufferPrecision(Options::INTERMEDIATE_PRECISION_16_BIT_FLOAT);
    EXPECT_TRUE(Options().equals(Options()));
    for (std::size_t i = 0; i < std::size(other); ++i) {
        for (std::size_t k = 0; k < std::size(other); ++k) {
            EXPECT_EQ(other[i].equals(other[k]), i == k) << i << " and " << k;
        }
        EXPECT_FALSE(other[i].equals(Options())) << i;
        EXPECT_FALSE(Options().equals(other[i])) << i;
    }
}

TEST(FrameStatusTest, HasItsNumbers) {
    EXPECT_EQ(static_cast<int>(IProcessorBase::FRAME_RUNNING), 1);
    EXPECT_EQ(static_cast<int>(IProcessorBase::FRAME_COMPLETE), 2);
    EXPECT_EQ(static_cast<int>(IProcessorBase::FRAME_CANCELLED), 3);
    EXPECT_EQ(static_cast<int>(IProcessorBase::FRAME_NONE), 4);
}

} // namespace
} // namespace ORVO::FilterGraph
