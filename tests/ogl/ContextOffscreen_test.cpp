#include "orvo/ogl/ContextOffscreen.h"

#include <epoxy/gl.h>

#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/ScopedContextWrapper.h"
#include "tests/support/Expect.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;

class ContextOffscreen : public Test::GLTestOnEachInterface {};

TEST_P(ContextOffscreen, SharesWithTheHostsContext) {
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const offscreen(pHost.get());
    EXPECT_EQ(host().handle(), OGL::NativeContext::currentHandle());
    EXPECT_TRUE(offscreen.isSharingWithCurrentContext());
    offscreen.makeCurrent();
    EXPECT_NE(host().handle(), OGL::NativeContext::currentHandle());
    EXPECT_TRUE(pHost->isSharingWithCurrentContext());
    EXPECT_TRUE(offscreen.isSharingWithCurrentContext());
}
ORVO_INSTANTIATE_ON_EACH_INTERFACE(ContextOffscreen);

} // namespace
