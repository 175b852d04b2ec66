#pragma once

#include <memory>
#include <optional>

#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/VideoMemoryConfiguration.h"
#include "orvo/ogl/Context.h"
#include "tests/support/gl/GLTest.h"

namespace ORVO::Test {

/// A test of the image runtime in a host's context: the library is started with it. What a test makes of
/// OpenGL must be gone when its body ends, or be in the pool.
class GLRuntimeTest : public GLTest {
protected:
    explicit GLRuntimeTest(VideoMemory::Configuration const& configuration = VideoMemory::Configuration())
        : oConfiguration_(configuration) {}

    void SetUp() override {
        GLTest::SetUp();
        pContext_ = OGL::Context::adoptCurrent();
        oLibrary_.emplace(pContext_.get(), oConfiguration_);
    }

    void TearDown() override {
        host().makeCurrent();
        oLibrary_.reset();
        pContext_.reset();
        GLTest::TearDown();
    }

    OGL::Context const* context() const { return pContext_.get(); }
    /// Ends the library before the test does.
    void stopLibrary() { oLibrary_.reset(); }

private:
    VideoMemory::Configuration oConfiguration_;
    std::unique_ptr<OGL::Context> pContext_;
    std::optional<ImageRuntime::AutoInitializer> oLibrary_;
};

} // namespace ORVO::Test
