// The main function of every test program. After each test, no tracked block may be left that was not there
// before. A test that hangs is ended.
#include <gtest/gtest.h>

#include <array>
#include <cstddef>
#include <iostream>
#include <sstream>
#include <string>

#include "orvo/core/memory/MemoryStatistics.h"
#include "tests/support/Watchdog.h"

namespace {

using ORVO::MEMORY_TYPE_IMAGE;
using ORVO::MEMORY_TYPE_OBJECT;
using ORVO::Core::MemoryStatistics;

/// Blocks in use, by category.
using Blocks = std::array<std::size_t, 2>;

Blocks blocksInUse() {
    return {MemoryStatistics::blocks(MEMORY_TYPE_OBJECT), MemoryStatistics::blocks(MEMORY_TYPE_IMAGE)};
}

/// What is left beyond the given blocks, in words; empty if nothing is.
std::string leftBeyond(Blocks const& before) {
    Blocks const after = blocksInUse();
    std::ostringstream text;
    if (after[1] > before[1])
        text << after[1] - before[1] << " blocks of image storage are left\n";
    if (after[0] > before[0]) {
        text << after[0] - before[0] << " tracked objects are left; all in use:\n";
        MemoryStatistics::writeObjects(text);
    }
    return text.str();
}

class LeakListener : public testing::EmptyTestEventListener {
    void OnTestStart(testing::TestInfo const&) override { aBefore_ = blocksInUse(); }

    void OnTestEnd(testing::TestInfo const&) override {
        std::string const sLeft = leftBeyond(aBefore_);
        if (!sLeft.empty())
            ADD_FAILURE() << sLeft;
    }

    Blocks aBefore_{};
};

class HangListener : public testing::EmptyTestEventListener {
    void OnTestStart(testing::TestInfo const& test) override {
        oWatchdog_.watch(test.test_suite_name(), test.name());
    }
    void OnTestEnd(testing::TestInfo const&) override { oWatchdog_.rest(); }

    ORVO::Test::Watchdog oWatchdog_;
};

} // namespace

int main(int argc, char** argv) {
    testing::InitGoogleTest(&argc, argv);
    // In front of the printer, so that what is left counts as a failure of the test that left it.
    auto& listeners = testing::UnitTest::GetInstance()->listeners();
    testing::TestEventListener* const pPrinter = listeners.Release(listeners.default_result_printer());
    listeners.Append(pPrinter);
    listeners.Append(new LeakListener);
    listeners.Append(new HangListener);

    // What a whole suite shares is freed after its last test.
    Blocks const before = blocksInUse();
    int const result = RUN_ALL_TESTS();
    std::string const sLeft = leftBeyond(before);
    if (!sLeft.empty())
        std::cerr << "At the end of the program:\n" << sLeft;
    return sLeft.empty() ? result : 1;
}
