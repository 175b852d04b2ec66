#include "orvo/image_flow/filters/bilateral/GPUScopes.h"

#include <epoxy/gl.h>

#include "orvo/ogl/ExtensionManager.h"
#include "tests/support/gl/GLTest.h"

#include <array>
#include <optional>

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using ImageFlow::bilateral::ScopedPlainDrawing;

class GPUScopesTest : public GLTest {
protected:
    void TearDown() override {
        OGL::ExtensionManager::Instance()->clearOverrides();
        GLTest::TearDown();
    }

    void makeDrawingOdd() {
        glPushAttrib(GL_ALL_ATTRIB_BITS);
        glPushClientAttrib(GL_CLIENT_ALL_ATTRIB_BITS);
        glBlendEquationSeparate(GL_FUNC_REVERSE_SUBTRACT, GL_MIN);
        glEnable(GL_POINT_SPRITE);
        glEnable(GL_VERTEX_PROGRAM_POINT_SIZE);
        for (GLuint const array : {0U, 3U}) {
            glVertexAttribPointer(array, 2, GL_FLOAT, GL_FALSE, 0, aVertices_.data());
            glEnableVertexAttribArray(array);
        }
    }

    static void makeDrawingNormal() {
        glPopClientAttrib();
        glPopAttrib();
    }

    static int integerOf(GLenum name) {
        GLint value = 0;
        glGetIntegerv(name, &value);
        return value;
    }

    static int enabledArrays() {
        int nEnabled = 0;
        for (GLuint i = 0; i < static_cast<GLuint>(integerOf(GL_MAX_VERTEX_ATTRIBS)); ++i) {
            GLint nArray = 0;
            glGetVertexAttribiv(i, GL_VERTEX_ATTRIB_ARRAY_ENABLED, &nArray);
            nEnabled += nArray;
        }
        return nEnabled;
    }

private:
    std::array<float, 8> aVertices_{};
};

TEST_F(GPUScopesTest, PlainDrawingSetsAsideWhatAHostHasSet) {
    makeDrawingOdd();
    ASSERT_EQ(2, enabledArrays());
    GLState const before = GLState::capture();
    {
        ScopedPlainDrawing const plain;
        EXPECT_EQ(GL_FUNC_ADD, integerOf(GL_BLEND_EQUATION_RGB));
        EXPECT_EQ(GL_FUNC_ADD, integerOf(GL_BLEND_EQUATION_ALPHA));
        EXPECT_FALSE(glIsEnabled(GL_POINT_SPRITE));
        EXPECT_FALSE(glIsEnabled(GL_VERTEX_PROGRAM_POINT_SIZE));
        EXPECT_EQ(0, enabledArrays());
    }
    EXPECT_EQ("", before.differencesTo(GLState::capture()));
    makeDrawingNormal();
}

TEST_F(GPUScopesTest, PlainDrawingEnablesNothingThatWasNotEnabled) {
    GLState const before = GLState::capture();
    {
        ScopedPlainDrawing const plain;
        EXPECT_EQ("", before.differencesTo(GLState::capture()));
    }
    EXPECT_EQ("", before.differencesTo(GLState::capture()));
}

TEST_F(GPUScopesTest, PlainDrawingKeepsToTheFirstVersionWhereThereIsNoOther) {
    makeDrawingOdd();
    glBlendEquation(GL_MAX);
    OGL::ExtensionManager::Instance()->overrideVersion(1, 5);
    GLState const before = GLState::capture();
    {
        ScopedPlainDrawing const plain;
        EXPECT_EQ(GL_FUNC_ADD, integerOf(GL_BLEND_EQUATION));
        EXPECT_TRUE(glIsEnabled(GL_POINT_SPRITE));
        EXPECT_TRUE(glIsEnabled(GL_VERTEX_PROGRAM_POINT_SIZE));
        EXPECT_EQ(2, enabledArrays());
    }
    EXPECT_EQ("", before.differencesTo(GLState::capture()));
    makeDrawingNormal();
}

TEST_F(GPUScopesTest, PlainDrawingEndsQuietlyWhereTheContextIsGone) {
    std::optional<ScopedPlainDrawing> oPlain(std::in_place);
    host().release();
    oPlain.reset();
    host().makeCurrent();
    EXPECT_EQ(GLenum(GL_NO_ERROR), glGetError());
}

} // namespace
