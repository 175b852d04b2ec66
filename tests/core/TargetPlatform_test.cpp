#include "orvo/core/TargetPlatform.h"

#include <gtest/gtest.h>

#include <sstream>

namespace {

using namespace ORVO;

TEST(TargetPlatform, HasValuesAndNames) {
    struct Row {
        TargetPlatform ePlatform_;
        int iValue_;
        char const* pName_;
    };
    Row const rows[] = {
        {ORVO_TARGET_GL, 0, "ORVO_TARGET_GL"},
        {ORVO_TARGET_CPU, 1, "ORVO_TARGET_CPU"},
        {ORVO_TARGET_RESERVED_2, 2, "ORVO_TARGET_RESERVED_2"},
        {ORVO_TARGET_RESERVED_3, 3, "ORVO_TARGET_RESERVED_3"},
        {ORVO_TARGET_UNSET, 4, "ORVO_TARGET_UNSET"},
        {static_cast<TargetPlatform>(9), 9, "TargetPlatform(9)"},
    };
    for (Row const& row : rows) {
        EXPECT_EQ(row.iValue_, static_cast<int>(row.ePlatform_)) << row.pName_;
        std::ostringstream stream;
        stream << row.ePlatform_;
        EXPECT_EQ(row.pName_, stream.str());
    }
}

} // namespace
