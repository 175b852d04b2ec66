#pragma once

#include "orvo/data_flow/parameters/ParameterBase.h"

#include <gtest/gtest.h>

namespace ORVO::Test {

/// Clears the three flags, each through its own call.
inline void setAllClean(DataFlow::ParameterBase& oParameter) {
    oParameter.setClean();
    oParameter.setCleanSimpleCaching();
    oParameter.setCleanGlyphcast();
}

/// A change sets all three flags, and what is no change sets none.
inline void expectAllFlags(DataFlow::ParameterBase const& oParameter, bool bExpected) {
    EXPECT_EQ(bExpected, oParameter.isDirty());
    EXPECT_EQ(bExpected, oParameter.isDirtySimpleCaching());
    EXPECT_EQ(bExpected, oParameter.isDirtyGlyphcast());
}

} // namespace ORVO::Test
