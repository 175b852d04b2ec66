#include "orvo/image_runtime/VideoMemoryConfiguration.h"

#include "tests/support/Slots.h"

#include <gtest/gtest.h>

namespace ORVO::VideoMemory {
namespace {

class CountingListener : public VideoMemoryListener {
public:
    void impendingMemoryAllcation(std::size_t nBytes) override { nImpending_ += nBytes; }
    void memoryFreed(std::size_t nBytes) override { nFreed_ += nBytes; }
    void memoryAllocated(std::size_t nBytes) override { nAllocated_ += nBytes; }

    std::size_t nImpending_ = 0;
    std::size_t nFreed_ = 0;
    std::size_t nAllocated_ = 0;
};

TEST(VideoMemoryConfiguration, HasItsDefaults) {
    Configuration const configuration;
    EXPECT_EQ(134217728u, configuration.maximumTexturePoolSize());
    EXPECT_EQ(GlobalDefaultListener(), configuration.videoMemoryListener());
    EXPECT_NE(nullptr, configuration.videoMemoryListener());
    EXPECT_FALSE(configuration.prohibitReuseLargerTextures());
}

TEST(VideoMemoryConfiguration, KeepsWhatIsSet) {
    CountingListener listener;
    Configuration configuration;
    configuration.setMaximumTexturePoolSize(42);
    configuration.setVideoMemoryListener(&listener);
    configuration.setProhibitReuseLargerTextures(true);

    Configuration const copy = configuration;
    EXPECT_EQ(42u, copy.maximumTexturePoolSize());
    EXPECT_EQ(&listener, copy.videoMemoryListener());
    EXPECT_TRUE(copy.prohibitReuseLargerTextures());
}

TEST(VideoMemoryListener, HasItsOperationsInOrder) {
    // The destructor stands first.
    EXPECT_EQ(2, ORVO::Test::slotOf(&VideoMemoryListener::impendingMemoryAllcation));
    EXPECT_EQ(3, ORVO::Test::slotOf(&VideoMemoryListener::memoryFreed));
    EXPECT_EQ(4, ORVO::Test::slotOf(&VideoMemoryListener::memoryAllocated));
}

TEST(VideoMemoryListener, MayBeOverridden) {
    CountingListener listener;
    VideoMemoryListener& base = listener;
    base.impendingMemoryAllcation(1);
    base.memoryAllocated(2);
    base.memoryFreed(3);
    EXPECT_EQ(1u, listener.nImpending_);
    EXPECT_EQ(2u, listener.nAllocated_);
    EXPECT_EQ(3u, listener.nFreed_);
}

TEST(VideoMemoryListener, IsOneForTheProcessByDefaultAndTakesAllCalls) {
    VideoMemoryListener* pListener = GlobalDefaultListener();
    EXPECT_NO_THROW({
        pListener->impendingMemoryAllcation(1);
        pListener->memoryAllocated(1);
        pListener->memoryFreed(1);
    });
    EXPECT_EQ(pListener, GlobalDefaultListener());
}

} // namespace
} // namespace ORVO::VideoMemory
