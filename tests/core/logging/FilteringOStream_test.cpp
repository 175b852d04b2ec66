#include "orvo/core/logging/FilteringOStream.h"

#include <gtest/gtest.h>

#include <cctype>
#include <iomanip>
#include <locale>
#include <sstream>
#include <string>

#include "orvo/core/logging/LoggingInserter.h"

namespace {

using namespace ORVO::Logging;
using Traits = std::streambuf::traits_type;

/// A filter of the test's own: capitals, and a refusal of '#'.
struct Capitals {
    int operator()(std::streambuf& target, int character) const {
        return character == '#' ? Traits::eof() : target.sputc(static_cast<char>(std::toupper(character)));
    }
};

/// Opens the protected operations.
template <typename Inserter>
struct OpenBuffer : FilteringOutputStreambuf<Inserter> {
    using FilteringOutputStreambuf<Inserter>::FilteringOutputStreambuf;
    using FilteringOutputStreambuf<Inserter>::overflow;
    using FilteringOutputStreambuf<Inserter>::underflow;
    using FilteringOutputStreambuf<Inserter>::sync;
};

TEST(FilteringOutputStreambuf, PassesCharactersThroughTheInserter) {
    std::stringbuf target;
    OpenBuffer<Capitals> buffer(&target);
    EXPECT_EQ(&target, buffer.target());
    EXPECT_EQ('A', buffer.overflow('a'));
    EXPECT_EQ("A", target.str());
    EXPECT_EQ(Traits::eof(), buffer.overflow('#'));
    EXPECT_EQ("A", target.str());
}

TEST(FilteringOutputStreambuf, ForwardsEndOfFileToSync) {
    std::stringbuf target;
    OpenBuffer<Capitals> buffer(&target);
    EXPECT_EQ(0, buffer.overflow(Traits::eof()));
    EXPECT_EQ(0, buffer.sync());
    EXPECT_EQ(Traits::eof(), buffer.underflow());
    EXPECT_EQ("", target.str());
}

TEST(FilteringOutputStreambuf, RefusesEveryCharacterWithoutATarget) {
    OpenBuffer<Capitals> buffer(nullptr);
    EXPECT_EQ(Traits::eof(), buffer.overflow('a'));
    EXPECT_EQ(0, buffer.overflow(Traits::eof()));
}

TEST(FilteringOStream, IndentsNestedDumpsByTwoBlanksALevel) {
    std::ostringstream target;
    target << "graph\n";
    {
        FilteringOStream<LoggingInserter> outer(target);
        outer.setIndent(2);
        outer << "node " << 1 << "\n";
        {
            FilteringOStream<LoggingInserter> inner(outer);
            inner.setIndent(2);
            inner << "input\n"
                  << "output\n";
        }
        outer << "node " << 2 << "\n";
    }
    target << "end\n";
    EXPECT_EQ("graph\n"
              "  node 1\n"
              "    input\n"
              "    output\n"
              "  node 2\n"
              "end\n",
              target.str());
}

TEST(FilteringOStream, TakesOverTheNumberFormat) {
    std::ostringstream target;
    target << std::hex << std::setprecision(3) << std::setfill('*');
    FilteringOStream<LoggingInserter> stream(target);
    stream << 255 << ' ' << 1.23456 << ' ' << std::setw(4) << 1;
    EXPECT_EQ("ff 1.23 ***1", target.str());
}

/// Numbers with a decimal comma.
struct DecimalComma : std::numpunct<char> {
    char do_decimal_point() const override { return ','; }
};

TEST(FilteringOStream, TakesOverTheLocale) {
    std::ostringstream target;
    target.imbue(std::locale(std::locale::classic(), new DecimalComma));
    FilteringOStream<LoggingInserter> stream(target);
    stream << 1.5;
    EXPECT_EQ("1,5", target.str());
}

TEST(FilteringOStream, GoesBadWhereTheInserterRefuses) {
    std::ostringstream target;
    FilteringOStream<Capitals> stream(target);
    stream << "ab#cd";
    EXPECT_FALSE(stream.good());
    EXPECT_EQ("AB", target.str());
    EXPECT_TRUE(target.good());
}

TEST(FilteringOStream, GoesBadOnAStreamWithoutABuffer) {
    std::ostream target(nullptr);
    FilteringOStream<LoggingInserter> stream(target);
    stream << "x";
    EXPECT_FALSE(stream.good());
}

} // namespace
