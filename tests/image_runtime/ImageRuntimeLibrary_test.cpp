#include "orvo/image_runtime/ImageRuntimeLibrary.h"

#include "orvo/core/CoreLibrary.h"
#include "orvo/ogl/Context.h"
#include "orvo/ogl/OGLLibrary.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <stdexcept>
#include <type_traits>

namespace ORVO::ImageRuntime {
namespace {

using Contexts = std::vector<OGL::Context const*>;

struct LowerLayers {
    Core::AutoInitializer oCore_;
    OGL::AutoInitializer oOGL_;
};

/// A host's context, of which nothing may be asked here.
class HostContext : public OGL::Context {
public:
    void makeCurrent() const override { ADD_FAILURE() << "made current"; }
    bool isSharingWithCurrentContext() const override { return false; }
};

VideoMemory::Configuration const oConfiguration;

TEST(ImageRuntimeLibrary, StartsOnTheCPUAlone) {
    LowerLayers const layers;
    EXPECT_FALSE(Library::isInitialized());
    Library::initialize(nullptr, oConfiguration);
    EXPECT_TRUE(Library::isInitialized());
    EXPECT_EQ(nullptr, Library::texturePool());
    EXPECT_EQ(nullptr, Library::shaderManager());
    EXPECT_EQ(Contexts(1, nullptr), Library::initializationContextList());
    EXPECT_FALSE(Library::bNativeIntrinsicsRegistered_);
    EXPECT_FALSE(Library::bInterpretedIntrinsicsRegistered_);
    Library::terminate();
    EXPECT_FALSE(Library::isInitialized());
}

TEST(ImageRuntimeLibrary, StartsAgainAfterItStopped) {
    LowerLayers const layers;
    for (int i = 0; i < 3; ++i) {
        Library::initialize(Contexts(1, nullptr), oConfiguration);
        EXPECT_TRUE(Library::isInitialized());
        Library::terminate();
        EXPECT_FALSE(Library::isInitialized());
    }
}

TEST(ImageRuntimeLibrary, NeedsTheBaseLibrary) {
    ASSERT_FALSE(Core::Library::isInitialized());
    ORVO_EXPECT_INTERNAL(Library::initialize(nullptr, oConfiguration), "Core::Library::isInitialized()");
    ORVO_EXPECT_INTERNAL(Library::terminate(), "Core::Library::isInitialized()");
    // The lower layers are asked for before the list is looked at.
    ORVO_EXPECT_INTERNAL(Library::initialize(Contexts(), oConfiguration), "Core::Library::isInitialized()");
    EXPECT_FALSE(Library::isInitialized());
}

TEST(ImageRuntimeLibrary, NeedsTheOpenGLLayer) {
    Core::AutoInitializer const core;
    ORVO_EXPECT_INTERNAL(Library::initialize(nullptr, oConfiguration), "OGL::Library::isInitialized()");
    ORVO_EXPECT_INTERNAL(Library::terminate(), "OGL::Library::isInitialized()");
    ORVO_EXPECT_INTERNAL(Library::initialize(Contexts(), oConfiguration), "OGL::Library::isInitialized()");
    EXPECT_FALSE(Library::isInitialized());
}

TEST(ImageRuntimeLibrary, RefusesAnEmptyList) {
    LowerLayers const layers;
    ORVO_EXPECT_INTERNAL(Library::initialize(Contexts(), oConfiguration), "vpContext.size()");
    EXPECT_FALSE(Library::isInitialized());
}

TEST(ImageRuntimeLibrary, RefusesASecondStart) {
    LowerLayers const layers;
    AutoInitializer const runtime(nullptr, oConfiguration);
    ORVO_EXPECT_INTERNAL(Library::initialize(nullptr, oConfiguration), "!pvDeviceObject_");
    // The list is looked at first.
    ORVO_EXPECT_INTERNAL(Library::initialize(Contexts(), oConfiguration), "vpContext.size()");
    EXPECT_TRUE(Library::isInitialized());
}

TEST(ImageRuntimeLibrary, RefusesANullContextBesideOthers) {
    LowerLayers const layers;
    HostContext const context;
    Contexts const refused[] = {{nullptr, &context}, {&context, nullptr}, {nullptr, nullptr}};
    for (Contexts const& list : refused) {
        ORVO_EXPECT_INTERNAL(Library::initialize(list, oConfiguration), "vpContext.size() == 1");
        EXPECT_FALSE(Library::isInitialized());
    }
}

TEST(ImageRuntimeLibrary, StopsWithoutHavingBeenStarted) {
    LowerLayers const layers;
    EXPECT_NO_THROW(Library::terminate());
    EXPECT_FALSE(Library::isInitialized());
}

TEST(ImageRuntimeLibrary, AnswersNothingBeforeItIsStarted) {
    ORVO_EXPECT_INTERNAL(Library::texturePool(), "Enforce pvDeviceObject_ != NULL");
    ORVO_EXPECT_INTERNAL(Library::shaderManager(), "Enforce pvDeviceObject_ != NULL");
    ORVO_EXPECT_INTERNAL(Library::initializationContextList(), "Enforce pvDeviceObject_ != NULL");
}

TEST(ImageRuntimeAutoInitializer, StopsTheLibraryWithItsScope) {
    LowerLayers const layers;
    {
        AutoInitializer const runtime(nullptr, oConfiguration);
        EXPECT_TRUE(Library::isInitialized());
    }
    EXPECT_FALSE(Library::isInitialized());
    {
        AutoInitializer const runtime(Contexts(1, nullptr), oConfiguration);
        EXPECT_TRUE(Library::isInitialized());
    }
    EXPECT_FALSE(Library::isInitialized());
    EXPECT_FALSE(std::is_copy_constructible_v<AutoInitializer>);
}

TEST(ImageRuntimeAutoInitializer, LeavesTheLibraryStartedOnceReleased) {
    LowerLayers const layers;
    {
        AutoInitializer runtime(nullptr, oConfiguration);
        runtime.release();
    }
    EXPECT_TRUE(Library::isInitialized());
    Library::terminate();
}

TEST(ImageRuntimeAutoInitializer, ThrowsWhatTheStartThrows) {
    LowerLayers const layers;
    ORVO_EXPECT_INTERNAL(AutoInitializer(Contexts(), oConfiguration), "vpContext.size()");
    AutoInitializer const runtime(nullptr, oConfiguration);
    ORVO_EXPECT_INTERNAL(AutoInitializer(nullptr, oConfiguration), "!pvDeviceObject_");
    // The failed one does not stop what the other one started.
    EXPECT_TRUE(Library::isInitialized());
}

TEST(ImageRuntimeAutoInitializer, LetsNoFailureOutOfItsDestructor) {
    auto pLayers = std::make_unique<LowerLayers>();
    auto pRuntime = std::make_unique<AutoInitializer>(nullptr, oConfiguration);
    pLayers.reset();
    EXPECT_NO_THROW(pRuntime.reset());
    EXPECT_TRUE(Library::isInitialized());

    LowerLayers const layers;
    Library::terminate();
}

} // namespace
} // namespace ORVO::ImageRuntime
