// The check of the driver at the start of the image layer.

#include "orvo/image_flow/ImageFlowLibrary.h"

#include "orvo/data_flow/DataFlowLibrary.h"
#include "orvo/data_flow/librarian/NodeLibrarian.h"
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/VideoMemoryConfiguration.h"
#include "orvo/ogl/Context.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/NativeContext.h"
#include "tests/support/Expect.h"
#include "tests/support/gl/GLTest.h"

namespace ORVO {

namespace {

using ImageFlow::Library;

/// The layers below image flow, in the host's context or without one.
class ImageFlowLibraryGPUTest : public Test::GLTest {
protected:
    void start(bool bContext) {
        if (bContext)
            upContext_ = OGL::Context::adoptCurrent();
        upRuntime_ =
            std::make_unique<ImageRuntime::AutoInitializer>(upContext_.get(), VideoMemory::Configuration());
        upDataFlow_ = std::make_unique<DataFlow::AutoInitializer>();
    }
    void TearDown() override {
        upDataFlow_.reset();
        upRuntime_.reset();
        host().makeCurrent();
        upContext_.reset();
        GLTest::TearDown();
    }
    static OGL::ExtensionManager& manager() { return *OGL::ExtensionManager::Instance(); }

    /// Starts with a driver that lacks something, then with the true one.
    static void expectRefusal(char const* pMessage) {
        ORVO_EXPECT_RESOURCE(Library::initialize(true), pMessage);
        EXPECT_FALSE(Library::isInitialized());
        EXPECT_EQ(DataFlow::NodeLibrarian::Instance()->begin(), DataFlow::NodeLibrarian::Instance()->end());
        Library::initialize(false); // not asked for
        Library::terminate();
        manager().clearOverrides();
        Library::initialize(true);
        Library::terminate();
    }

private:
    std::unique_ptr<OGL::Context> upContext_;
    std::unique_ptr<ImageRuntime::AutoInitializer> upRuntime_;
    std::unique_ptr<DataFlow::AutoInitializer> upDataFlow_;
};

TEST_F(ImageFlowLibraryGPUTest, startsOnAContext) {
    start(true);
    EXPECT_FALSE(Library::cpuOnlyMode());
    void* const pCurrent = OGL::NativeContext::currentHandle();
    Library::initialize(true);
    EXPECT_EQ(pCurrent, OGL::NativeContext::currentHandle());
    EXPECT_TRUE(Library::isInitialized());
    Library::terminate();
    host().release();
    Library::initialize(true);
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
    Library::terminate();
}

TEST_F(ImageFlowLibraryGPUTest, needsAVersion) {
    start(true);
    struct Row {
        unsigned nMajor, nMinor;
        bool bPasses;
    };
    constexpr Row aRows[] = {{1, 0, false}, {1, 4, false}, {1, 5, true}, {2, 0, true}, {0, 9, true}};
    for (Row const& row : aRows) {
        manager().overrideVersion(row.nMajor, row.nMinor);
        manager().overrideSupport(OGL::EXTENSION_EXT_FRAMEBUFFER_OBJECT, true);
        manager().overrideSupport(OGL::EXTENSION_ARB_TEXTURE_NON_POWER_OF_TWO, true);
        if (row.bPasses) {
            Library::initialize(true);
            Library::terminate();
            manager().clearOverrides();
        } else {
            expectRefusal("Minimum OpenGL Version (1.5) not supported.");
        }
    }
}

TEST_F(ImageFlowLibraryGPUTest, needsFramebufferObjects) {
    start(true);
    manager().overrideSupport(OGL::EXTENSION_EXT_FRAMEBUFFER_OBJECT, false);
    expectRefusal("Framebuffer Object Extension not supported.");
}

TEST_F(ImageFlowLibraryGPUTest, needsTexturesOfAnySize) {
    start(true);
    manager().overrideSupport(OGL::EXTENSION_ARB_TEXTURE_NON_POWER_OF_TWO, false);
    expectRefusal("Non power of two textures not supported.");
}

TEST_F(ImageFlowLibraryGPUTest, checksNothingWithoutAContext) {
    start(false);
    EXPECT_TRUE(Library::cpuOnlyMode());
    manager().overrideVersion(1, 0);
    manager().overrideSupport(OGL::EXTENSION_EXT_FRAMEBUFFER_OBJECT, false);
    Library::initialize(true);
    Library::terminate();
}

} // namespace

} // namespace ORVO
