#include "orvo/core/utility/ScopedPtr.h"

#include <gtest/gtest.h>

#include <type_traits>
#include <utility>

namespace {

using namespace ORVO;

struct Counted {
    Counted() { ++nAlive; }
    ~Counted() { --nAlive; }
    Counted(Counted const&) = delete;
    int iValue_ = 5;
    static int nAlive;
};
int Counted::nAlive = 0;

TEST(ScopedPtr, OwnsItsObjectForAScope) {
    {
        ScopedPtr<Counted> const pObject(ORVO_NEW Counted);
        EXPECT_TRUE(pObject);
        EXPECT_EQ(5, pObject->iValue_);
        EXPECT_EQ(5, (*pObject).iValue_);
        EXPECT_EQ(&*pObject, pObject.get());
        EXPECT_EQ(1, Counted::nAlive);
    }
    EXPECT_EQ(0, Counted::nAlive);
    ScopedPtr<Counted> const pEmpty;
    EXPECT_FALSE(pEmpty);
    EXPECT_EQ(nullptr, pEmpty.get());
}

TEST(ScopedPtr, IsResetAndReleased) {
    ScopedPtr<Counted> pObject(ORVO_NEW Counted);
    pObject.reset(pObject.get());
    EXPECT_EQ(1, Counted::nAlive);
    pObject.reset(ORVO_NEW Counted);
    EXPECT_EQ(1, Counted::nAlive);
    Counted* const pReleased = pObject.release();
    EXPECT_FALSE(pObject);
    EXPECT_EQ(1, Counted::nAlive);
    trackedDelete(pReleased);
    pObject.reset();
    EXPECT_EQ(0, Counted::nAlive);
}

TEST(ScopedPtr, IsMovedAndSwappedButNotCopied) {
    static_assert(!std::is_copy_constructible_v<ScopedPtr<Counted>>);
    static_assert(!std::is_copy_assignable_v<ScopedPtr<Counted>>);
    ScopedPtr<Counted> pFirst(ORVO_NEW Counted);
    Counted* const pObject = pFirst.get();
    ScopedPtr<Counted> pSecond(std::move(pFirst));
    EXPECT_FALSE(pFirst);
    EXPECT_EQ(pObject, pSecond.get());
    pFirst.swap(pSecond);
    EXPECT_EQ(pObject, pFirst.get());
    pSecond = ScopedPtr<Counted>(ORVO_NEW Counted);
    EXPECT_EQ(2, Counted::nAlive);
    pSecond = std::move(pFirst);
    EXPECT_EQ(1, Counted::nAlive);
    EXPECT_EQ(pObject, pSecond.get());
}

} // namespace
