#include "orvo/ogl/Framebuffer.h"

#include <epoxy/gl.h>

#include <array>
#include <memory>
#include <thread>

#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/TextureRECT.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/FailEveryCall.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;
using OGL::Framebuffer;

constexpr auto eRGBA8 = OGL::Texture::INTERNAL_FORMAT_RGBA8;

GLuint boundFramebuffer() {
    GLint value = 0;
    glGetIntegerv(GL_FRAMEBUFFER_BINDING, &value);
    return static_cast<GLuint>(value);
}

class FramebufferTest : public ORVO::Test::GLTestOnEachInterface {};

TEST_P(FramebufferTest, IsBoundAndUnbound) {
    Framebuffer framebuffer;
    EXPECT_EQ(static_cast<unsigned>(GL_FRAMEBUFFER), framebuffer.target());
    EXPECT_NE(0U, framebuffer.objectID());
    EXPECT_FALSE(framebuffer.isBound());
    framebuffer.bind();
    EXPECT_TRUE(framebuffer.isBound());
    EXPECT_EQ(framebuffer.objectID(), boundFramebuffer());
    EXPECT_EQ(framebuffer.objectID(), framebuffer.getBoundID());
    framebuffer.unbind();
    EXPECT_EQ(0U, boundFramebuffer());
}

TEST_P(FramebufferTest, DrawsIntoItsTexture) {
    OGL::Texture2D texture(eRGBA8, 2, 1, false, nullptr);
    Framebuffer framebuffer;
    framebuffer.bind();
    framebuffer.attach(&texture, 0, 0);
    unsigned nStatus = 17;
    EXPECT_TRUE(framebuffer.statusOkay(&nStatus));
    EXPECT_EQ(17U, nStatus);
    glClearColor(1, 0, 1, 0);
    glClear(GL_COLOR_BUFFER_BIT);
    glClearColor(0, 0, 0, 0);
    std::array<unsigned char, 8> aRead{};
    glReadPixels(0, 0, 2, 1, GL_RGBA, GL_UNSIGNED_BYTE, aRead.data());
    EXPECT_EQ((std::array<unsigned char, 8>{255, 0, 255, 0, 255, 0, 255, 0}), aRead);
    framebuffer.detach(&texture, 0);
    EXPECT_FALSE(framebuffer.statusOkay(&nStatus));
    EXPECT_EQ(static_cast<unsigned>(GL_FRAMEBUFFER_INCOMPLETE_MISSING_ATTACHMENT), nStatus);
    EXPECT_FALSE(framebuffer.statusOkay(nullptr));
    framebuffer.unbind();
}

TEST_P(FramebufferTest, AttachesOtherLevelsTargetsAndPlaces) {
    OGL::Texture2D mipmapped(eRGBA8, 4, 4, true, nullptr);
    OGL::TextureRECT rectangle(eRGBA8, 2, 2, nullptr);
    Framebuffer framebuffer;
    framebuffer.bind();
    framebuffer.attach(&mipmapped, 0, 1);
    EXPECT_TRUE(framebuffer.statusOkay(nullptr));
    GLint nLevel = -1;
    glGetFramebufferAttachmentParameteriv(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0,
                                          GL_FRAMEBUFFER_ATTACHMENT_TEXTURE_LEVEL, &nLevel);
    EXPECT_EQ(1, nLevel);
    framebuffer.attach(&rectangle, 1, 0);
    EXPECT_TRUE(framebuffer.statusOkay(nullptr));
    framebuffer.detach(&rectangle, 1);
    framebuffer.detach(&mipmapped, 0);
    framebuffer.unbind();
}

TEST_P(FramebufferTest, DetachesNoOtherTexture) {
    OGL::Texture2D attached(eRGBA8, 1, 1, false, nullptr);
    OGL::Texture2D other(eRGBA8, 1, 1, false, nullptr);
    Framebuffer framebuffer;
    framebuffer.bind();
    framebuffer.detach(&other, 0);
    framebuffer.attach(&attached, 0, 0);
    framebuffer.detach(&other, 0);
    EXPECT_TRUE(framebuffer.statusOkay(nullptr));
    framebuffer.detach(&attached, 0);
    EXPECT_FALSE(framebuffer.statusOkay(nullptr));
    framebuffer.unbind();
}

TEST_P(FramebufferTest, IsChangedOnlyWhileBound) {
    OGL::Texture2D texture(eRGBA8, 1, 1, false, nullptr);
    Framebuffer framebuffer;
    ORVO_EXPECT_INTERNAL(framebuffer.attach(&texture, 0, 0), "isBound()");
    ORVO_EXPECT_INTERNAL(framebuffer.detach(&texture, 0), "isBound()");
    ORVO_EXPECT_INTERNAL(framebuffer.statusOkay(nullptr), "isBound()");
    framebuffer.bind();
    ORVO_EXPECT_INTERNAL(framebuffer.attach(nullptr, 0, 0), "Enforce pTexture != NULL");
    ORVO_EXPECT_INTERNAL(framebuffer.detach(nullptr, 0), "Enforce pTexture != NULL");
    framebuffer.unbind();
}

TEST_P(FramebufferTest, HasANameInEachContext) {
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const offscreen(pHost.get());
    OGL::Texture2D texture(eRGBA8, 3, 3, false, nullptr);
    Framebuffer framebuffer;
    unsigned const nName = framebuffer.objectID();
    framebuffer.bind();
    framebuffer.attach(&texture, 0, 0);
    offscreen.makeCurrent();
    EXPECT_EQ(0U, framebuffer.objectID());
    EXPECT_FALSE(framebuffer.isBound());
    framebuffer.bind();
    EXPECT_NE(0U, framebuffer.objectID());
    EXPECT_TRUE(framebuffer.isBound());
    // The attachment is the other context's.
    EXPECT_FALSE(framebuffer.statusOkay(nullptr));
    framebuffer.attach(&texture, 0, 0);
    EXPECT_TRUE(framebuffer.statusOkay(nullptr));
    framebuffer.unbind();
    pHost->makeCurrent();
    EXPECT_EQ(nName, framebuffer.objectID());
    EXPECT_TRUE(framebuffer.statusOkay(nullptr));
    framebuffer.detach(&texture, 0);
    framebuffer.unbind();
    EXPECT_EQ(2, ORVO::Test::GLHooks::objects()["framebuffer"]);
}

TEST_P(FramebufferTest, LeavesForeignNamesAloneWhereItDiesInAnotherContext) {
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const offscreen(pHost.get());
    auto pFramebuffer = std::make_unique<Framebuffer>();
    offscreen.makeCurrent();
    // On drivers that count framebuffers in each context this one bears the same number.
    GLuint nForeign = 0;
    glGenFramebuffers(1, &nForeign);
    glBindFramebuffer(GL_FRAMEBUFFER, nForeign);
    glBindFramebuffer(GL_FRAMEBUFFER, 0);
    pFramebuffer.reset();
    EXPECT_EQ(GL_TRUE, glIsFramebuffer(nForeign));
    EXPECT_EQ(2, ORVO::Test::GLHooks::objects()["framebuffer"]);
    // Deleted as soon as its own context is current.
    pHost->makeCurrent();
    EXPECT_EQ(1, ORVO::Test::GLHooks::objects()["framebuffer"]);
    offscreen.makeCurrent();
    glDeleteFramebuffers(1, &nForeign);
}

TEST_P(FramebufferTest, TakesItsNameBackAfterDyingWithoutAContext) {
    auto const pHost = OGL::Context::adoptCurrent();
    auto pFramebuffer = std::make_unique<Framebuffer>();
    host().release();
    pFramebuffer.reset();
    host().makeCurrent();
    EXPECT_EQ(1, ORVO::Test::GLHooks::objects()["framebuffer"]);
    // A host's own switch of contexts is not seen; the next framebuffer that is made here is.
    { Framebuffer const next; }
    EXPECT_EQ(0, ORVO::Test::GLHooks::objects()["framebuffer"]);
}

TEST_P(FramebufferTest, ForgetsNamesOfContextsThatHaveDied) {
    auto const pHost = OGL::Context::adoptCurrent();
    auto pOffscreen = std::make_unique<OGL::ContextOffscreen>(pHost.get());
    pOffscreen->makeCurrent();
    auto pFramebuffer = std::make_unique<Framebuffer>();
    pHost->makeCurrent();
    pFramebuffer.reset();
    pOffscreen.reset();
    EXPECT_EQ(0, ORVO::Test::GLHooks::objects()["framebuffer"]);
    EXPECT_EQ(host().handle(), OGL::NativeContext::currentHandle());
}

TEST_P(FramebufferTest, WorksOnAnotherThreadInAContextOfItsOwn) {
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const offscreen(pHost.get());
    OGL::Texture2D texture(eRGBA8, 1, 1, false, nullptr);
    Framebuffer framebuffer;
    bool bComplete = false;
    std::thread([&] {
        offscreen.makeCurrent();
        framebuffer.bind();
        framebuffer.attach(&texture, 0, 0);
        bComplete = framebuffer.statusOkay(nullptr);
        framebuffer.unbind();
        OGL::NativeContext().makeCurrent();
    }).join();
    EXPECT_TRUE(bComplete);
}

TEST_P(FramebufferTest, ReportsTheStatusOfAFailedCheck) {
    OGL::Texture2D texture(eRGBA8, 1, 1, false, nullptr);
    Framebuffer framebuffer;
    framebuffer.bind();
    framebuffer.attach(&texture, 0, 0);
    {
        ORVO::Test::GLCallFailure const failure("glCheckFramebufferStatus", 1);
        unsigned nStatus = 0;
        EXPECT_FALSE(framebuffer.statusOkay(&nStatus));
        EXPECT_EQ(36061U, nStatus);
    }
    framebuffer.unbind();
}

TEST_P(FramebufferTest, LeavesNothingWhereACallFails) {
    auto const make = [] { Framebuffer const framebuffer; };
    auto const aFailed = ORVO::Test::failEveryCall(make, &drainErrors);
    EXPECT_EQ((std::set<std::string>{"glFenceSync", "glGenFramebuffers"}), aFailed);
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const offscreen(pHost.get());
    Framebuffer framebuffer;
    offscreen.makeCurrent();
    ORVO::Test::ObjectCounts const before = ORVO::Test::GLHooks::objects();
    ORVO::Test::GLCallFailure const failure("glGenFramebuffers", 1);
    ORVO_EXPECT_OGL(framebuffer.bind(), "The framebuffer could not be created");
    EXPECT_EQ(before, ORVO::Test::GLHooks::objects());
    drainErrors();
    framebuffer.bind();
    EXPECT_TRUE(framebuffer.isBound());
    framebuffer.unbind();
    pHost->makeCurrent();
}

TEST_P(FramebufferTest, NeedsAContext) {
    auto const pHost = OGL::Context::adoptCurrent();
    Framebuffer framebuffer;
    host().release();
    constexpr char const* pNone = "No OpenGL context is current";
    ORVO_EXPECT_OGL(Framebuffer(), pNone);
    ORVO_EXPECT_OGL(framebuffer.bind(), pNone);
    ORVO_EXPECT_OGL(framebuffer.unbind(), pNone);
    EXPECT_EQ(0U, framebuffer.objectID());
    EXPECT_FALSE(framebuffer.isBound());
    pHost->makeCurrent();
}

ORVO_INSTANTIATE_ON_EACH_INTERFACE(FramebufferTest);

} // namespace
