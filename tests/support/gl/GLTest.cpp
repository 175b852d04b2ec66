#include "tests/support/gl/GLTest.h"

#include <epoxy/gl.h>

#include "orvo/ogl/ExtensionManager.h"

namespace ORVO::Test {

GLTest::GLTest(std::string const& sInterface) : sInterface_(sInterface) {}
GLTest::~GLTest() = default;

void GLTest::SetUp() {
    pHost_ = HostContext::create(sInterface_);
    pHost_->makeCurrent();
    aObjects_ = GLHooks::objects();
    oState_ = GLState::capture();
    ASSERT_EQ(0U, drainErrors());
}

void GLTest::TearDown() {
    OGL::ExtensionManager::Instance()->clearOverrides();
    if (pHost_ == nullptr)
        return;
    pHost_->makeCurrent();
    EXPECT_EQ(0U, drainErrors()) << "An OpenGL error is pending";
    EXPECT_EQ("", oState_->differencesTo(GLState::capture())) << "The state is not as it was";
    EXPECT_EQ(aObjects_, GLHooks::objects()) << "Objects are left";
    pHost_.reset();
}

void GLTest::loseHost() { pHost_.reset(); }

unsigned GLTest::drainErrors() {
    GLenum const first = glGetError();
    for (int i = 0; i < 64 && glGetError() != GL_NO_ERROR; ++i) {
    }
    return first;
}

} // namespace ORVO::Test
