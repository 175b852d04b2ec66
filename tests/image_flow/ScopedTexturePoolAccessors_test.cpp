#include "orvo/image_flow/ScopedTexturePoolAccessors.h"

#include "tests/image_flow/support/GLFlowTest.h"

#include <memory>
#include <type_traits>

#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/Texture3D.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using OGL::Texture;

static_assert(std::has_virtual_destructor_v<ScopedTexture3D>);
static_assert(std::is_base_of_v<ScopedTexture3D, ScopedTexture3DFromPool>);

/// A scope whose pool gave nothing.
class NoTexture3D : public ScopedTexture3D {
public:
    NoTexture3D() : ScopedTexture3D(nullptr) {}
};

class ScopedTexturePoolAccessorsTest : public GLFlowTest {
protected:
    static int integerOf(GLenum token) {
        GLint value = 0;
        glGetIntegerv(token, &value);
        return value;
    }
    static int parameterOf(GLenum token) {
        GLint value = 0;
        glGetTexParameteriv(GL_TEXTURE_2D, token, &value);
        return value;
    }
};

TEST_F(ScopedTexturePoolAccessorsTest, HoldTexturesOfJustTheSizeAndReturnThem) {
    OGL::Texture const* pLast[3] = {};
    for (int i = 0; i < 2; ++i) {
        auto const nTextures = GLHooks::calls("glGenTextures");
        ScopedTexture1D const line(300, Texture::INTERNAL_FORMAT_LUMINANCE32F);
        EXPECT_EQ(300U, line.get()->width(0));
        EXPECT_EQ(Texture::INTERNAL_FORMAT_LUMINANCE32F, line.get()->format());
        ScopedTexture2D const plane(300, 200, Texture::INTERNAL_FORMAT_RGBA8);
        EXPECT_EQ(300U, plane.get()->width(0));
        EXPECT_EQ(200U, plane.get()->height(0));
        EXPECT_EQ(Texture::INTERNAL_FORMAT_RGBA8, plane.get()->format());
        std::unique_ptr<ScopedTexture3D> const upBox =
            std::make_unique<ScopedTexture3DFromPool>(3, 5, 7, Texture::INTERNAL_FORMAT_RGBA16F);
        EXPECT_EQ(3U, upBox->get()->width(0));
        EXPECT_EQ(5U, upBox->get()->height(0));
        EXPECT_EQ(7U, upBox->get()->depth(0));
        EXPECT_EQ(Texture::INTERNAL_FORMAT_RGBA16F, upBox->get()->format());
        if (i == 1) {
            // The textures of the first round came back through the pool.
            EXPECT_EQ(nTextures, GLHooks::calls("glGenTextures"));
            EXPECT_EQ(pLast[0], line.get());
            EXPECT_EQ(pLast[1], plane.get());
            EXPECT_EQ(pLast[2], upBox->get());
        }
        pLast[0] = line.get();
        pLast[1] = plane.get();
        pLast[2] = upBox->get();
    }
}

TEST_F(ScopedTexturePoolAccessorsTest, BindAndSetA2DTexture) {
    ScopedTexture2D const plane(4, 4, Texture::INTERNAL_FORMAT_RGBA8);
    plane.bind(2);
    EXPECT_EQ(GL_TEXTURE2, integerOf(GL_ACTIVE_TEXTURE));
    EXPECT_EQ(static_cast<int>(plane.get()->objectID()), integerOf(GL_TEXTURE_BINDING_2D));
    plane.setFilter(Texture::FILTER_NEAREST, Texture::FILTER_LINEAR);
    EXPECT_EQ(GL_NEAREST, parameterOf(GL_TEXTURE_MIN_FILTER));
    EXPECT_EQ(GL_LINEAR, parameterOf(GL_TEXTURE_MAG_FILTER));
    plane.setWrap(Texture::WRAP_MODE_REPEAT, Texture::WRAP_MODE_CLAMP_TO_EDGE);
    EXPECT_EQ(GL_REPEAT, parameterOf(GL_TEXTURE_WRAP_S));
    EXPECT_EQ(GL_CLAMP_TO_EDGE, parameterOf(GL_TEXTURE_WRAP_T));
    plane.unbind(2);
    EXPECT_EQ(0, integerOf(GL_TEXTURE_BINDING_2D));
    ORVO_EXPECT_INTERNAL(plane.setFilter(Texture::FILTER_NEAREST, Texture::FILTER_NEAREST), "isBound()");
    ORVO_EXPECT_INTERNAL(plane.setWrap(Texture::WRAP_MODE_REPEAT, Texture::WRAP_MODE_REPEAT), "isBound()");
    ORVO_EXPECT_PARAMETER(plane.bind(100000), "The texture unit does not exist");
    glActiveTexture(GL_TEXTURE0);
}

TEST_F(ScopedTexturePoolAccessorsTest, ABaseWithoutATextureSaysSo) {
    NoTexture3D const none;
    ORVO_EXPECT_INTERNAL(none.get(), "internalTexture_ != NULL");
}

TEST_F(ScopedTexturePoolAccessorsTest, DieQuietlyWithoutAContext) {
    auto upLine = std::make_unique<ScopedTexture1D>(4, Texture::INTERNAL_FORMAT_RGBA8);
    auto upPlane = std::make_unique<ScopedTexture2D>(4, 4, Texture::INTERNAL_FORMAT_RGBA8);
    auto upBox = std::make_unique<ScopedTexture3DFromPool>(4, 4, 4, Texture::INTERNAL_FORMAT_RGBA8);
    unsigned const aNames[] = {upLine->get()->objectID(), upPlane->get()->objectID(),
                               upBox->get()->objectID()};
    host().release();
    upLine.reset();
    upPlane.reset();
    upBox.reset();
    host().makeCurrent();
    TexturePool::Instance()->clearAll();
    // Names that could not be deleted without a context stay to the end of the share group.
    for (unsigned const name : aNames)
        if (glIsTexture(name))
            glDeleteTextures(1, &name);
}

TEST(ScopedTexturePoolAccessorsWithoutOpenGLTest, CannotBe) {
    Core::AutoInitializer const core;
    OGL::AutoInitializer const ogl;
    ImageRuntime::AutoInitializer const runtime(nullptr, VideoMemory::Configuration());
    char const* const pMessage = "Enforce TexturePool::Instance() != NULL";
    ORVO_EXPECT_INTERNAL(ScopedTexture1D(4, Texture::INTERNAL_FORMAT_RGBA8), pMessage);
    ORVO_EXPECT_INTERNAL(ScopedTexture2D(4, 4, Texture::INTERNAL_FORMAT_RGBA8), pMessage);
    ORVO_EXPECT_INTERNAL(ScopedTexture3DFromPool(4, 4, 4, Texture::INTERNAL_FORMAT_RGBA8), pMessage);
}

} // namespace
