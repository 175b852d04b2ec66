/// Tests of programs in a host's context.
#pragma once

#include <memory>
#include <vector>

#include "tests/image_runtime/support/GLRuntimeTest.h"
#include "tests/support/Expect.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/FailEveryCall.h"

namespace ORVO::Test {

/// A test of the image runtime that can stop and start the library again, also on other contexts or on none.
class ShaderTest : public GLRuntimeTest {
protected:
    void TearDown() override {
        stopRuntime();
        GLRuntimeTest::TearDown();
    }

    void startRuntime() { startRuntime({context()}); }
    void startRuntime(std::vector<OGL::Context const*> const& vpContext) {
        pOtherRuntime_ =
            std::make_unique<ImageRuntime::AutoInitializer>(vpContext, VideoMemory::Configuration());
    }
    void stopRuntime() {
        pOtherRuntime_.reset();
        stopLibrary();
    }

    static long programs() { return GLHooks::objects()["program"]; }

private:
    std::unique_ptr<ImageRuntime::AutoInitializer> pOtherRuntime_;
};

} // namespace ORVO::Test
