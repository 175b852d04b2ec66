#include "orvo/ogl/TextureUnit.h"

#include <epoxy/gl.h>

#include <climits>

#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/Texture3D.h"
#include "orvo/ogl/TextureRECT.h"
#include "orvo/ogl/TextureState.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;
using OGL::TextureState;
using OGL::TextureUnit;

constexpr auto eRGBA8 = OGL::Texture::INTERNAL_FORMAT_RGBA8;
constexpr char const* pNoUnit = "The texture unit does not exist";

GLuint valueOf(GLenum name) {
    GLint value = 0;
    glGetIntegerv(name, &value);
    return static_cast<GLuint>(value);
}

class TextureUnitTest : public ORVO::Test::GLTest {};

TEST_F(TextureUnitTest, IsSelectedByItsNumber) {
    EXPECT_EQ(0U, TextureState::activeTextureUnit());
    TextureState::setActiveTextureUnit(3);
    EXPECT_EQ(3U, TextureState::activeTextureUnit());
    EXPECT_EQ(static_cast<GLuint>(GL_TEXTURE3), valueOf(GL_ACTIVE_TEXTURE));
    GLuint const nUnits = valueOf(GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS);
    TextureState::setActiveTextureUnit(nUnits - 1);
    ORVO_EXPECT_PARAMETER(TextureState::setActiveTextureUnit(nUnits), pNoUnit);
    ORVO_EXPECT_PARAMETER(TextureState::setActiveTextureUnit(UINT_MAX), pNoUnit);
    EXPECT_EQ(nUnits - 1, TextureState::activeTextureUnit());
    TextureState::setActiveTextureUnit(0);
}

TEST_F(TextureUnitTest, IsOneObjectForEachNumber) {
    EXPECT_EQ(&TextureUnit::Unit(5), &TextureUnit::Unit(5));
    EXPECT_NE(&TextureUnit::Unit(5), &TextureUnit::Unit(6));
    TextureUnit::Unit(511);
    ORVO_EXPECT_PARAMETER(TextureUnit::Unit(512), pNoUnit);
    ORVO_EXPECT_PARAMETER(TextureUnit::Unit(UINT_MAX), pNoUnit);
    ORVO_EXPECT_PARAMETER(TextureUnit::Unit(511).enable2D(), pNoUnit);
}

TEST_F(TextureUnitTest, SelectsTheUnitAndBindsTheTexture) {
    OGL::Texture1D const line(eRGBA8, 1, false);
    OGL::Texture2D const plane(eRGBA8, 1, 1, false, nullptr);
    OGL::Texture3D const box(eRGBA8, 1, 1, 1, false);
    OGL::TextureRECT const rectangle(eRGBA8, 1, 1, nullptr);
    TextureUnit::Unit(1).bind(&line);
    EXPECT_EQ(1U, TextureState::activeTextureUnit());
    TextureUnit::Unit(2).bind(&plane);
    EXPECT_EQ(2U, TextureState::activeTextureUnit());
    TextureUnit::Unit(2).bind(&box);
    TextureUnit::Unit(3).bind(&rectangle);
    EXPECT_EQ(rectangle.objectID(), valueOf(GL_TEXTURE_BINDING_RECTANGLE));
    TextureState::setActiveTextureUnit(1);
    EXPECT_EQ(line.objectID(), valueOf(GL_TEXTURE_BINDING_1D));
    EXPECT_EQ(0U, valueOf(GL_TEXTURE_BINDING_2D));
    TextureState::setActiveTextureUnit(2);
    EXPECT_EQ(plane.objectID(), valueOf(GL_TEXTURE_BINDING_2D));
    EXPECT_EQ(box.objectID(), valueOf(GL_TEXTURE_BINDING_3D));

    TextureUnit::Unit(1).bind1DDefault();
    EXPECT_EQ(1U, TextureState::activeTextureUnit());
    EXPECT_EQ(0U, valueOf(GL_TEXTURE_BINDING_1D));
    TextureUnit::Unit(2).bind2DDefault();
    EXPECT_EQ(0U, valueOf(GL_TEXTURE_BINDING_2D));
    EXPECT_EQ(box.objectID(), valueOf(GL_TEXTURE_BINDING_3D));
    TextureUnit::Unit(2).bind3DDefault();
    EXPECT_EQ(0U, valueOf(GL_TEXTURE_BINDING_3D));
    TextureState::setActiveTextureUnit(3);
    glBindTexture(GL_TEXTURE_RECTANGLE, 0);
    TextureState::setActiveTextureUnit(0);
}

TEST_F(TextureUnitTest, RefusesNoTexture) {
    TextureUnit const& unit = TextureUnit::Unit(0);
    ORVO_EXPECT_INTERNAL(unit.bind(static_cast<OGL::Texture1D const*>(nullptr)), "Enforce pTexture != NULL");
    ORVO_EXPECT_INTERNAL(unit.bind(static_cast<OGL::Texture2D const*>(nullptr)), "Enforce pTexture != NULL");
    ORVO_EXPECT_INTERNAL(unit.bind(static_cast<OGL::Texture3D const*>(nullptr)), "Enforce pTexture != NULL");
    ORVO_EXPECT_INTERNAL(unit.bind(static_cast<OGL::TextureRECT const*>(nullptr)),
                         "Enforce pTexture != NULL");
}

TEST_F(TextureUnitTest, SwitchesFixedFunction) {
    TextureUnit const& unit = TextureUnit::Unit(1);
    struct Row {
        void (TextureUnit::*pEnable)() const;
        void (TextureUnit::*pDisable)() const;
        GLenum nTarget;
    };
    for (Row const& row : {Row{&TextureUnit::enable1D, &TextureUnit::disable1D, GL_TEXTURE_1D},
                           Row{&TextureUnit::enable2D, &TextureUnit::disable2D, GL_TEXTURE_2D},
                           Row{&TextureUnit::enable3D, &TextureUnit::disable3D, GL_TEXTURE_3D}}) {
        TextureState::setActiveTextureUnit(0);
        (unit.*row.pEnable)();
        EXPECT_EQ(1U, TextureState::activeTextureUnit());
        EXPECT_EQ(GL_TRUE, glIsEnabled(row.nTarget));
        TextureState::setActiveTextureUnit(0);
        EXPECT_EQ(GL_FALSE, glIsEnabled(row.nTarget));
        (unit.*row.pDisable)();
        EXPECT_EQ(1U, TextureState::activeTextureUnit());
        EXPECT_EQ(GL_FALSE, glIsEnabled(row.nTarget));
    }
    TextureState::setActiveTextureUnit(0);
}

TEST_F(TextureUnitTest, HasNoSwitchBeyondFixedFunction) {
    GLuint const nFixed = valueOf(GL_MAX_TEXTURE_UNITS);
    ASSERT_LT(nFixed, valueOf(GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS));
    TextureUnit const& unit = TextureUnit::Unit(nFixed);
    unit.enable2D();
    unit.disable2D();
    unit.setEnv(TextureUnit::ENVIRONMENT_REPLACE);
    EXPECT_EQ(nFixed, TextureState::activeTextureUnit());
    EXPECT_EQ(0U, drainErrors());
    TextureState::setActiveTextureUnit(0);
}

TEST_F(TextureUnitTest, SetsTheEnvironment) {
    constexpr GLint aModes[] = {GL_ADD, GL_BLEND, GL_COMBINE, GL_DECAL, GL_MODULATE, GL_REPLACE};
    for (int i = 0; i < 6; ++i) {
        TextureUnit::Unit(2).setEnv(static_cast<TextureUnit::Environment>(i));
        EXPECT_EQ(2U, TextureState::activeTextureUnit());
        GLint nMode = 0;
        glGetTexEnviv(GL_TEXTURE_ENV, GL_TEXTURE_ENV_MODE, &nMode);
        EXPECT_EQ(aModes[i], nMode);
    }
    ORVO_EXPECT_OGL(TextureUnit::Unit(2).setEnv(static_cast<TextureUnit::Environment>(6)),
                    "Unknown texture environment 6");
    TextureUnit::Unit(2).setEnv(TextureUnit::ENVIRONMENT_MODULATE);
    TextureState::setActiveTextureUnit(0);
}

TEST_F(TextureUnitTest, NeedsAContext) {
    OGL::Texture2D const plane(eRGBA8, 1, 1, false, nullptr);
    host().release();
    constexpr char const* pNone = "No OpenGL context is current";
    ORVO_EXPECT_OGL(TextureState::activeTextureUnit(), pNone);
    ORVO_EXPECT_OGL(TextureState::setActiveTextureUnit(0), pNone);
    ORVO_EXPECT_OGL(TextureUnit::Unit(0).bind(&plane), pNone);
    ORVO_EXPECT_OGL(TextureUnit::Unit(0).bind2DDefault(), pNone);
    ORVO_EXPECT_OGL(TextureUnit::Unit(0).enable1D(), pNone);
    ORVO_EXPECT_OGL(TextureUnit::Unit(0).setEnv(TextureUnit::ENVIRONMENT_ADD), pNone);
    ORVO_EXPECT_OGL(plane.isBound(), pNone);
    host().makeCurrent();
}

TEST_F(TextureUnitTest, AnswersForNonPowerOfTwoSizes) {
    EXPECT_TRUE(TextureState::supportsNonPowerOfTwo());
    OGL::ExtensionManager::Instance()->overrideSupport(OGL::EXTENSION_ARB_TEXTURE_NON_POWER_OF_TWO, false);
    EXPECT_FALSE(TextureState::supportsNonPowerOfTwo());
}

} // namespace
