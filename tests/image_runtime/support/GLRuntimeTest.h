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
        if (pContext_ != nullptr) {
            host().makeCurrent();
            oLibrary_.reset();
            pContext_.reset();
        }
        GLTest::TearDown();
    }

    /// For tests that end the host's context: ends the library, and nothing of the context is looked at any
    /// more.
    void loseHost() {
        oLibrary_.reset();
        pContext_.reset();
        GLTest::loseHost();
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
