#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <string>

#include "orvo/core/CoreLibrary.h"
#include "orvo/ogl/OGLLibrary.h"
#include "tests/support/gl/GLHooks.h"
#include "tests/support/gl/GLState.h"
#include "tests/support/gl/HostContext.h"

namespace ORVO::Test {

/// A test in a host's context: the layers up to OpenGL are up, the context is current. At the end the context
/// is current again, with the state in which it was, no error pending, and no object left that was not there.
class GLTest : public testing::Test {
protected:
    explicit GLTest(std::string const& sInterface = "EGL");
    ~GLTest() override;

    void SetUp() override;
    void TearDown() override;

    HostContext& host() { return *pHost_; }
    /// For tests that end the host's context: nothing of it is looked at any more.
    void loseHost();

    /// Reads OpenGL's errors until there are none; the first.
    static unsigned drainErrors();

private:
    Core::AutoInitializer oCore_;
    OGL::AutoInitializer oOGL_;
    std::string sInterface_;
    std::unique_ptr<HostContext> pHost_;
    ObjectCounts aObjects_;
    std::optional<GLState> oState_;
};

/// The same for each interface that makes contexts: the parameter is "EGL" or "GLX".
class GLTestOnEachInterface : public GLTest, public testing::WithParamInterface<char const*> {
protected:
    GLTestOnEachInterface() : GLTest(GetParam()) {}
};

/// The name of the instance of a test.
inline std::string interfaceName(testing::TestParamInfo<char const*> const& instance) {
    return instance.param;
}

} // namespace ORVO::Test

#define ORVO_INSTANTIATE_ON_EACH_INTERFACE(Suite)                                                            \
    INSTANTIATE_TEST_SUITE_P(, Suite, testing::Values("EGL", "GLX"), ORVO::Test::interfaceName)
