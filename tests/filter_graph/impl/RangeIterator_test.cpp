#include "orvo/filter_graph/impl/RangeIterator.h"

#include <gtest/gtest.h>

#include <type_traits>

#include "orvo/filter_graph/impl/Input.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/Expect.h"

namespace ORVO::FilterGraph {
namespace {

using ORVO::Test::PlainFilter;

/// Opens what only derived ranges may call.
class OpenRange : public InputIterator {
public:
    using InputIterator::InputIterator;
    using InputIterator::isDone;
    using InputIterator::next;
    using InputIterator::rewind;
};

class RangeIteratorTest : public testing::Test {
protected:
    PlainFilter oFilter_{"filter", {"a", "b", "c"}};
    InputIterator oInputs_ = oFilter_.inputs();
};

TEST_F(RangeIteratorTest, IsEmptyByDefault) {
    InputIterator empty;
    EXPECT_FALSE(empty.isValid());
    EXPECT_TRUE(empty.begin() == empty.end());
    EXPECT_EQ(*empty, nullptr);
    ORVO_EXPECT_INTERNAL(++empty, "iCurrent_ != iLast_");
}

TEST_F(RangeIteratorTest, StartsAtTheFirstElement) {
    EXPECT_TRUE(oInputs_.isValid());
    EXPECT_EQ(*oInputs_, *oInputs_.begin());
    EXPECT_EQ(oInputs_.end() - oInputs_.begin(), 3);
    EXPECT_EQ(oInputs_->name(), "a");
}

TEST_F(RangeIteratorTest, MovesToTheEndAndNotBeyond) {
    EXPECT_EQ((*++oInputs_)->name(), "b");
    EXPECT_EQ((++oInputs_)->name(), "c");
    ++oInputs_;
    EXPECT_FALSE(oInputs_.isValid());
    EXPECT_EQ(*oInputs_, nullptr);
    ORVO_EXPECT_INTERNAL(++oInputs_, "iCurrent_ != iLast_");
    ORVO_EXPECT_INTERNAL(++oInputs_, "iCurrent_ != iLast_");
    EXPECT_FALSE(oInputs_.isValid());
    EXPECT_EQ(oInputs_.end() - oInputs_.begin(), 3);
}

TEST_F(RangeIteratorTest, RewindsForDerivedRanges) {
    OpenRange range(oInputs_.begin(), oInputs_.end());
    EXPECT_FALSE(range.isDone());
    range.next();
    range.next();
    range.next();
    EXPECT_TRUE(range.isDone());
    ORVO_EXPECT_INTERNAL(range.next(), "iCurrent_ != iLast_");
    range.rewind();
    EXPECT_FALSE(range.isDone());
    EXPECT_EQ(range->name(), "a");
}

TEST_F(RangeIteratorTest, ServesRangeBasedLoops) {
    std::string names;
    for (Input* pInput : oFilter_.inputs())
        names += pInput->name();
    EXPECT_EQ(names, "abc");
}

TEST_F(RangeIteratorTest, TurnsIntoItsConstantForm) {
    InputConstIterator const constant(oInputs_);
    EXPECT_EQ(*constant, *oInputs_);
    EXPECT_EQ(constant.end() - constant.begin(), 3);
}

template <class Plain, class Constant>
constexpr bool convertsOneWay =
    std::is_convertible_v<Plain, Constant> && !std::is_convertible_v<Constant, Plain>;

static_assert(convertsOneWay<InputIterator, InputConstIterator>);
static_assert(convertsOneWay<ParameterIterator, ParameterConstIterator>);
static_assert(convertsOneWay<MetadataIterator, MetadataConstIterator>);
static_assert(convertsOneWay<IFilterIterator, IFilterConstIterator>);
static_assert(std::is_same_v<decltype(*std::declval<IFilterIterator&>()), std::shared_ptr<IFilter>>);
static_assert(std::is_same_v<decltype(*std::declval<InputIterator&>()), Input*>);
static_assert(std::is_same_v<decltype(*std::declval<ParameterIterator&>()), ParameterBase*>);
static_assert(std::is_same_v<decltype(*std::declval<MetadataIterator&>()), MetadataItemBase const*>);

} // namespace
} // namespace ORVO::FilterGraph
