// The reader of command lines that the programs share.
#include "common/CommandLine.h"

#include <gtest/gtest.h>

#include <initializer_list>
#include <string>
#include <vector>

namespace example {
namespace {

// A program with an option of every kind.
struct Sample {
    bool flag = false;
    std::string text;
    int number = 0;
    std::vector<std::string> files;

    // What the command line is refused with; empty where it is not.
    std::string read(std::initializer_list<char const*> arguments) {
        std::vector<char const*> all{"program"};
        all.insert(all.end(), arguments);
        CommandLine commandLine;
        commandLine.addFlag("--flag", flag);
        commandLine.addText("--text", text);
        commandLine.addNumber("--number", number);
        try {
            files = commandLine.read(static_cast<int>(all.size()), all.data());
        } catch (UsageError const& failure) {
            return failure.what();
        }
        return {};
    }
};

TEST(CommandLine, TakesOptionsAndFilesInAnyOrder) {
    Sample sample;
    EXPECT_EQ(sample.read({"in", "--text", "a b", "--flag", "out", "--number", "7"}), "");
    EXPECT_TRUE(sample.flag);
    EXPECT_EQ(sample.text, "a b");
    EXPECT_EQ(sample.number, 7);
    EXPECT_EQ(sample.files, (std::vector<std::string>{"in", "out"}));
}

TEST(CommandLine, TakesAValueBehindAnEqualsSign) {
    Sample sample;
    EXPECT_EQ(sample.read({"--text=x=y", "--number=12"}), "");
    EXPECT_EQ(sample.text, "x=y");
    EXPECT_EQ(sample.number, 12);
    EXPECT_EQ(sample.read({"--text="}), "");
    EXPECT_EQ(sample.text, "");
    EXPECT_EQ(sample.read({"--text=--flag"}), "");
    EXPECT_EQ(sample.text, "--flag");
    EXPECT_FALSE(sample.flag);
}

TEST(CommandLine, TakesAllBehindTwoDashesAsFiles) {
    Sample sample;
    EXPECT_EQ(sample.read({"--flag", "--", "--text", "-x", "--"}), "");
    EXPECT_EQ(sample.files, (std::vector<std::string>{"--text", "-x", "--"}));
    EXPECT_EQ(sample.read({"-", ""}), "");
    EXPECT_EQ(sample.files, (std::vector<std::string>{"-", ""}));
}

TEST(CommandLine, RefusesWhatItDoesNotKnow) {
    Sample sample;
    EXPECT_EQ(sample.read({"--wrong"}), "Unknown option --wrong (--help shows the options)");
    EXPECT_EQ(sample.read({"--wrong=1"}), "Unknown option --wrong (--help shows the options)");
    EXPECT_EQ(sample.read({"-t", "x"}), "Unknown option -t (--help shows the options)");
    EXPECT_EQ(sample.read({"--flags"}), "Unknown option --flags (--help shows the options)");
}

TEST(CommandLine, RefusesMissingAndNeedlessValues) {
    Sample sample;
    EXPECT_EQ(sample.read({"--text"}), "--text needs a value");
    EXPECT_EQ(sample.read({"--text", "--flag"}), "--text needs a value");
    EXPECT_EQ(sample.read({"--flag=1"}), "--flag has no value");
}

TEST(CommandLine, RefusesWhatIsNoNumber) {
    Sample sample;
    for (std::string const value : {"0", "-3", "-99999999999", "seven", "7x", "", " 7", "1.5"})
        EXPECT_EQ(sample.read({"--number", value.c_str()}),
                  "--number needs a whole number of 1 or more, not \"" + value + "\"");
    EXPECT_EQ(sample.read({"--number", "2147483647"}), "");
    EXPECT_EQ(sample.number, 2147483647);
    EXPECT_EQ(sample.read({"--number", "2147483648"}), "--number is too large: 2147483648");
}

} // namespace
} // namespace example
