#include "apply_filter/Options.h"

#include <gtest/gtest.h>

#include <initializer_list>
#include <vector>

namespace example {
namespace {

Options parsed(std::initializer_list<char const*> arguments) {
    std::vector<char const*> all{"apply_filter"};
    all.insert(all.end(), arguments);
    return parseOptions(static_cast<int>(all.size()), all.data());
}

std::string refusal(std::initializer_list<char const*> arguments) {
    try {
        parsed(arguments);
    } catch (UsageError const& failure) {
        return failure.what();
    }
    return "accepted";
}

TEST(Options, ReadsEveryOption) {
    Options const options =
        parsed({"--filter", "F", "--set", "a=1,2", "--set", "b=x=y", "--precision", "16", "--target", "gl",
                "--threads", "3", "--repeat", "4", "--async", "in.png", "out.png"});
    EXPECT_EQ(options.filter, "F");
    ASSERT_EQ(options.values.size(), 2u);
    EXPECT_EQ(options.values[0], std::make_pair(std::string("a"), std::string("1,2")));
    EXPECT_EQ(options.values[1], std::make_pair(std::string("b"), std::string("x=y")));
    EXPECT_EQ(options.precision, Depth::uint15_1);
    EXPECT_EQ(options.target, Target::gl);
    EXPECT_EQ(options.threads, 3u);
    EXPECT_EQ(options.repeat, 4);
    EXPECT_TRUE(options.async);
    EXPECT_EQ(options.input, "in.png");
    EXPECT_EQ(options.output, "out.png");
}

TEST(Options, HasDefaults) {
    Options const options = parsed({"--filter", "F", "in", "out"});
    EXPECT_TRUE(options.values.empty());
    EXPECT_FALSE(options.precision.has_value());
    EXPECT_EQ(options.target, Target::cpu);
    EXPECT_EQ(parsed({"--filter", "F", "--target", "cpu", "in", "out"}).target, Target::cpu);
    EXPECT_EQ(options.threads, 0u);
    EXPECT_EQ(options.repeat, 1);
    EXPECT_FALSE(options.async);
    EXPECT_FALSE(options.list);
}

TEST(Options, ListAndHelpNeedNoFiles) {
    EXPECT_TRUE(parsed({"--list"}).list);
    EXPECT_TRUE(parsed({"--help"}).help);
}

TEST(Options, RefusesWithOneLine) {
    EXPECT_EQ(refusal({"--bogus", "1"}), "Unknown option --bogus (--help shows the options)");
    EXPECT_EQ(refusal({"--filter"}), "--filter needs a value");
    EXPECT_EQ(refusal({"in", "out"}), "--filter is missing (--list shows the filters)");
    EXPECT_EQ(refusal({"--filter", "F", "in"}), "An input and an output file are needed");
    EXPECT_EQ(refusal({"--filter", "F", "a", "b", "c"}), "An input and an output file are needed");
    EXPECT_EQ(refusal({"--set", "a"}), "--set needs NAME=VALUE, not \"a\"");
    EXPECT_EQ(refusal({"--set", "=1"}), "--set needs NAME=VALUE, not \"=1\"");
    EXPECT_EQ(refusal({"--precision", "12"}), "--precision is 8, 16 or 32f, not \"12\"");
    EXPECT_EQ(refusal({"--target", "gpu"}), "--target is cpu or gl, not \"gpu\"");
    EXPECT_EQ(refusal({"--threads", "0"}), "--threads needs a whole number of 1 or more, not \"0\"");
    EXPECT_EQ(refusal({"--threads", "two"}), "--threads needs a whole number of 1 or more, not \"two\"");
    EXPECT_EQ(refusal({"--repeat", "1x"}), "--repeat needs a whole number of 1 or more, not \"1x\"");
    EXPECT_EQ(refusal({"--repeat", "-1"}), "--repeat needs a whole number of 1 or more, not \"-1\"");
}

} // namespace
} // namespace example
