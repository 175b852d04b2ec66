#include "orvo/ogl/TokenName.h"

#include <epoxy/gl.h>
#include <gtest/gtest.h>

#include <string>

#include "orvo/ogl/Texture.h"

namespace {

using namespace ORVO;

TEST(TokenName, NamesWhatMessagesSpeakOf) {
    EXPECT_STREQ("GL_NONE", OGL::TokenName(0));
    EXPECT_STREQ("GL_TEXTURE_2D", OGL::TokenName(0x0DE1));
    EXPECT_STREQ("GL_RGBA16F", OGL::TokenName(34842));
    EXPECT_STREQ("GL_LUMINANCE32F", OGL::TokenName(34840));
    EXPECT_STREQ("GL_FRAMEBUFFER_UNSUPPORTED", OGL::TokenName(36061));
    EXPECT_STREQ("GL_OUT_OF_MEMORY", OGL::TokenName(0x0505));
    EXPECT_STREQ("GL_TEXTURE_RECTANGLE", OGL::TokenName(0x84F5));
    EXPECT_STREQ("GL_HALF_FLOAT", OGL::TokenName(0x140B));
    EXPECT_STREQ("GL_FRAMEBUFFER_INCOMPLETE_MISSING_ATTACHMENT", OGL::TokenName(0x8CD7));
}

TEST(TokenName, ReadsUnknownNumbersAsHexadecimal) {
    char const* const pName = OGL::TokenName(0x1234);
    EXPECT_STREQ("0x00001234", pName);
    EXPECT_STREQ("0xFFFFFFFF", OGL::TokenName(0xFFFFFFFFU));
    // The text stays valid, and is the same one.
    EXPECT_EQ(pName, OGL::TokenName(0x1234));
    EXPECT_STREQ("0x00001234", pName);
}

TEST(TokenName, NamesEveryInternalFormat) {
    for (int i = 0; i < 58; ++i) {
        auto const format = static_cast<OGL::Texture::InternalFormat>(i);
        if (!OGL::Texture::IsValid(format))
            continue;
        std::string const sName = OGL::TokenName(OGL::Texture::InternalFormat2GL(format));
        EXPECT_EQ(0U, sName.find("GL_")) << i;
    }
}

} // namespace
