#include "orvo/core/logging/LoggingInserter.h"

#include <gtest/gtest.h>

#include <sstream>
#include <string>

namespace {

using ORVO::Logging::LoggingInserter;

std::string insert(LoggingInserter& inserter, std::string const& text) {
    std::stringbuf target;
    for (char character : text)
        EXPECT_EQ(static_cast<unsigned char>(character),
                  inserter(target, static_cast<unsigned char>(character)));
    return target.str();
}

TEST(LoggingInserter, HasNoIndentAtFirst) {
    LoggingInserter inserter;
    EXPECT_EQ(0, inserter.indent());
    EXPECT_EQ("one\ntwo\n", insert(inserter, "one\ntwo\n"));
}

TEST(LoggingInserter, IndentsEachLineAlsoAnEmptyOne) {
    LoggingInserter inserter;
    inserter.setIndent(2);
    EXPECT_EQ(2, inserter.indent());
    EXPECT_EQ("  one\n  \n  two", insert(inserter, "one\n\ntwo"));
    // The indent of a line comes with its first character.
    EXPECT_EQ("\n", insert(inserter, "\n"));
    EXPECT_EQ("  x", insert(inserter, "x"));
}

TEST(LoggingInserter, ChangesTheIndentOfTheLinesToCome) {
    LoggingInserter inserter;
    inserter.setIndent(4);
    EXPECT_EQ("    a", insert(inserter, "a"));
    inserter.setIndent(1);
    EXPECT_EQ("b\n c", insert(inserter, "b\nc"));
}

TEST(LoggingInserter, TakesANegativeIndentForNone) {
    LoggingInserter inserter;
    inserter.setIndent(-3);
    EXPECT_EQ(0, inserter.indent());
    EXPECT_EQ("a\nb", insert(inserter, "a\nb"));
}

TEST(LoggingInserter, PassesBytesAboveAsciiUnchanged) {
    LoggingInserter inserter;
    EXPECT_EQ("\xC3\xA4\xFF", insert(inserter, "\xC3\xA4\xFF"));
}

/// Takes a given number of characters, then refuses until it is given room again.
struct LimitedBuffer : std::streambuf {
    explicit LimitedBuffer(int nRoom) : nRoom_(nRoom) {}
    int_type overflow(int_type character) override {
        if (nRoom_ == 0)
            return traits_type::eof();
        --nRoom_;
        sText_ += traits_type::to_char_type(character);
        return character;
    }
    int nRoom_;
    std::string sText_;
};

TEST(LoggingInserter, ReportsARefusalAndGoesOnWhereItStopped) {
    LoggingInserter inserter;
    inserter.setIndent(3);
    LimitedBuffer target(2);
    EXPECT_EQ(std::streambuf::traits_type::eof(), inserter(target, 'a'));
    EXPECT_EQ("  ", target.sText_);
    target.nRoom_ = 1;
    EXPECT_EQ(std::streambuf::traits_type::eof(), inserter(target, 'a'));
    EXPECT_EQ("   ", target.sText_);
    target.nRoom_ = 9;
    EXPECT_EQ('a', inserter(target, 'a'));
    EXPECT_EQ('\n', inserter(target, '\n'));
    EXPECT_EQ('b', inserter(target, 'b'));
    EXPECT_EQ("   a\n   b", target.sText_);
}

} // namespace
