#include "orvo/filter_graph/impl/Exception.h"

#include <gtest/gtest.h>

#include <memory>
#include <sstream>

namespace ORVO::FilterGraph {
namespace {

using Info = ErrorOrWarningInfo;

TEST(ErrorOrWarningInfoTest, KeepsItsFields) {
    Info const error(Info::ERROR_TYPE_ERROR, "broken", 4, 12);
    EXPECT_EQ(static_cast<int>(error.type()), 0);
    EXPECT_EQ(error.message(), "broken");
    EXPECT_EQ(error.inputStringId(), 4);
    EXPECT_EQ(error.line(), 12);
    EXPECT_TRUE(error.isError());
    EXPECT_FALSE(error.isWarning());

    Info const warning(Info::ERROR_TYPE_WARNING, "", -1, -2);
    EXPECT_EQ(static_cast<int>(warning.type()), 1);
    EXPECT_FALSE(warning.isError());
    EXPECT_TRUE(warning.isWarning());
}

TEST(ErrorOrWarningInfoTest, IsNeitherWithAnotherType) {
    Info const odd(static_cast<Info::ErrorType>(2), "odd", 0, 0);
    EXPECT_FALSE(odd.isError());
    EXPECT_FALSE(odd.isWarning());
    std::ostringstream stream;
    stream << odd;
    EXPECT_EQ(stream.str(), "WARNING (line: 0): odd; (0)");
}

TEST(ErrorOrWarningInfoTest, IsCountedByType) {
    std::vector<Info> const infos = {
        Info(Info::ERROR_TYPE_ERROR, "a", 0, 0), Info(Info::ERROR_TYPE_WARNING, "b", 0, 0),
        Info(Info::ERROR_TYPE_ERROR, "c", 0, 0), Info(static_cast<Info::ErrorType>(9), "d", 0, 0)};
    EXPECT_EQ(nError(infos), 2u);
    EXPECT_EQ(nWarning(infos), 1u);
    EXPECT_EQ(nError({}), 0u);
    EXPECT_EQ(nWarning({}), 0u);
}

TEST(ErrorOrWarningInfoTest, WritesItselfAndListsOfItself) {
    std::vector<Info> const infos = {Info(Info::ERROR_TYPE_ERROR, "no input", 2, 17),
                                     Info(Info::ERROR_TYPE_WARNING, "slow", 0, 0)};
    std::ostringstream one;
    one << infos.front();
    EXPECT_EQ(one.str(), "ERROR (line: 17): no input; (2)");
    std::ostringstream all;
    all << infos;
    EXPECT_EQ(all.str(), "ERROR (line: 17): no input; (2)\nWARNING (line: 0): slow; (0)\n");
}

void expectOneError(Exception const& exception, std::string const& message) {
    ASSERT_EQ(exception.errorsAndWarnings().size(), 1u);
    Info const& info = exception.errorsAndWarnings().front();
    EXPECT_TRUE(info.isError());
    EXPECT_EQ(info.message(), message);
    EXPECT_EQ(info.inputStringId(), 0);
    EXPECT_EQ(info.line(), 0);
}

TEST(ExceptionTest, HasOneRecordByDefaultAndFromAText) {
    expectOneError(Exception(), "Internal ORVO Filter Graph Exception");
    expectOneError(Exception("bad graph"), "bad graph");
    EXPECT_STREQ(Exception("bad graph").what(), "bad graph");
}

TEST(ExceptionTest, TakesRecordsAsTheyAre) {
    Exception const one(Info(Info::ERROR_TYPE_WARNING, "slow", 3, 4));
    ASSERT_EQ(one.errorsAndWarnings().size(), 1u);
    EXPECT_TRUE(one.errorsAndWarnings()[0].isWarning());
    EXPECT_EQ(one.errorsAndWarnings()[0].inputStringId(), 3);
    EXPECT_EQ(one.errorsAndWarnings()[0].line(), 4);

    EXPECT_TRUE(Exception(std::vector<Info>()).errorsAndWarnings().empty());
    EXPECT_STREQ(Exception(std::vector<Info>()).what(), "");
}

TEST(ExceptionTest, AppendsRecordsWithoutTouchingItsCopies) {
    Exception exception("first");
    Exception const before(exception);
    exception.add(Info(Info::ERROR_TYPE_WARNING, "second", 0, 1));
    ASSERT_EQ(exception.errorsAndWarnings().size(), 2u);
    EXPECT_EQ(exception.errorsAndWarnings()[0].message(), "first");
    EXPECT_EQ(exception.errorsAndWarnings()[1].message(), "second");
    EXPECT_STREQ(exception.what(), "first\nsecond");
    expectOneError(before, "first");

    Exception assigned;
    assigned = exception;
    EXPECT_EQ(assigned.errorsAndWarnings().size(), 2u);
}

TEST(ExceptionTest, ClonesAsItsBase) {
    Exception exception("lost");
    exception.add(Info(Info::ERROR_TYPE_WARNING, "more", 0, 0));
    ExceptionBase const& base = exception;
    std::unique_ptr<ExceptionBase> const clone(base.clone());
    auto const* copy = dynamic_cast<Exception const*>(clone.get());
    ASSERT_TRUE(copy);
    EXPECT_NE(copy, &exception);
    ASSERT_EQ(copy->errorsAndWarnings().size(), 2u);
    EXPECT_EQ(copy->errorsAndWarnings()[1].message(), "more");
}

TEST(ExceptionTest, WritesItsRecords) {
    std::ostringstream stream;
    Exception(Info(Info::ERROR_TYPE_ERROR, "lost", 0, 5)).write(stream);
    EXPECT_EQ(stream.str(), "ERROR (line: 5): lost; (0)\n");
}

TEST(ExceptionTest, IsCaughtAsEveryBase) {
    EXPECT_THROW(throw Exception("x"), ExceptionBase);
    EXPECT_THROW(throw Exception("x"), std::exception);
}

} // namespace
} // namespace ORVO::FilterGraph
