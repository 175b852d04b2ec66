#include "orvo/image_runtime/kernels/InstructionSet.h"

#include "orvo/image_runtime/kernels/RowKernels.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <sstream>

namespace ORVO::ImageRuntime {
namespace {

TEST(InstructionSet, IsTheBestThatIsSupported) {
    EXPECT_EQ(bestInstructionSet(), activeInstructionSet());
    EXPECT_TRUE(isSupported(InstructionSet::PLAIN));
    EXPECT_TRUE(isSupported(InstructionSet::SSE2));
    EXPECT_TRUE(isSupported(bestInstructionSet()));
    EXPECT_EQ(InstructionSet::AVX512 <= bestInstructionSet(), isSupported(InstructionSet::AVX512));
    EXPECT_EQ(InstructionSet::AVX2 <= bestInstructionSet(), isSupported(InstructionSet::AVX2));
    EXPECT_FALSE(isSupported(static_cast<InstructionSet>(-1)));
    EXPECT_FALSE(isSupported(static_cast<InstructionSet>(4)));
}

TEST(InstructionSet, ChoosesTheKernels) {
    RowKernels const* const pBest = &rowKernels();
    EXPECT_EQ(pBest, &rowKernels(bestInstructionSet()));
    setActiveInstructionSet(InstructionSet::PLAIN);
    EXPECT_EQ(InstructionSet::PLAIN, activeInstructionSet());
    EXPECT_EQ(&rowKernels(InstructionSet::PLAIN), &rowKernels());
    setActiveInstructionSet(InstructionSet::SSE2);
    EXPECT_EQ(&rowKernels(InstructionSet::SSE2), &rowKernels());
    EXPECT_NE(&rowKernels(InstructionSet::PLAIN), &rowKernels());
    setActiveInstructionSet(bestInstructionSet());
    EXPECT_EQ(pBest, &rowKernels());
}

TEST(InstructionSet, IsRefusedWhereTheProcessorLacksIt) {
    InstructionSet const eActive = activeInstructionSet();
    auto const eUnknown = static_cast<InstructionSet>(4);
    ORVO_EXPECT_PARAMETER(setActiveInstructionSet(eUnknown), "isSupported(eInstructionSet)");
    ORVO_EXPECT_PARAMETER(rowKernels(eUnknown), "isSupported(eInstructionSet)");
    EXPECT_EQ(eActive, activeInstructionSet());
}

TEST(InstructionSet, HasAName) {
    std::ostringstream stream;
    stream << InstructionSet::PLAIN << "|" << InstructionSet::SSE2 << "|" << InstructionSet::AVX2 << "|"
           << InstructionSet::AVX512 << "|" << static_cast<InstructionSet>(9);
    EXPECT_EQ("plain|SSE2|AVX2|AVX-512|unknown", stream.str());
}

} // namespace
} // namespace ORVO::ImageRuntime
