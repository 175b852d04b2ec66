// The main function of every test program. After each test, no tracked block may be left that was not there
// before.
#include <gtest/gtest.h>

#include <array>
#include <cstddef>
#include <sstream>

#include "orvo/core/memory/MemoryStatistics.h"

namespace {

using ORVO::MEMORY_TYPE_IMAGE;
using ORVO::MEMORY_TYPE_OBJECT;
using ORVO::Core::MemoryStatistics;

class LeakListener : public testing::EmptyTestEventListener {
    void OnTestStart(testing::TestInfo const&) override { aBefore_ = blocksInUse(); }

    void OnTestEnd(testing::TestInfo const&) override {
        auto const after = blocksInUse();
        if (after[1] > aBefore_[1])
            ADD_FAILURE() << after[1] - aBefore_[1] << " blocks of image storage are left";
        if (after[0] > aBefore_[0]) {
            std::ostringstream sites;
            MemoryStatistics::writeObjects(sites);
            ADD_FAILURE() << after[0] - aBefore_[0] << " tracked objects are left; all in use:\n"
                          << sites.str();
        }
    }

    static std::array<std::size_t, 2> blocksInUse() {
        return {MemoryStatistics::blocks(MEMORY_TYPE_OBJECT), MemoryStatistics::blocks(MEMORY_TYPE_IMAGE)};
    }

    std::array<std::size_t, 2> aBefore_{};
};

} // namespace

int main(int argc, char** argv) {
    testing::InitGoogleTest(&argc, argv);
    // In front of the printer, so that what is left counts as a failure of the test that left it.
    auto& listeners = testing::UnitTest::GetInstance()->listeners();
    testing::TestEventListener* const pPrinter = listeners.Release(listeners.default_result_printer());
    listeners.Append(pPrinter);
    listeners.Append(new LeakListener);
    return RUN_ALL_TESTS();
}
