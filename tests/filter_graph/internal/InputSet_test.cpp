#include "orvo/filter_graph/internal/InputSet.h"

#include <gtest/gtest.h>

#include "orvo/filter_graph/impl/Input.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/Expect.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using ORVO::Test::PlainFilter;

class InputSetTest : public testing::Test {
protected:
    std::string names() const {
        std::string text;
        for (Input const* pInput : oSet_.inputs())
            text += pInput->name();
        return text;
    }

    PlainFilter oFilter_{"filter", {"a", "b", "c"}};
    PlainFilter oOther_{"other", {"a"}};
    Input* pA_ = oFilter_.input("a");
    Input* pB_ = oFilter_.input("b");
    Input* pC_ = oFilter_.input("c");
    InputSet oSet_;
};

TEST_F(InputSetTest, IsEmptyAtFirst) {
    EXPECT_EQ(oSet_.size(), 0u);
    EXPECT_FALSE(oSet_.inputs().isValid());
    EXPECT_EQ(oSet_.input("a"), nullptr);
}

TEST_F(InputSetTest, KeepsTheOrderOfInsertion) {
    oSet_.insert(pC_);
    oSet_.insert(pA_);
    oSet_.insert(pB_);
    EXPECT_EQ(oSet_.size(), 3u);
    EXPECT_EQ(names(), "cab");
}

TEST_F(InputSetTest, RefusesNullAndWhatItHolds) {
    oSet_.insert(pA_);
    ORVO_EXPECT_INTERNAL(oSet_.insert(nullptr), "Enforce pInput != NULL");
    ORVO_EXPECT_INTERNAL(oSet_.insert(pA_), "aInputs_.end() == iInput");
    EXPECT_EQ(names(), "a");
}

TEST_F(InputSetTest, GivesTheFirstInputOfAName) {
    oSet_.insert(oOther_.input("a"));
    oSet_.insert(pA_);
    EXPECT_EQ(oSet_.input("a"), oOther_.input("a"));
    EXPECT_EQ(static_cast<InputSet const&>(oSet_).input("a"), oOther_.input("a"));
    EXPECT_EQ(oSet_.input("b"), nullptr);
    EXPECT_EQ(static_cast<InputSet const&>(oSet_).input(""), nullptr);
}

TEST_F(InputSetTest, RemovesInOrderAndIgnoresWhatItDoesNotHold) {
    oSet_.insert(pA_);
    oSet_.insert(pB_);
    oSet_.insert(pC_);
    oSet_.remove(oOther_.input("a"));
    oSet_.remove(nullptr);
    EXPECT_EQ(names(), "abc");
    oSet_.remove(pB_);
    EXPECT_EQ(names(), "ac");
    oSet_.remove(pB_);
    EXPECT_EQ(names(), "ac");
    oSet_.insert(pB_);
    EXPECT_EQ(names(), "acb");
}

TEST_F(InputSetTest, ComparesNames) {
    InputSet::NameEquals const isA("a");
    EXPECT_TRUE(isA(pA_));
    EXPECT_TRUE(isA(oOther_.input("a")));
    EXPECT_FALSE(isA(pB_));
    EXPECT_FALSE(isA(nullptr));
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
