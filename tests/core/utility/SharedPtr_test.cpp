#include "orvo/core/utility/SharedPtr.h"

#include <gtest/gtest.h>

#include <memory>

#include "orvo/core/memory/MemoryStatistics.h"

namespace {

using namespace ORVO;

/// Counts its objects.
struct Counted {
    Counted() { ++nAlive; }
    ~Counted() { --nAlive; }
    Counted(Counted const&) = delete;
    static int nAlive;
};
int Counted::nAlive = 0;

std::size_t objectsInUse() { return Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT); }

TEST(ORVODeleter, DestroysAndFreesInTheCategory) {
    std::size_t const before = objectsInUse();
    {
        std::shared_ptr<Counted> const spObject(ORVO_NEW Counted, ORVODeleter<Counted>());
        EXPECT_EQ(1, Counted::nAlive);
        EXPECT_EQ(before + 1, objectsInUse());
    }
    EXPECT_EQ(0, Counted::nAlive);
    EXPECT_EQ(before, objectsInUse());
}

TEST(ORVODeleter, TakesAnObjectOfPlainNewAndAConstOne) {
    { std::shared_ptr<Counted const> const spObject(new Counted, ORVODeleter<Counted const>()); }
    EXPECT_EQ(0, Counted::nAlive);
    ORVODeleter<Counted>()(nullptr);
}

TEST(ReleasableDeleter, DestroysUnlessItWasReleased) {
    std::size_t const before = objectsInUse();
    {
        std::shared_ptr<Counted> const spObject(ORVO_NEW Counted, ReleasableDeleter<Counted>());
        auto* const pDeleter = std::get_deleter<ReleasableDeleter<Counted>>(spObject);
        ASSERT_NE(nullptr, pDeleter);
        EXPECT_FALSE(pDeleter->isReleased());
    }
    EXPECT_EQ(0, Counted::nAlive);
    EXPECT_EQ(before, objectsInUse());

    Counted* const pObject = ORVO_NEW Counted;
    {
        std::shared_ptr<Counted> const spObject(pObject, ReleasableDeleter<Counted>());
        std::get_deleter<ReleasableDeleter<Counted>>(spObject)->release();
        EXPECT_TRUE(std::get_deleter<ReleasableDeleter<Counted>>(spObject)->isReleased());
    }
    EXPECT_EQ(1, Counted::nAlive);
    EXPECT_EQ(before + 1, objectsInUse());
    trackedDelete(pObject);
    EXPECT_EQ(0, Counted::nAlive);
}

TEST(ReleasableDeleter, IsNotFoundInAPointerOfOtherOwnership) {
    std::shared_ptr<Counted> const spObject(ORVO_NEW Counted, ORVODeleter<Counted>());
    EXPECT_EQ(nullptr, std::get_deleter<ReleasableDeleter<Counted>>(spObject));
}

TEST(NullDeleter, LeavesTheObjectAlone) {
    Counted object;
    { std::shared_ptr<Counted> const spObject(&object, NullDeleter()); }
    { std::shared_ptr<Counted const> const spObject(&object, NullDeleter()); }
    EXPECT_EQ(1, Counted::nAlive);
}

} // namespace
