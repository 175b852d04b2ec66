#include "orvo/data_flow/data/ConstDataPointer.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "tests/data_flow/connectors/Payload.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <new>
#include <utility>

namespace {

using ORVO::DataFlow::ConstDataPointer;
using ORVO::Test::Payload;

class ConstDataPointerTest : public testing::Test {
protected:
    void SetUp() override { Payload::resetCounts(); }
    void TearDown() override { EXPECT_EQ(0, Payload::nAlive); }
};

TEST_F(ConstDataPointerTest, IsEmptyAtFirst) {
    ConstDataPointer<Payload> spData;
    EXPECT_EQ(nullptr, spData.get());
    EXPECT_EQ(nullptr, std::as_const(spData).get());
    EXPECT_EQ(0, spData.useCount());
    ORVO_EXPECT_INTERNAL(*spData, "Enforce spData_.get() != NULL");
    ORVO_EXPECT_INTERNAL(*std::as_const(spData), "Enforce spData_.get() != NULL");
    ORVO_EXPECT_INTERNAL((void)spData->iValue_, "Enforce spData_.get() != NULL");
    ORVO_EXPECT_INTERNAL((void)std::as_const(spData)->iValue_, "Enforce spData_.get() != NULL");
}

TEST_F(ConstDataPointerTest, FreesWhatTheConstructorTook) {
    Payload* const pPayload = ORVO_NEW Payload(7);
    {
        ConstDataPointer<Payload> spData(pPayload);
        EXPECT_EQ(pPayload, spData.get());
        EXPECT_EQ(7, spData->iValue_);
        EXPECT_EQ(7, (*std::as_const(spData)).iValue_);
        EXPECT_EQ(1, Payload::nAlive);
    }
    EXPECT_EQ(0, Payload::nAlive);
}

TEST_F(ConstDataPointerTest, TakesAPlainlyAllocatedObject) {
    ConstDataPointer<Payload> spData(new Payload(1));
    spData.setDataWithRegularOwnership(new Payload(2));
    EXPECT_EQ(1, Payload::nAlive);
    EXPECT_EQ(2, spData->iValue_);
}

TEST_F(ConstDataPointerTest, EverySetterDropsWhatWasHeld) {
    Payload oClients(9);
    ConstDataPointer<Payload> spData;
    spData.setData(ORVO_NEW Payload(1));
    spData.setDataWithReleasableOwnership(ORVO_NEW Payload(2));
    EXPECT_EQ(2, Payload::nAlive);
    spData.setDataWithRegularOwnership(ORVO_NEW Payload(3));
    EXPECT_EQ(2, Payload::nAlive);
    spData.setDataWithNoOwnership(&oClients);
    EXPECT_EQ(1, Payload::nAlive);
    EXPECT_EQ(&oClients, spData.get());
    spData.reset();
    EXPECT_EQ(1, Payload::nAlive);
}

TEST_F(ConstDataPointerTest, NullEmptiesIt) {
    ConstDataPointer<Payload> spData(ORVO_NEW Payload(1));
    spData.setData(nullptr);
    EXPECT_EQ(nullptr, spData.get());
    EXPECT_EQ(0, spData.useCount());
    spData.setDataWithRegularOwnership(ORVO_NEW Payload(1));
    spData.setDataWithRegularOwnership(nullptr);
    EXPECT_EQ(0, spData.useCount());
    spData.setDataWithNoOwnership(nullptr);
    EXPECT_EQ(0, spData.useCount());
    EXPECT_EQ(0, Payload::nAlive);
}

TEST_F(ConstDataPointerTest, TheLastHolderFrees) {
    ConstDataPointer<Payload> spFirst;
    spFirst.setDataWithRegularOwnership(ORVO_NEW Payload(1));
    {
        ConstDataPointer<Payload> const spSecond(spFirst);
        EXPECT_EQ(2, spFirst.useCount());
        spFirst.reset();
        EXPECT_EQ(1, Payload::nAlive);
        EXPECT_EQ(1, spSecond->iValue_);
    }
    EXPECT_EQ(0, Payload::nAlive);
}

TEST_F(ConstDataPointerTest, LeavesAnObjectThatItDoesNotOwn) {
    Payload oClients(5);
    {
        ConstDataPointer<Payload> spData;
        spData.setDataWithNoOwnership(&oClients);
        ConstDataPointer<Payload> const spCopy(spData);
        EXPECT_EQ(&oClients, spCopy.get());
    }
    EXPECT_EQ(1, Payload::nAlive);
    EXPECT_EQ(5, oClients.iValue_);
}

TEST_F(ConstDataPointerTest, MoveGivesTheObjectAndDropsTheOther) {
    Payload* const pPayload = ORVO_NEW Payload(1);
    ConstDataPointer<Payload> spSource(pPayload);
    ConstDataPointer<Payload> spDestination(ORVO_NEW Payload(2));
    spSource.moveTo(spDestination);
    EXPECT_EQ(nullptr, spSource.get());
    EXPECT_EQ(pPayload, spDestination.get());
    EXPECT_EQ(1, Payload::nAlive);
    EXPECT_EQ(0, Payload::nCopies);
}

TEST_F(ConstDataPointerTest, MoveOfNothingEmptiesTheDestination) {
    ConstDataPointer<Payload> spSource;
    ConstDataPointer<Payload> spDestination(ORVO_NEW Payload(2));
    spSource.moveTo(spDestination);
    EXPECT_EQ(nullptr, spDestination.get());
    spDestination.setData(ORVO_NEW Payload(3));
    spSource.moveToMutable(spDestination);
    EXPECT_EQ(nullptr, spDestination.get());
    EXPECT_EQ(0, Payload::nAlive);
}

TEST_F(ConstDataPointerTest, MoveToItselfDoesNothing) {
    Payload* const pPayload = ORVO_NEW Payload(1);
    ConstDataPointer<Payload> spData(pPayload);
    spData.moveTo(spData);
    EXPECT_EQ(pPayload, spData.get());
    spData.moveToMutable(spData);
    EXPECT_EQ(pPayload, spData.get());
    ConstDataPointer<Payload> const spOther(spData);
    spData.moveToMutable(spData);
    ASSERT_NE(nullptr, spData.get());
    EXPECT_NE(pPayload, spData.get());
    EXPECT_EQ(1, spData->iValue_);
}

TEST_F(ConstDataPointerTest, MoveToMutableOfTheOnlyHolderMakesNoCopy) {
    Payload* const pPayload = ORVO_NEW Payload(1);
    ConstDataPointer<Payload> spSource(pPayload);
    ConstDataPointer<Payload> spDestination;
    spSource.moveToMutable(spDestination);
    EXPECT_EQ(pPayload, spDestination.get());
    EXPECT_EQ(nullptr, spSource.get());
    EXPECT_EQ(0, Payload::nCopies);
}

TEST_F(ConstDataPointerTest, MoveToMutableOfASharedObjectGivesADistinctOne) {
    ConstDataPointer<Payload> spSource(ORVO_NEW Payload(1));
    ConstDataPointer<Payload> const spOther(spSource);
    ConstDataPointer<Payload> spDestination;
    spSource.moveToMutable(spDestination);
    EXPECT_EQ(nullptr, spSource.get());
    ASSERT_NE(nullptr, spDestination.get());
    EXPECT_NE(spOther.get(), spDestination.get());
    spDestination->iValue_ = 2;
    EXPECT_EQ(1, spOther->iValue_);
    EXPECT_EQ(1, spOther.useCount());
    EXPECT_EQ(1, Payload::nCopies);
    // The copy is releasable, whatever the original was.
    Payload* const pCopy = spDestination.get();
    EXPECT_TRUE(spDestination.release());
    ORVO::trackedDelete(pCopy);
}

TEST_F(ConstDataPointerTest, MoveToMutableIntoTheOtherHolder) {
    ConstDataPointer<Payload> spSource(ORVO_NEW Payload(1));
    ConstDataPointer<Payload> spDestination(spSource);
    spSource.moveToMutable(spDestination);
    EXPECT_EQ(nullptr, spSource.get());
    EXPECT_EQ(1, spDestination->iValue_);
    EXPECT_EQ(1, Payload::nAlive);
}

TEST_F(ConstDataPointerTest, AFailedCopyChangesNothing) {
    ConstDataPointer<Payload> spSource(ORVO_NEW Payload(1));
    ConstDataPointer<Payload> const spOther(spSource);
    ConstDataPointer<Payload> spDestination(ORVO_NEW Payload(2));
    Payload::bCopiesFail = true;
    EXPECT_THROW(spSource.moveToMutable(spDestination), std::runtime_error);
    EXPECT_EQ(spOther.get(), spSource.get());
    EXPECT_EQ(2, spDestination->iValue_);
    EXPECT_EQ(2, Payload::nAlive);
    Payload::bCopiesFail = false;
    ORVO::Core::AllocationFailure oFailure(1);
    EXPECT_THROW(spSource.moveToMutable(spDestination), std::bad_alloc);
    EXPECT_EQ(spOther.get(), spSource.get());
    EXPECT_EQ(2, spDestination->iValue_);
}

TEST_F(ConstDataPointerTest, ReleaseOfNothingIsTrue) {
    ConstDataPointer<Payload> spData;
    EXPECT_TRUE(spData.release());
}

TEST_F(ConstDataPointerTest, AReleasedObjectSurvives) {
    Payload* const pPayload = ORVO_NEW Payload(1);
    ConstDataPointer<Payload> spData(pPayload);
    EXPECT_TRUE(spData.release());
    EXPECT_EQ(nullptr, spData.get());
    EXPECT_EQ(1, Payload::nAlive);
    ORVO::trackedDelete(pPayload);
}

TEST_F(ConstDataPointerTest, ReleaseOfASharedObjectIsFalseAndHoldsForAllHolders) {
    Payload* const pPayload = ORVO_NEW Payload(1);
    ConstDataPointer<Payload> spData(pPayload);
    ConstDataPointer<Payload> spOther(spData);
    EXPECT_FALSE(spData.release());
    EXPECT_EQ(nullptr, spData.get());
    EXPECT_EQ(pPayload, spOther.get());
    spOther.reset();
    EXPECT_EQ(1, Payload::nAlive);
    ORVO::trackedDelete(pPayload);
}

TEST_F(ConstDataPointerTest, ReleaseFailsForOtherKindsOfOwnership) {
    Payload oClients(1);
    ConstDataPointer<Payload> spData;
    spData.setDataWithNoOwnership(&oClients);
    ORVO_EXPECT_INTERNAL(spData.release(), "Enforce deleter != NULL");
    EXPECT_EQ(&oClients, spData.get());
    spData.setDataWithRegularOwnership(ORVO_NEW Payload(2));
    ORVO_EXPECT_INTERNAL(spData.release(), "Enforce deleter != NULL");
    EXPECT_EQ(2, spData->iValue_);
}

struct Incomplete;

TEST_F(ConstDataPointerTest, MayHoldNothingOfAnIncompleteType) {
    ConstDataPointer<Incomplete> const spData;
    EXPECT_EQ(nullptr, spData.get());
}

} // namespace
