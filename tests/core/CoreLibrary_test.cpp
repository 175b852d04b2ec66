#include "orvo/core/CoreLibrary.h"

#include "orvo/core/memory/AlignedMemory.h"
#include "orvo/core/memory/ImageStorage.h"
#include "tests/support/Expect.h"

namespace {

using namespace ORVO;

void* engineAddress(char const*, char const*, char const*) { return nullptr; }

TEST(CoreLibrary, StartsAndStops) {
    EXPECT_FALSE(Core::Library::isInitialized());
    Core::Library::initialize();
    EXPECT_TRUE(Core::Library::isInitialized());
    Core::Library::terminate();
    EXPECT_FALSE(Core::Library::isInitialized());
}

TEST(CoreLibrary, RefusesASecondStartAndASecondStop) {
    Core::Library::initialize();
    ORVO_EXPECT_INTERNAL(Core::Library::initialize(), "!isInitialized()");
    EXPECT_TRUE(Core::Library::isInitialized());
    Core::Library::terminate();
    ORVO_EXPECT_INTERNAL(Core::Library::terminate(), "isInitialized()");
}

TEST(CoreLibrary, HandsOutTheInstalledEntryPointOfTheColourEngineUntilItStops) {
    QuorGetAddressProc const pEmbedded = GetQuorGetAddressProc();
    ASSERT_NE(nullptr, pEmbedded);
    EXPECT_NE(nullptr, pEmbedded("VantleInterface2", "ProfileFromCode", "Vantle_ProfileFromCodeProc2"));
    EXPECT_EQ(nullptr, pEmbedded("VantleInterface3", "ProfileFromCode", "Vantle_ProfileFromCodeProc2"));
    {
        Core::AutoInitializer const core;
        Core::Library::setQuorGetAddressProc(engineAddress);
        EXPECT_EQ(&engineAddress, GetQuorGetAddressProc());
        Core::Library::setQuorGetAddressProc(nullptr);
        EXPECT_EQ(nullptr, GetQuorGetAddressProc());
        Core::Library::setQuorGetAddressProc(engineAddress);
    }
    EXPECT_EQ(pEmbedded, GetQuorGetAddressProc());
}

TEST(CoreLibrary, GivesHeldImageStorageBackWhenItStops) {
    Core::Library::initialize();
    ORVO_private::deleteAlignedMemory(MEMORY_TYPE_IMAGE,
                                      ORVO_private::newAlignedMemory(MEMORY_TYPE_IMAGE, 1000, 64));
    EXPECT_GT(Core::heldImageStorage(), 0u);
    Core::Library::terminate();
    EXPECT_EQ(0u, Core::heldImageStorage());
}

TEST(CoreAutoInitializer, KeepsTheLibraryUpForItsScope) {
    {
        Core::AutoInitializer const core;
        EXPECT_TRUE(Core::Library::isInitialized());
    }
    EXPECT_FALSE(Core::Library::isInitialized());
}

TEST(CoreAutoInitializer, LeavesTheLibraryUpAfterRelease) {
    {
        Core::AutoInitializer core;
        core.release();
    }
    EXPECT_TRUE(Core::Library::isInitialized());
    Core::Library::terminate();
}

TEST(CoreAutoInitializer, SwallowsAFailureToStop) {
    {
        Core::AutoInitializer const core;
        Core::Library::terminate();
    }
    EXPECT_FALSE(Core::Library::isInitialized());
}

TEST(CoreAutoInitializer, PassesAFailureToStartOn) {
    Core::AutoInitializer const core;
    ORVO_EXPECT_INTERNAL(Core::AutoInitializer(), "!isInitialized()");
    EXPECT_TRUE(Core::Library::isInitialized());
}

} // namespace
