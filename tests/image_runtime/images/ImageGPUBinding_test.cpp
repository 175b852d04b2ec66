// Texture units, and the parameters of the texture that is bound.
#include <epoxy/gl.h>

#include <array>
#include <climits>

#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/TextureState.h"
#include "tests/image_runtime/support/GLRuntimeTest.h"
#include "tests/support/gl/ExpectOGL.h"

namespace {

using namespace ORVO;

constexpr char const* pNoTexture = "No Texture Object specified";
constexpr char const* pNoUnit = "The texture unit does not exist";
constexpr char const* pNoContext = "No OpenGL context is current";

int integer(GLenum nName) {
    GLint n = 0;
    glGetIntegerv(nName, &n);
    return n;
}

class ImageGPUBinding : public ORVO::Test::GLRuntimeTest {
protected:
    void TearDown() override {
        OGL::TextureState::setActiveTextureUnit(0);
        GLRuntimeTest::TearDown();
    }

    static ImageGPU make() {
        return ImageGPU({{0, 0}, {4, 4}}, ImageGPU::PIXEL_FORMAT_RGBA8, {1.0F, 1.0F}, true);
    }
    static int boundOn(unsigned unit) {
        OGL::TextureState::setActiveTextureUnit(unit);
        return integer(GL_TEXTURE_BINDING_2D);
    }
    static bool enabledOn(unsigned unit) {
        OGL::TextureState::setActiveTextureUnit(unit);
        return glIsEnabled(GL_TEXTURE_2D) == GL_TRUE;
    }
};

using ImageGPUDeprecated = ImageGPUBinding;

TEST_F(ImageGPUBinding, BindsToAUnit) {
    ImageGPU const image = make();
    image.bind(1);
    EXPECT_EQ(1U, OGL::TextureState::activeTextureUnit());
    EXPECT_EQ(1, image.boundTexUnit());
    EXPECT_EQ(static_cast<int>(image.texture()->objectID()), boundOn(1));
    EXPECT_EQ(0, boundOn(0));
    image.bind(1);
    EXPECT_EQ(1, image.boundTexUnit());
    ORVO_EXPECT_INTERNAL(image.bind(2), "Image currently bound to a different unit");
    ORVO_EXPECT_INTERNAL(image.bind(0), "Image currently bound to a different unit");
    EXPECT_EQ(1, image.boundTexUnit());
    EXPECT_EQ(0, boundOn(2));
    image.bindDefault();
    EXPECT_EQ(-1, image.boundTexUnit());
    EXPECT_EQ(0, boundOn(1));
    image.bind(2);
    EXPECT_EQ(2, image.boundTexUnit());
    image.bindDefault();
}

TEST_F(ImageGPUBinding, IsUndoneWhenTheImageDies) {
    {
        ImageGPU const image = make();
        image.bind(3);
    }
    EXPECT_EQ(0, boundOn(3));
}

TEST_F(ImageGPUBinding, NeedsATexture) {
    ImageGPU image;
    image.bindDefault();
    ORVO_EXPECT_INTERNAL(image.bind(0), "Enforce pTexture != NULL");
    EXPECT_EQ(-1, image.boundTexUnit());
    ImageGPU bound = make();
    bound.bind(1);
    OGL::Texture2D* const pTexture = bound.release();
    EXPECT_EQ(1, bound.boundTexUnit());
    ORVO_EXPECT_INTERNAL(bound.bindDefault(), pNoTexture);
    EXPECT_EQ(static_cast<int>(pTexture->objectID()), boundOn(1));
    glBindTexture(GL_TEXTURE_2D, 0);
    ImageGPU const owner({{0, 0}, {4, 4}}, pTexture, {1.0F, 1.0F});
}

TEST_F(ImageGPUBinding, NeedsAUnitThatExists) {
    ImageGPU const image = make();
    for (unsigned const unit : {100000U, UINT_MAX}) {
        ORVO_EXPECT_PARAMETER(image.enable(unit), pNoUnit);
        ORVO_EXPECT_PARAMETER(image.disable(unit), pNoUnit);
    }
    ORVO_EXPECT_PARAMETER(image.bind(100000), pNoUnit);
    EXPECT_EQ(-1, image.boundTexUnit());
    ORVO_EXPECT_PARAMETER(image.setEnvironment(OGL::TextureUnit::ENVIRONMENT_REPLACE), pNoUnit);
}

TEST_F(ImageGPUBinding, SwitchesTexturing) {
    ImageGPU const image = make();
    image.enable(2);
    EXPECT_EQ(2U, OGL::TextureState::activeTextureUnit());
    EXPECT_TRUE(enabledOn(2));
    EXPECT_FALSE(enabledOn(0));
    image.disable(2);
    EXPECT_FALSE(enabledOn(2));
}

TEST_F(ImageGPUBinding, SetsTheEnvironmentOfItsUnit) {
    ImageGPU const image = make();
    auto const modeOn = [](unsigned unit) {
        OGL::TextureState::setActiveTextureUnit(unit);
        GLint n = 0;
        glGetTexEnviv(GL_TEXTURE_ENV, GL_TEXTURE_ENV_MODE, &n);
        return n;
    };
    int const nBefore = modeOn(1);
    ASSERT_NE(GL_REPLACE, nBefore);
    image.bind(1);
    OGL::TextureState::setActiveTextureUnit(0);
    image.setEnvironment(OGL::TextureUnit::ENVIRONMENT_REPLACE);
    EXPECT_EQ(GL_REPLACE, modeOn(1));
    EXPECT_EQ(nBefore, modeOn(0));
    ORVO_EXPECT_OGL(image.setEnvironment(static_cast<OGL::TextureUnit::Environment>(6)),
                    "Unknown texture environment 6");
    image.setEnvironment(OGL::TextureUnit::GL2Environment(static_cast<unsigned>(nBefore)));
    image.bindDefault();
}

TEST_F(ImageGPUBinding, SetsParametersFromTokens) {
    ImageGPU const image = make();
    image.bind(0);
    image.setFilter(GL_NEAREST, GL_LINEAR);
    image.setWrap(GL_REPEAT, GL_CLAMP_TO_EDGE);
    std::array<float, 4> aColor{0.25F, 0.5F, 0.75F, 1.0F};
    image.setBorderColor(aColor.data());
    auto const parameter = [](GLenum nName) {
        GLint n = 0;
        glGetTexParameteriv(GL_TEXTURE_2D, nName, &n);
        return n;
    };
    EXPECT_EQ(GL_NEAREST, parameter(GL_TEXTURE_MIN_FILTER));
    EXPECT_EQ(GL_LINEAR, parameter(GL_TEXTURE_MAG_FILTER));
    EXPECT_EQ(GL_REPEAT, parameter(GL_TEXTURE_WRAP_S));
    EXPECT_EQ(GL_CLAMP_TO_EDGE, parameter(GL_TEXTURE_WRAP_T));
    std::array<float, 4> aRead{};
    glGetTexParameterfv(GL_TEXTURE_2D, GL_TEXTURE_BORDER_COLOR, aRead.data());
    EXPECT_EQ(aColor, aRead);
    ORVO_EXPECT_INTERNAL(image.setBorderColor(nullptr), "Enforce pColor != NULL");
    EXPECT_THROW(image.setFilter(GL_REPEAT, GL_LINEAR), OGL::ExceptionOGL);
    EXPECT_THROW(image.setWrap(GL_REPEAT, GL_LINEAR), OGL::ExceptionOGL);
    EXPECT_EQ(GL_REPEAT, parameter(GL_TEXTURE_WRAP_S));
    image.bindDefault();
    ORVO_EXPECT_INTERNAL(image.setFilter(GL_NEAREST, GL_NEAREST), "isBound()");
    ORVO_EXPECT_INTERNAL(image.setWrap(GL_REPEAT, GL_REPEAT), "isBound()");
    ORVO_EXPECT_INTERNAL(image.setBorderColor(aColor.data()), "isBound()");
    ImageGPU const none;
    ORVO_EXPECT_INTERNAL(none.setFilter(GL_NEAREST, GL_NEAREST), pNoTexture);
    ORVO_EXPECT_INTERNAL(none.setWrap(GL_REPEAT, GL_REPEAT), pNoTexture);
    ORVO_EXPECT_INTERNAL(none.setBorderColor(aColor.data()), pNoTexture);
}

TEST_F(ImageGPUBinding, NeedsAContext) {
    ImageGPU const image = make();
    host().release();
    ORVO_EXPECT_OGL(image.bind(0), pNoContext);
    EXPECT_EQ(-1, image.boundTexUnit());
    ORVO_EXPECT_OGL(image.enable(0), pNoContext);
    ORVO_EXPECT_OGL(image.disable(0), pNoContext);
    host().makeCurrent();
    image.bind(0);
    host().release();
    ORVO_EXPECT_OGL(image.bindDefault(), pNoContext);
    EXPECT_EQ(0, image.boundTexUnit());
    ORVO_EXPECT_OGL(image.setEnvironment(OGL::TextureUnit::ENVIRONMENT_REPLACE), pNoContext);
    host().makeCurrent();
    image.bindDefault();
}

TEST_F(ImageGPUDeprecated, BindsAndUnbinds) {
    ImageGPU const image = make();
    auto const nName = static_cast<int>(image.texture()->objectID());
    image.bind_DEPRECATED_2_0(2);
    EXPECT_EQ(2U, OGL::TextureState::activeTextureUnit());
    EXPECT_EQ(nName, boundOn(2));
    EXPECT_EQ(-1, image.boundTexUnit());
    image.unbind_DEPRECATED_2_0();
    EXPECT_EQ(0, boundOn(2));
    ORVO_EXPECT_INTERNAL(image.unbind_DEPRECATED_2_0(), "Texture not bound");
    OGL::TextureState::setActiveTextureUnit(1);
    image.bind_DEPRECATED_2_0(-1);
    EXPECT_EQ(1U, OGL::TextureState::activeTextureUnit());
    EXPECT_EQ(nName, boundOn(1));
    // Bound on another unit than the active one is not bound.
    OGL::TextureState::setActiveTextureUnit(0);
    ORVO_EXPECT_INTERNAL(image.unbind_DEPRECATED_2_0(), "Texture not bound");
    OGL::TextureState::setActiveTextureUnit(1);
    image.unbind_DEPRECATED_2_0();
    EXPECT_EQ(0, boundOn(1));
}

TEST_F(ImageGPUDeprecated, SwitchesTexturing) {
    ImageGPU const image = make();
    image.enable_DEPRECATED_2_0(3);
    EXPECT_EQ(3U, OGL::TextureState::activeTextureUnit());
    EXPECT_TRUE(enabledOn(3));
    OGL::TextureState::setActiveTextureUnit(1);
    image.enable_DEPRECATED_2_0(-1);
    EXPECT_TRUE(enabledOn(1));
    image.disable_DEPRECATED_2_0(3);
    EXPECT_EQ(1U, OGL::TextureState::activeTextureUnit());
    EXPECT_FALSE(enabledOn(3));
    OGL::TextureState::setActiveTextureUnit(1);
    ORVO_EXPECT_INTERNAL(image.disable_DEPRECATED_2_0(3),
                         "Texture target is not enabled..can't disable texture");
    EXPECT_EQ(1U, OGL::TextureState::activeTextureUnit());
    image.disable_DEPRECATED_2_0(-1);
    EXPECT_FALSE(enabledOn(1));
    image.disable_DEPRECATED_2_0(-1);
}

TEST_F(ImageGPUDeprecated, SetsTheEnvironmentOfTheActiveUnit) {
    ImageGPU const image = make();
    OGL::TextureState::setActiveTextureUnit(1);
    auto const mode = [] {
        GLint n = 0;
        glGetTexEnviv(GL_TEXTURE_ENV, GL_TEXTURE_ENV_MODE, &n);
        return n;
    };
    int const nBefore = mode();
    image.setEnvironment_DEPRECATED_2_0(GL_DECAL);
    EXPECT_EQ(GL_DECAL, mode());
    ORVO_EXPECT_OGL(image.setEnvironment_DEPRECATED_2_0(GL_NEAREST),
                    "The texture environment could not be set (GL_INVALID_ENUM)");
    EXPECT_EQ(GL_DECAL, mode());
    image.setEnvironment_DEPRECATED_2_0(static_cast<unsigned>(nBefore));
}

TEST_F(ImageGPUDeprecated, RefusesUnitsAndMissingTextures) {
    ImageGPU const image = make();
    for (int const unit : {-2, 100000, INT_MAX, INT_MIN}) {
        ORVO_EXPECT_PARAMETER(image.bind_DEPRECATED_2_0(unit), pNoUnit);
        ORVO_EXPECT_PARAMETER(image.enable_DEPRECATED_2_0(unit), pNoUnit);
        ORVO_EXPECT_PARAMETER(image.disable_DEPRECATED_2_0(unit), pNoUnit);
    }
    ImageGPU const none;
    ORVO_EXPECT_INTERNAL(none.bind_DEPRECATED_2_0(0), pNoTexture);
    ORVO_EXPECT_INTERNAL(none.enable_DEPRECATED_2_0(0), pNoTexture);
    ORVO_EXPECT_INTERNAL(none.disable_DEPRECATED_2_0(0), pNoTexture);
    ORVO_EXPECT_INTERNAL(none.unbind_DEPRECATED_2_0(), pNoTexture);
}

TEST_F(ImageGPUDeprecated, KnowsUnitsThatServeShadersAlone) {
    ImageGPU const image = make();
    int const unit = integer(GL_MAX_TEXTURE_UNITS);
    ASSERT_LT(unit, integer(GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS));
    image.enable_DEPRECATED_2_0(unit);
    image.enable_DEPRECATED_2_0(-1);
    image.disable_DEPRECATED_2_0(-1);
    EXPECT_EQ(static_cast<unsigned>(unit), OGL::TextureState::activeTextureUnit());
    ORVO_EXPECT_INTERNAL(image.disable_DEPRECATED_2_0(unit),
                         "Texture target is not enabled..can't disable texture");
}

TEST_F(ImageGPUDeprecated, NeedsAContext) {
    ImageGPU const image = make();
    host().release();
    for (int const unit : {-1, 0}) {
        ORVO_EXPECT_OGL(image.bind_DEPRECATED_2_0(unit), pNoContext);
        ORVO_EXPECT_OGL(image.enable_DEPRECATED_2_0(unit), pNoContext);
        ORVO_EXPECT_OGL(image.disable_DEPRECATED_2_0(unit), pNoContext);
    }
    ORVO_EXPECT_OGL(image.unbind_DEPRECATED_2_0(), pNoContext);
    ORVO_EXPECT_OGL(image.setEnvironment_DEPRECATED_2_0(GL_DECAL), pNoContext);
    host().makeCurrent();
}

} // namespace
