#include "orvo/image_runtime/ShaderProgramProxyOGL.h"

#include <epoxy/gl.h>

#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <type_traits>
#include <utility>

#include "orvo/image_runtime/ShaderManagerOGL.h"
#include "orvo/image_runtime/ShaderProgramProxyOGLAutoLock.h"
#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/Program.h"
#include "tests/image_runtime/support/ShaderTest.h"

namespace {

using namespace ORVO;
using ORVO::Test::GLHooks;

static_assert(std::has_virtual_destructor_v<ShaderProgramProxyOGL>);
static_assert(std::has_virtual_destructor_v<ShaderSourceOGL>);
static_assert(std::is_base_of_v<ShaderSourceOGL, FragmentShaderSourceOGL>);
static_assert(std::is_base_of_v<ShaderSourceOGL, VertexShaderSourceOGL>);

constexpr char const* pGain = "uniform float gain; void main() { gl_FragColor = vec4(gain); }";

class ShaderProgramProxyOGLTest : public ORVO::Test::ShaderTest {
protected:
    static bool hasUniform(ShaderProgramProxyOGL& proxy, char const* pName) {
        ShaderProgramProxyOGLAutoLock const lock(proxy);
        return lock.getProgram()->getUniformLocation(pName) != -1;
    }
    static std::string failureOf(ShaderProgramProxyOGL& proxy) {
        try {
            proxy.LockOglProgram();
        } catch (LogicalException const& exception) {
            return exception.message();
        }
        return "nothing was thrown";
    }
};

TEST(ShaderSourceOGLTest, KeepsItsText) {
    std::string sText = "void main() {}";
    FragmentShaderSourceOGL source(sText);
    sText = "changed";
    EXPECT_STREQ("void main() {}", source.c_str());
    FragmentShaderSourceOGL const copy(source);
    source = FragmentShaderSourceOGL(std::string("other"));
    EXPECT_STREQ("void main() {}", copy.c_str());
    EXPECT_STREQ("other", source.c_str());
    EXPECT_STREQ("vertex", VertexShaderSourceOGL("vertex").c_str());
}

TEST_F(ShaderProgramProxyOGLTest, LinksAtTheFirstLockAndNotAgain) {
    ShaderProgramProxyOGL proxy;
    proxy.add(FragmentShaderSourceOGL(pGain));
    EXPECT_EQ(0, programs());
    OGL::Program* const pProgram = proxy.LockOglProgram();
    ASSERT_NE(nullptr, pProgram);
    EXPECT_EQ(1, programs());
    auto const nLinks = GLHooks::calls("glLinkProgram");
    EXPECT_EQ(pProgram, proxy.LockOglProgram());
    proxy.UnlockOglProgram();
    EXPECT_EQ(pProgram, proxy.LockOglProgram());
    EXPECT_EQ(nLinks, GLHooks::calls("glLinkProgram"));
    EXPECT_LE(0, pProgram->getUniformLocation("gain"));
}

TEST_F(ShaderProgramProxyOGLTest, ReadsTheSourcesOfAStageInOrderAsOneText) {
    ShaderProgramProxyOGL proxy;
    proxy.add(FragmentShaderSourceOGL("uniform float gain;\nfloat twice(float x) { return x + x; }\n"));
    proxy.add(VertexShaderSourceOGL("uniform vec2 shift;\n"));
    proxy.add(FragmentShaderSourceOGL("void main() { gl_FragColor = vec4(twice(gain)); }\n"));
    proxy.add(VertexShaderSourceOGL("void main() { gl_Position = ftransform() + vec4(shift, 0.0, 0.0); }\n"));
    EXPECT_TRUE(hasUniform(proxy, "gain"));
    EXPECT_TRUE(hasUniform(proxy, "shift"));
    EXPECT_EQ(0, GLHooks::objects()["shader"]);
}

TEST_F(ShaderProgramProxyOGLTest, LinksAnewAfterAnAddedSource) {
    ShaderProgramProxyOGL proxy;
    proxy.add(FragmentShaderSourceOGL("void body();\nvoid main() { body(); }\n"));
    proxy.add(FragmentShaderSourceOGL("void body() { gl_FragColor = vec4(1.0); }\n"));
    EXPECT_FALSE(hasUniform(proxy, "shift"));
    proxy.add(VertexShaderSourceOGL(
        "uniform vec2 shift; void main() { gl_Position = ftransform() + vec4(shift, 0.0, 0.0); }"));
    EXPECT_EQ(0, programs());
    EXPECT_TRUE(hasUniform(proxy, "shift"));
    EXPECT_EQ(1, programs());
}

TEST_F(ShaderProgramProxyOGLTest, RefusesASourceWhileLocked) {
    ShaderProgramProxyOGL proxy;
    proxy.add(FragmentShaderSourceOGL(pGain));
    {
        ShaderProgramProxyOGLAutoLock const lock(proxy);
        ORVO_EXPECT_INTERNAL(proxy.add(FragmentShaderSourceOGL("nonsense")), "pProxy->n_LockCount == 0");
        ORVO_EXPECT_INTERNAL(proxy.add(VertexShaderSourceOGL("nonsense")), "pProxy->n_LockCount == 0");
    }
    ShaderManagerOGL::Instance()->clearAll();
    EXPECT_TRUE(hasUniform(proxy, "gain")); // what was refused is not among the sources
}

TEST_F(ShaderProgramProxyOGLTest, ForgetsItsSourcesAndKeepsItsProgram) {
    ShaderProgramProxyOGL proxy;
    proxy.add(FragmentShaderSourceOGL(pGain));
    proxy.add(VertexShaderSourceOGL("void main() { gl_Position = ftransform(); }"));
    EXPECT_TRUE(hasUniform(proxy, "gain"));
    proxy.removeAllShaders();
    EXPECT_TRUE(hasUniform(proxy, "gain"));
    proxy.add(FragmentShaderSourceOGL("uniform float other; void main() { gl_FragColor = vec4(other); }"));
    EXPECT_TRUE(hasUniform(proxy, "other"));
    EXPECT_FALSE(hasUniform(proxy, "gain"));
}

TEST_F(ShaderProgramProxyOGLTest, SaysWhyItsSourcesDoNotCompileAndCanBeMended) {
    ShaderProgramProxyOGL proxy;
    proxy.add(FragmentShaderSourceOGL("void main() { gl_FragColor = nonsense; }"));
    for (int i = 0; i < 2; ++i)
        EXPECT_EQ(0U, failureOf(proxy).find("Fragment shader did not compile: "));
    EXPECT_EQ(0, programs());
    EXPECT_EQ(0U, ShaderManagerOGL::Instance()->GetNumShaders());
    proxy.removeAllShaders();
    proxy.add(FragmentShaderSourceOGL(pGain));
    EXPECT_TRUE(hasUniform(proxy, "gain"));
}

TEST_F(ShaderProgramProxyOGLTest, SaysWhyItsProgramDoesNotLink) {
    ShaderProgramProxyOGL proxy;
    proxy.add(FragmentShaderSourceOGL("void body();\nvoid main() { body(); }"));
    EXPECT_EQ(0U, failureOf(proxy).find("Program did not link: "));
    EXPECT_EQ(0, programs());
}

TEST_F(ShaderProgramProxyOGLTest, CannotBeLockedWithoutOpenGL) {
    stopRuntime();
    startRuntime({nullptr});
    EXPECT_EQ(nullptr, ShaderManagerOGL::Instance());
    ShaderProgramProxyOGL proxy;
    proxy.add(FragmentShaderSourceOGL(pGain));
    ORVO_EXPECT_INTERNAL(proxy.LockOglProgram(), "The progam shader cannot be initialized.");
    ORVO_EXPECT_INTERNAL(ShaderProgramProxyOGLAutoLock const lock(proxy),
                         "The progam shader cannot be initialized.");
}

TEST_F(ShaderProgramProxyOGLTest, CannotBeLockedOnAForeignContextAndDiesThereQuietly) {
    OGL::Program const anchor; // an object that is alive in the host's context throughout
    auto pProxy = std::make_unique<ShaderProgramProxyOGL>();
    pProxy->add(FragmentShaderSourceOGL(pGain));
    pProxy->LockOglProgram();
    pProxy->UnlockOglProgram();
    auto const pForeign = host().another(false);
    pForeign->makeCurrent();
    std::string const sFailure = failureOf(*pProxy);
    EXPECT_EQ(0U, sFailure.find("Current context of value ")) << sFailure;
    pProxy.reset();
    host().makeCurrent();
    // Its name could not be deleted there; the manager has forgotten it.
    EXPECT_EQ(0U, ShaderManagerOGL::Instance()->GetNumShaders());
    ShaderManagerOGL::Instance()->clearAll();
    EXPECT_EQ(2, programs());
    { OGL::Program const next; }
    EXPECT_EQ(1, programs());
}

TEST_F(ShaderProgramProxyOGLTest, DiesQuietlyWithoutAContextAndAfterTheRuntime) {
    OGL::Program const anchor; // an object that is alive in the host's context throughout
    auto pFirst = std::make_unique<ShaderProgramProxyOGL>();
    auto pSecond = std::make_unique<ShaderProgramProxyOGL>();
    for (auto* pProxy : {pFirst.get(), pSecond.get()}) {
        pProxy->add(FragmentShaderSourceOGL(pGain));
        pProxy->LockOglProgram();
    }
    stopRuntime();
    pFirst.reset(); // still locked: its program goes with it
    EXPECT_EQ(2, programs());
    pSecond->UnlockOglProgram();
    host().release();
    pSecond.reset();
    host().makeCurrent();
    EXPECT_EQ(2, programs());
    { OGL::Program const next; } // takes along what could not be deleted without a context
    EXPECT_EQ(1, programs());
}

TEST_F(ShaderProgramProxyOGLTest, BelongsToTheManagerOfTheContextItIsLockedIn) {
    OGL::Program const anchor; // an object that is alive in the host's context throughout
    auto const pOther = OGL::ContextOffscreen::createHeadless();
    pOther->makeCurrent();
    std::optional<OGL::Program> otherAnchor(std::in_place);
    host().makeCurrent();
    stopRuntime();
    startRuntime({context(), pOther.get()});
    auto pProxy = std::make_unique<ShaderProgramProxyOGL>();
    pProxy->add(FragmentShaderSourceOGL(pGain));
    pProxy->LockOglProgram();
    pProxy->UnlockOglProgram();
    ShaderManagerOGL* const pFirst = ShaderManagerOGL::Instance();
    pOther->makeCurrent();
    ShaderManagerOGL* const pSecond = ShaderManagerOGL::Instance();
    ASSERT_NE(pFirst, pSecond);
    EXPECT_EQ(1U, pFirst->GetNumShaders());
    auto const nLinks = GLHooks::calls("glLinkProgram");
    pProxy->LockOglProgram();
    pProxy->UnlockOglProgram();
    EXPECT_EQ(nLinks + 1, GLHooks::calls("glLinkProgram"));
    EXPECT_EQ(0U, pFirst->GetNumShaders());
    EXPECT_EQ(1U, pSecond->GetNumShaders());
    host().makeCurrent();
    pProxy.reset(); // on the other context's list
    EXPECT_EQ(0U, pSecond->GetNumShaders());
    pFirst->clearAll();
    pSecond->clearAll();
    stopRuntime();
    // What each had left to the other context was deleted there.
    EXPECT_EQ(2, programs());
    pOther->makeCurrent();
    otherAnchor.reset();
    host().makeCurrent();
}

TEST_F(ShaderProgramProxyOGLTest, IsLockedForAScopeAlsoWhenAnExceptionPasses) {
    ShaderProgramProxyOGL proxy;
    proxy.add(FragmentShaderSourceOGL(pGain));
    try {
        ShaderProgramProxyOGLAutoLock const lock(proxy);
        EXPECT_NE(nullptr, lock.getProgram());
        ShaderManagerOGL::Instance()->clearAll();
        EXPECT_EQ(1, programs());
        throw std::runtime_error("passes");
    } catch (std::runtime_error const&) {
        ShaderManagerOGL::Instance()->clearAll();
    }
    EXPECT_EQ(0, programs());
}

} // namespace
