#include "orvo/image_runtime/GLStateUtils.h"

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/Texture3D.h"
#include "orvo/ogl/TextureRECT.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/GLTest.h"

#include <epoxy/gl.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <type_traits>

namespace ORVO {
namespace {

using OGL::Texture;

unsigned activeUnit() {
    GLint nUnit = 0;
    glGetIntegerv(GL_ACTIVE_TEXTURE, &nUnit);
    return static_cast<unsigned>(nUnit) - GL_TEXTURE0;
}

/// Makes a unit active for one question.
template <typename Ask>
auto onUnit(unsigned unit, Ask const& ask) {
    unsigned const nActive = activeUnit();
    glActiveTexture(GL_TEXTURE0 + unit);
    auto const answer = ask();
    glActiveTexture(GL_TEXTURE0 + nActive);
    return answer;
}

bool isEnabled(unsigned unit, GLenum target) {
    return onUnit(unit, [target] { return glIsEnabled(target) != GL_FALSE; });
}

unsigned boundTo(unsigned unit, GLenum binding) {
    return onUnit(unit, [binding] {
        GLint nName = 0;
        glGetIntegerv(binding, &nName);
        return static_cast<unsigned>(nName);
    });
}

class GLStateUtils : public Test::GLTest {
protected:
    void TearDown() override {
        glActiveTexture(GL_TEXTURE0);
        GLTest::TearDown();
    }
};

TEST_F(GLStateUtils, ActiveUnitComesBack) {
    glActiveTexture(GL_TEXTURE3);
    {
        ScopedActiveTextureUnitRestore const restore;
        EXPECT_EQ(3u, activeUnit());
        glActiveTexture(GL_TEXTURE5);
    }
    EXPECT_EQ(3u, activeUnit());
}

TEST_F(GLStateUtils, CapabilityIsDisabledAtTheEnd) {
    {
        ScopedGLEnable const enable(GL_BLEND);
        EXPECT_TRUE(glIsEnabled(GL_BLEND));
    }
    EXPECT_FALSE(glIsEnabled(GL_BLEND));
    // Whatever it was before.
    glEnable(GL_SCISSOR_TEST);
    { ScopedGLEnable const enable(GL_SCISSOR_TEST); }
    EXPECT_FALSE(glIsEnabled(GL_SCISSOR_TEST));
}

TEST_F(GLStateUtils, VertexArrayIsDisabledAtTheEnd) {
    {
        ScopedGLEnableClientState const enable(GL_VERTEX_ARRAY);
        EXPECT_TRUE(glIsEnabled(GL_VERTEX_ARRAY));
    }
    EXPECT_FALSE(glIsEnabled(GL_VERTEX_ARRAY));
}

/// One kind of texture: its scopes and tokens.
template <unsigned nDimensions, typename TextureT, GLenum nTarget, GLenum nBinding>
struct Kind {
    using EnablerNoActivation = ScopedTextureEnabler<nDimensions, false>;
    using EnablerWithActivation = ScopedTextureEnabler<nDimensions, true>;
    using Bind = ScopedTextureBinder<TextureT, false>;
    using BindUnbindWithActivation = ScopedTextureBinder<TextureT, true>;
    using Made = TextureT;
    static constexpr GLenum target = nTarget;
    static constexpr GLenum binding = nBinding;
};
using Kind1D = Kind<1, OGL::Texture1D, GL_TEXTURE_1D, GL_TEXTURE_BINDING_1D>;
using Kind2D = Kind<2, OGL::Texture2D, GL_TEXTURE_2D, GL_TEXTURE_BINDING_2D>;
using Kind3D = Kind<3, OGL::Texture3D, GL_TEXTURE_3D, GL_TEXTURE_BINDING_3D>;

static_assert(std::is_same_v<ScopedTexture1DEnablerNoActivation, Kind1D::EnablerNoActivation>);
static_assert(std::is_same_v<ScopedTexture2DEnablerNoActivation, Kind2D::EnablerNoActivation>);
static_assert(std::is_same_v<ScopedTexture3DEnablerNoActivation, Kind3D::EnablerNoActivation>);
static_assert(std::is_same_v<ScopedTexture1DEnablerWithActivation, Kind1D::EnablerWithActivation>);
static_assert(std::is_same_v<ScopedTexture2DEnablerWithActivation, Kind2D::EnablerWithActivation>);
static_assert(std::is_same_v<ScopedTexture3DEnablerWithActivation, Kind3D::EnablerWithActivation>);
static_assert(std::is_same_v<ScopedTexture1DBind, Kind1D::Bind>);
static_assert(std::is_same_v<ScopedTexture2DBind, Kind2D::Bind>);
static_assert(std::is_same_v<ScopedTexture3DBind, Kind3D::Bind>);
static_assert(std::is_same_v<ScopedTexture1DBindUnbindWithActivation, Kind1D::BindUnbindWithActivation>);
static_assert(std::is_same_v<ScopedTexture2DBindUnbindWithActivation, Kind2D::BindUnbindWithActivation>);
static_assert(std::is_same_v<ScopedTexture3DBindUnbindWithActivation, Kind3D::BindUnbindWithActivation>);

std::unique_ptr<OGL::Texture1D> make(OGL::Texture1D*) {
    return std::make_unique<OGL::Texture1D>(Texture::INTERNAL_FORMAT_RGBA8, 2, false);
}
std::unique_ptr<OGL::Texture2D> make(OGL::Texture2D*) {
    return std::make_unique<OGL::Texture2D>(Texture::INTERNAL_FORMAT_RGBA8, 2, 2, false, nullptr);
}
std::unique_ptr<OGL::Texture3D> make(OGL::Texture3D*) {
    return std::make_unique<OGL::Texture3D>(Texture::INTERNAL_FORMAT_RGBA8, 2, 2, 2, false);
}

template <typename K>
class GLStateUtilsOfKind : public GLStateUtils {
protected:
    auto makeTexture() { return make(static_cast<typename K::Made*>(nullptr)); }
    bool isEnabledOn(unsigned unit) { return isEnabled(unit, K::target); }
    unsigned boundOn(unsigned unit) { return boundTo(unit, K::binding); }
};
using Kinds = testing::Types<Kind1D, Kind2D, Kind3D>;
TYPED_TEST_SUITE(GLStateUtilsOfKind, Kinds);

TYPED_TEST(GLStateUtilsOfKind, EnablerWithoutActivationLeavesTheActiveUnit) {
    glActiveTexture(GL_TEXTURE4);
    {
        typename TypeParam::EnablerNoActivation const enable(2);
        EXPECT_EQ(4u, activeUnit());
        EXPECT_TRUE(this->isEnabledOn(2));
        EXPECT_FALSE(this->isEnabledOn(4));
        glActiveTexture(GL_TEXTURE1);
    }
    EXPECT_EQ(1u, activeUnit());
    EXPECT_FALSE(this->isEnabledOn(2));
}

TYPED_TEST(GLStateUtilsOfKind, EnablerWithActivationSelectsItsUnitTwice) {
    glActiveTexture(GL_TEXTURE4);
    {
        typename TypeParam::EnablerWithActivation const enable(2);
        EXPECT_EQ(2u, activeUnit());
        EXPECT_TRUE(this->isEnabledOn(2));
        glActiveTexture(GL_TEXTURE1);
    }
    EXPECT_EQ(2u, activeUnit());
    EXPECT_FALSE(this->isEnabledOn(2));
}

TYPED_TEST(GLStateUtilsOfKind, BindBindsNameZeroAtTheEnd) {
    auto const pTexture = this->makeTexture();
    auto const pOther = this->makeTexture();
    glActiveTexture(GL_TEXTURE3);
    glBindTexture(TypeParam::target, pOther->objectID());
    {
        typename TypeParam::Bind const bind(3, pTexture.get());
        EXPECT_EQ(pTexture->objectID(), this->boundOn(3));
        glActiveTexture(GL_TEXTURE1);
    }
    // Not what was there before.
    EXPECT_EQ(0u, this->boundOn(3));
    EXPECT_EQ(3u, activeUnit());
}

TYPED_TEST(GLStateUtilsOfKind, BindWithActivationEndsOnItsUnit) {
    auto const pTexture = this->makeTexture();
    {
        typename TypeParam::BindUnbindWithActivation const bind(3, pTexture.get());
        EXPECT_EQ(pTexture->objectID(), this->boundOn(3));
        EXPECT_EQ(0u, this->boundOn(1));
        glActiveTexture(GL_TEXTURE1);
    }
    EXPECT_EQ(0u, this->boundOn(3));
    EXPECT_EQ(3u, activeUnit());
}

TYPED_TEST(GLStateUtilsOfKind, RefusesBadUnitsAndNoTexture) {
    char const* const sText = "The texture unit does not exist";
    auto const pTexture = this->makeTexture();
    ORVO_EXPECT_PARAMETER(typename TypeParam::EnablerNoActivation(100000), sText);
    ORVO_EXPECT_PARAMETER(typename TypeParam::EnablerWithActivation(100000), sText);
    ORVO_EXPECT_PARAMETER(typename TypeParam::Bind(100000, pTexture.get()), sText);
    ORVO_EXPECT_PARAMETER(typename TypeParam::BindUnbindWithActivation(100000, pTexture.get()), sText);
    ORVO_EXPECT_INTERNAL(typename TypeParam::Bind(0, nullptr), "Enforce pTexture != NULL");
    ORVO_EXPECT_INTERNAL(typename TypeParam::BindUnbindWithActivation(0, nullptr),
                         "Enforce pTexture != NULL");
}

TYPED_TEST(GLStateUtilsOfKind, UndoesNothingWithoutAContext) {
    auto const pTexture = this->makeTexture();
    {
        typename TypeParam::EnablerNoActivation const enable(2);
        typename TypeParam::EnablerWithActivation const enableActive(3);
        typename TypeParam::Bind const bind(2, pTexture.get());
        typename TypeParam::BindUnbindWithActivation const bindActive(3, pTexture.get());
        this->host().release();
        ORVO_EXPECT_OGL(typename TypeParam::EnablerNoActivation(2), "No OpenGL context is current");
        ORVO_EXPECT_OGL(typename TypeParam::EnablerWithActivation(2), "No OpenGL context is current");
        ORVO_EXPECT_OGL(typename TypeParam::Bind(2, pTexture.get()), "No OpenGL context is current");
    }
    this->host().makeCurrent();
    EXPECT_TRUE(this->isEnabledOn(2));
    EXPECT_EQ(pTexture->objectID(), this->boundOn(3));
    for (GLenum unit : {GL_TEXTURE2, GL_TEXTURE3}) {
        glActiveTexture(unit);
        glDisable(TypeParam::target);
        glBindTexture(TypeParam::target, 0);
    }
}

TEST_F(GLStateUtils, SimpleScopesNeedAContextAndSurviveItsLoss) {
    {
        ScopedActiveTextureUnitRestore const restore;
        ScopedGLEnable const enable(GL_BLEND);
        ScopedGLEnableClientState const array(GL_VERTEX_ARRAY);
        host().release();
        ORVO_EXPECT_OGL(ScopedActiveTextureUnitRestore(), "No OpenGL context is current");
        ORVO_EXPECT_OGL(ScopedGLEnable(GL_BLEND), "No OpenGL context is current");
        ORVO_EXPECT_OGL(ScopedGLEnableClientState(GL_VERTEX_ARRAY), "No OpenGL context is current");
    }
    host().makeCurrent();
    EXPECT_TRUE(glIsEnabled(GL_BLEND));
    glDisable(GL_BLEND);
    glDisableClientState(GL_VERTEX_ARRAY);
}

TEST_F(GLStateUtils, BindRestoreBringsBackWhatWasBound) {
    OGL::Texture2D first(Texture::INTERNAL_FORMAT_RGBA8, 2, 2, false, nullptr);
    OGL::Texture2D second(Texture::INTERNAL_FORMAT_RGBA8, 2, 2, false, nullptr);
    OGL::TextureRECT firstRECT(Texture::INTERNAL_FORMAT_RGBA8, 2, 2, nullptr);
    OGL::TextureRECT secondRECT(Texture::INTERNAL_FORMAT_RGBA8, 2, 2, nullptr);
    glBindTexture(GL_TEXTURE_2D, first.objectID());
    glBindTexture(GL_TEXTURE_RECTANGLE, firstRECT.objectID());
    {
        ScopedTextureBindRestore<OGL::Texture2D> const bound(&second);
        EXPECT_TRUE(second.isBound());
        EXPECT_TRUE(firstRECT.isBound());
        // The other one takes any texture of two dimensions, each on its own target.
        ScopedTextureBindRestore<OGL::Texture2> const boundRECT(&secondRECT);
        EXPECT_TRUE(secondRECT.isBound());
        EXPECT_TRUE(second.isBound());
        ScopedTextureBindRestore<OGL::Texture2> const again(&first);
        EXPECT_TRUE(first.isBound());
    }
    EXPECT_TRUE(first.isBound());
    EXPECT_TRUE(firstRECT.isBound());
    ORVO_EXPECT_INTERNAL(ScopedTextureBindRestore<OGL::Texture2D>(nullptr), "Enforce pTexture != NULL");
    ORVO_EXPECT_INTERNAL(ScopedTextureBindRestore<OGL::Texture2>(nullptr), "Enforce pTexture != NULL");
    {
        ScopedTextureBindRestore<OGL::Texture2D> const bound(&second);
        host().release();
        ORVO_EXPECT_OGL(ScopedTextureBindRestore<OGL::Texture2D>{&first}, "No OpenGL context is current");
    }
    host().makeCurrent();
    EXPECT_TRUE(second.isBound());
    glBindTexture(GL_TEXTURE_2D, 0);
    glBindTexture(GL_TEXTURE_RECTANGLE, 0);
}

TEST_F(GLStateUtils, ScopesAreStateObjectsThatNobodyCopies) {
    EXPECT_TRUE(std::has_virtual_destructor_v<StateObject>);
    EXPECT_TRUE((std::is_base_of_v<StateObject, ScopedGLEnable>));
    EXPECT_TRUE((std::is_base_of_v<StateObject, ScopedTexture3DBind>));
    EXPECT_TRUE((std::is_base_of_v<StateObject, ScopedTextureBindRestore<OGL::Texture2>>));
    EXPECT_FALSE(std::is_copy_constructible_v<ScopedGLEnable>);
    EXPECT_FALSE(std::is_copy_constructible_v<GLStateStack>);
}

/// Writes its name when it is undone.
class NamedScope : public StateObject {
public:
    NamedScope(std::string& sOut, char cName) : sOut_(sOut), cName_(cName) {}
    ~NamedScope() override { sOut_ += cName_; }

private:
    std::string& sOut_;
    char cName_;
};

TEST(GLStateStack, UndoesInReverseOrder) {
    std::string sOut;
    {
        GLStateStack stack;
        EXPECT_TRUE(stack.empty());
        for (char c : {'a', 'b', 'c', 'd'})
            stack.push_back(ORVO_NEW NamedScope(sOut, c));
        stack.push_back(new NamedScope(sOut, 'e'));
        EXPECT_EQ(5u, stack.size());
        stack.pop();
        EXPECT_EQ("e", sOut);
        stack.pop();
        EXPECT_EQ("ed", sOut);
        EXPECT_EQ(3u, stack.size());
        EXPECT_FALSE(stack.empty());
    }
    EXPECT_EQ("edcba", sOut);
}

TEST(GLStateStack, UndoesWhenAnExceptionPasses) {
    std::string sOut;
    try {
        GLStateStack stack;
        stack.push_back(ORVO_NEW NamedScope(sOut, 'a'));
        stack.push_back(ORVO_NEW NamedScope(sOut, 'b'));
        throw std::runtime_error("a pass failed");
    } catch (std::runtime_error const&) {
        sOut += '!';
    }
    EXPECT_EQ("ba!", sOut);
}

TEST(GLStateStack, RefusesToPopNothingAndToPushNothing) {
    GLStateStack stack;
    ORVO_EXPECT_INTERNAL(stack.pop(), "!vpState_.empty()");
    ORVO_EXPECT_INTERNAL(stack.push_back(nullptr), "Enforce pState != NULL");
    EXPECT_TRUE(stack.empty());
}

TEST_F(GLStateUtils, StackOfScopesUndoesTheBindBeforeTheEnable) {
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_RGBA8, 2, 2, false, nullptr);
    {
        GLStateStack stack;
        stack.push_back(ORVO_NEW ScopedActiveTextureUnitRestore);
        stack.push_back(ORVO_NEW ScopedTexture2DEnablerWithActivation(1));
        stack.push_back(ORVO_NEW ScopedTexture2DBindUnbindWithActivation(1, &texture));
        EXPECT_TRUE(isEnabled(1, GL_TEXTURE_2D));
        EXPECT_EQ(texture.objectID(), boundTo(1, GL_TEXTURE_BINDING_2D));
        stack.pop();
        EXPECT_TRUE(isEnabled(1, GL_TEXTURE_2D));
        EXPECT_EQ(0u, boundTo(1, GL_TEXTURE_BINDING_2D));
    }
    EXPECT_FALSE(isEnabled(1, GL_TEXTURE_2D));
    EXPECT_EQ(0u, activeUnit());
}

} // namespace
} // namespace ORVO
