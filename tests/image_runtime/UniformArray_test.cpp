#include "orvo/image_runtime/UniformArray.h"

#include <epoxy/gl.h>

#include <array>
#include <cstdint>
#include <memory>
#include <set>
#include <string>

#include "orvo/image_runtime/ShaderProgramProxyOGL.h"
#include "orvo/image_runtime/ShaderProgramProxyOGLAutoLock.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/Program.h"
#include "orvo/ogl/Texture1D.h"
#include "tests/image_runtime/support/ShaderTest.h"

namespace {

using namespace ORVO;
using ORVO::Test::GLHooks;

constexpr std::array<float, 5> aValues{0.5f, -2.0f, 1.0e6f, 0.0f, 0.1f};
constexpr unsigned nValues = 5;
constexpr unsigned nUnit = 2;

int integerOf(GLenum token) {
    GLint value = 0;
    glGetIntegerv(token, &value);
    return value;
}

class UniformArrayTest : public ORVO::Test::ShaderTest {
protected:
    void SetUp() override {
        ShaderTest::SetUp();
        pProxy_ = std::make_unique<ShaderProgramProxyOGL>();
    }
    void TearDown() override {
        glUseProgram(0);
        pProxy_.reset();
        ShaderTest::TearDown();
    }

    /// A program that reads the array `table`, enabled.
    OGL::Program& program(char const* pSource = "uniform sampler1D table_sampler; uniform float table_delta;"
                                                "void main() { gl_FragColor = texture1D(table_sampler, "
                                                "table_delta); }") {
        pProxy_->add(FragmentShaderSourceOGL(pSource));
        OGL::Program* const pProgram = pProxy_->LockOglProgram();
        pProgram->enable();
        return *pProgram;
    }

    static int parameterOf(OGL::Texture1D const& texture, GLenum token) {
        GLint value = 0;
        glBindTexture(GL_TEXTURE_1D, texture.objectID());
        glGetTexParameteriv(GL_TEXTURE_1D, token, &value);
        glBindTexture(GL_TEXTURE_1D, 0);
        return value;
    }

private:
    std::unique_ptr<ShaderProgramProxyOGL> pProxy_;
};

TEST_F(UniformArrayTest, BringsTheValuesIntoATextureOfJustThatWidth) {
    OGL::Program& oProgram = program();
    auto const spArray = UniformArray::construct(oProgram, "table", aValues.data(), nValues, nUnit);
    OGL::Texture1D const& texture = *spArray->getTexture();
    EXPECT_EQ(5U, texture.width(0));
    EXPECT_EQ(50, static_cast<int>(texture.format()));
    std::array<float, nValues> aRead{};
    glBindTexture(GL_TEXTURE_1D, texture.objectID());
    glGetTexImage(GL_TEXTURE_1D, 0, GL_LUMINANCE, GL_FLOAT, aRead.data());
    glBindTexture(GL_TEXTURE_1D, 0);
    EXPECT_EQ(aValues, aRead);
    EXPECT_EQ(GL_NEAREST, parameterOf(texture, GL_TEXTURE_MIN_FILTER));
    EXPECT_EQ(GL_NEAREST, parameterOf(texture, GL_TEXTURE_MAG_FILTER));
    EXPECT_EQ(GL_CLAMP_TO_EDGE, parameterOf(texture, GL_TEXTURE_WRAP_S));
}

TEST_F(UniformArrayTest, TellsTheProgramOfUnitAndDelta) {
    OGL::Program& oProgram = program();
    auto const spArray = UniformArray::construct(oProgram, "table", aValues.data(), nValues, nUnit);
    GLint nSampler = -1;
    glGetUniformiv(oProgram.objectID(), oProgram.getUniformLocation("table_sampler"), &nSampler);
    EXPECT_EQ(2, nSampler);
    float delta = 0.0f;
    glGetUniformfv(oProgram.objectID(), oProgram.getUniformLocation("table_delta"), &delta);
    EXPECT_EQ(0.2f, delta);
}

TEST_F(UniformArrayTest, IsBoundAndEnabledOnItsUnitUntilItDies) {
    OGL::Program& oProgram = program();
    glActiveTexture(GL_TEXTURE1);
    auto spArray = UniformArray::construct(oProgram, "table", aValues.data(), nValues, nUnit);
    EXPECT_EQ(GL_TEXTURE1, integerOf(GL_ACTIVE_TEXTURE));
    glActiveTexture(GL_TEXTURE2);
    EXPECT_EQ(static_cast<int>(spArray->getTexture()->objectID()), integerOf(GL_TEXTURE_BINDING_1D));
    EXPECT_TRUE(glIsEnabled(GL_TEXTURE_1D));
    glActiveTexture(GL_TEXTURE1);
    spArray.reset();
    EXPECT_EQ(GL_TEXTURE1, integerOf(GL_ACTIVE_TEXTURE));
    glActiveTexture(GL_TEXTURE2);
    EXPECT_EQ(0, integerOf(GL_TEXTURE_BINDING_1D));
    EXPECT_FALSE(glIsEnabled(GL_TEXTURE_1D));
    glActiveTexture(GL_TEXTURE0);
}

TEST_F(UniformArrayTest, GivesItsTextureBackToThePool) {
    OGL::Program& oProgram = program();
    UniformArray::construct(oProgram, "table", aValues.data(), nValues, nUnit).reset();
    auto const nTextures = GLHooks::calls("glGenTextures");
    auto const spArray = UniformArray::construct(oProgram, "table", aValues.data(), nValues, nUnit);
    EXPECT_EQ(nTextures, GLHooks::calls("glGenTextures"));
}

TEST_F(UniformArrayTest, StandsAlsoForAProgramWithoutItsUniforms) {
    OGL::Program& oProgram = program("void main() { gl_FragColor = vec4(1.0); }");
    auto const spArray = UniformArray::construct(oProgram, "table", aValues.data(), nValues, nUnit);
    EXPECT_EQ(5U, spArray->getTexture()->width(0));
}

TEST_F(UniformArrayTest, RefusesWhatIsNoArray) {
    OGL::Program& oProgram = program();
    ORVO_EXPECT_INTERNAL(UniformArray::construct(oProgram, "table", nullptr, 3, nUnit),
                         "Enforce data != NULL");
    ORVO_EXPECT_PARAMETER(UniformArray::construct(oProgram, "table", aValues.data(), 0, nUnit), "count > 0");
    ORVO_EXPECT_PARAMETER(UniformArray::construct(oProgram, "table", aValues.data(), nValues, 100000),
                          "The texture unit does not exist");
}

TEST_F(UniformArrayTest, TakesAnyFormatByItsConstructor) {
    UniformArray const array(7, 1, OGL::Texture::INTERNAL_FORMAT_RGBA16F);
    EXPECT_EQ(7U, array.getTexture()->width(0));
    EXPECT_EQ(OGL::Texture::INTERNAL_FORMAT_RGBA16F, array.getTexture()->format());
    glActiveTexture(GL_TEXTURE1);
    EXPECT_EQ(static_cast<int>(array.getTexture()->objectID()), integerOf(GL_TEXTURE_BINDING_1D));
    glActiveTexture(GL_TEXTURE0);
}

TEST_F(UniformArrayTest, CannotBeWithoutAPool) {
    stopRuntime();
    startRuntime({nullptr});
    ORVO_EXPECT_INTERNAL(UniformArray(3, 1, OGL::Texture::INTERNAL_FORMAT_LUMINANCE32F),
                         "Enforce pPool != NULL");
}

TEST_F(UniformArrayTest, OutlivesThePoolAndDiesWithoutAContext) {
    OGL::Program& oProgram = program();
    auto spArray = UniformArray::construct(oProgram, "table", aValues.data(), nValues, nUnit);
    glUseProgram(0);
    stopRuntime();
    spArray.reset();
    EXPECT_EQ(0, GLHooks::objects()["texture"]);
}

TEST_F(UniformArrayTest, LeavesNothingBoundWhenACallFails) {
    OGL::Program& oProgram = program();
    auto const before = ORVO::Test::GLState::capture();
    auto const aObjects = GLHooks::objects();
    std::set<std::string> aFailed;
    for (std::uint64_t n = 1; n < 100; ++n) {
        std::string sFailed;
        bool bThrown = false;
        {
            ORVO::Test::GLCallFailure const failure(n);
            try {
                UniformArray::construct(oProgram, "table", aValues.data(), nValues, nUnit);
            } catch (OGL::ExceptionOGL const&) {
                bThrown = true;
            }
            sFailed = failure.name();
        }
        if (OGL::NativeContext::currentHandle() != host().handle()) {
            // The pool's hidden context: the driver refused to go back to the host's.
            EXPECT_EQ("eglMakeCurrent", sFailed);
            drainErrors();
            host().makeCurrent();
            glActiveTexture(GL_TEXTURE0);
        } else {
            EXPECT_EQ(bThrown, !sFailed.empty()) << sFailed;
        }
        drainErrors();
        TexturePool::Instance()->clearAll();
        EXPECT_EQ("", before.differencesTo(ORVO::Test::GLState::capture())) << sFailed;
        EXPECT_EQ(aObjects, GLHooks::objects()) << sFailed;
        if (sFailed.empty())
            break;
        aFailed.insert(sFailed);
    }
    EXPECT_EQ(1U, aFailed.count("glGenTextures"));
    EXPECT_EQ(1U, aFailed.count("glTexImage1D"));
    EXPECT_EQ(1U, aFailed.count("glTexSubImage1D"));
}

} // namespace
