#include <epoxy/gl.h>
#include <gtest/gtest.h>

#include <climits>
#include <cstdint>
#include <set>

#include "orvo/ogl/Buffer.h"
#include "orvo/ogl/ExceptionOGL.h"
#include "orvo/ogl/Texture.h"
#include "orvo/ogl/TextureUnit.h"
#include "tests/support/gl/ExpectOGL.h"

namespace {

using namespace ORVO;
using OGL::Texture;

struct FormatRow {
    int nValue_;
    unsigned nToken_;
    unsigned nChannels_;
    /// Bytes of one pixel.
    std::size_t nBytes_;
};

// The numbers of tokens stand as the OpenGL registry has them.
constexpr FormatRow aInternalFormats[] = {
    {0, 0x1906, 1, 1},  {1, 0x803B, 1, 1},  {2, 0x803C, 1, 1},   {3, 0x803D, 1, 2},   {4, 0x803E, 1, 2},
    {5, 0x1909, 1, 1},  {6, 0x803F, 1, 1},  {7, 0x8040, 1, 1},   {8, 0x8041, 1, 2},   {9, 0x8042, 1, 2},
    {10, 0x190A, 2, 2}, {11, 0x8043, 2, 1}, {12, 0x8044, 2, 1},  {13, 0x8045, 2, 2},  {14, 0x8046, 2, 2},
    {15, 0x8047, 2, 3}, {16, 0x8048, 2, 4}, {17, 0x8049, 1, 1},  {18, 0x804A, 1, 1},  {19, 0x804B, 1, 1},
    {20, 0x804C, 1, 2}, {21, 0x804D, 1, 2}, {22, 0x1902, 1, 1},  {23, 0x81A5, 1, 2},  {24, 0x81A6, 1, 3},
    {25, 0x81A7, 1, 4}, {30, 0x2A10, 3, 1}, {31, 0x1907, 3, 3},  {32, 0x804F, 3, 2},  {33, 0x8050, 3, 2},
    {34, 0x8051, 3, 3}, {35, 0x8052, 3, 4}, {36, 0x8053, 3, 5},  {37, 0x8054, 3, 6},  {38, 0x1908, 4, 4},
    {39, 0x8055, 4, 1}, {40, 0x8056, 4, 2}, {41, 0x8057, 4, 2},  {42, 0x8058, 4, 4},  {43, 0x8059, 4, 4},
    {44, 0x805A, 4, 6}, {45, 0x805B, 4, 8}, {46, 0x8814, 4, 16}, {47, 0x8815, 3, 12}, {48, 0x8816, 1, 4},
    {49, 0x8817, 1, 4}, {50, 0x8818, 1, 4}, {51, 0x8819, 2, 8},  {52, 0x881A, 4, 8},  {53, 0x881B, 3, 6},
    {54, 0x881C, 1, 2}, {55, 0x881D, 1, 2}, {56, 0x881E, 1, 2},  {57, 0x881F, 2, 4}};

TEST(TextureConversions, InternalFormatsAreTheTable) {
    for (FormatRow const& row : aInternalFormats) {
        SCOPED_TRACE(row.nValue_);
        auto const format = static_cast<Texture::InternalFormat>(row.nValue_);
        EXPECT_TRUE(Texture::IsValid(format));
        EXPECT_EQ(row.nToken_, Texture::InternalFormat2GL(format));
        EXPECT_EQ(format, Texture::GL2InternalFormat(row.nToken_));
        EXPECT_EQ(row.nChannels_, Texture::Channels(format));
        EXPECT_EQ(row.nBytes_, Texture::SizeInBytes(format, 1, 1, 1));
        EXPECT_EQ(row.nBytes_ * 105, Texture::SizeInBytes(format, 3, 5, 7));
        EXPECT_EQ(row.nValue_ >= 46, Texture::IsFloat(format));
    }
    EXPECT_EQ(54U, std::size(aInternalFormats));
}

TEST(TextureConversions, RefuseInternalFormatsThatAreNone) {
    for (int const nValue : {26, 27, 28, 29, 58, -1, INT_MAX, INT_MIN}) {
        SCOPED_TRACE(nValue);
        auto const format = static_cast<Texture::InternalFormat>(nValue);
        std::string const text = "Unknown internal format " + std::to_string(nValue);
        EXPECT_FALSE(Texture::IsValid(format));
        ORVO_EXPECT_OGL(Texture::InternalFormat2GL(format), text);
        ORVO_EXPECT_OGL(Texture::Channels(format), text);
        ORVO_EXPECT_OGL(Texture::SizeInBytes(format, 1, 1, 1), text);
    }
    ORVO_EXPECT_OGL(Texture::GL2InternalFormat(0x0DE1), "Unknown internal format GL_TEXTURE_2D");
    ORVO_EXPECT_OGL(Texture::GL2InternalFormat(0), "Unknown internal format GL_NONE");
}

TEST(TextureConversions, SizesOfNothingAreZeroAndOfTooMuchSaturate) {
    auto const format = Texture::INTERNAL_FORMAT_RGBA32F;
    EXPECT_EQ(0U, Texture::SizeInBytes(format, 0, SIZE_MAX, SIZE_MAX));
    EXPECT_EQ(0U, Texture::SizeInBytes(format, SIZE_MAX, 0, 1));
    EXPECT_EQ(0U, Texture::SizeInBytes(format, SIZE_MAX, 1, 0));
    EXPECT_EQ(SIZE_MAX, Texture::SizeInBytes(format, SIZE_MAX, 1, 1));
    EXPECT_EQ(SIZE_MAX, Texture::SizeInBytes(format, std::size_t{1} << 40, std::size_t{1} << 40, 1));
}

struct TokenRow {
    int nValue_;
    unsigned nToken_;
};

/// Both directions over a whole table, and the refusals on either side of it.
template <typename Enum, std::size_t n, typename ToGL, typename FromGL>
void expectRoundTrips(TokenRow const (&aRows)[n], ToGL toGL, FromGL fromGL, std::string const& what) {
    for (std::size_t i = 0; i < n; ++i) {
        SCOPED_TRACE(what + " " + std::to_string(i));
        EXPECT_EQ(static_cast<int>(i), aRows[i].nValue_);
        auto const value = static_cast<Enum>(aRows[i].nValue_);
        EXPECT_EQ(aRows[i].nToken_, toGL(value));
        EXPECT_EQ(value, fromGL(aRows[i].nToken_));
    }
    ORVO_EXPECT_OGL(toGL(static_cast<Enum>(n)), "Unknown " + what + " " + std::to_string(n));
    ORVO_EXPECT_OGL(toGL(static_cast<Enum>(-1)), "Unknown " + what + " -1");
    ORVO_EXPECT_OGL(fromGL(0x1234), "Unknown " + what + " 0x00001234");
    ORVO_EXPECT_OGL(fromGL(GL_OUT_OF_MEMORY), "Unknown " + what + " GL_OUT_OF_MEMORY");
}

TEST(TextureConversions, FormatsAreTheTable) {
    constexpr TokenRow aRows[] = {{0, 0x1900}, {1, 0x1902}, {2, 0x1903},  {3, 0x1904},
                                  {4, 0x1905}, {5, 0x1906}, {6, 0x1907},  {7, 0x80E0},
                                  {8, 0x1908}, {9, 0x80E1}, {10, 0x1909}, {11, 0x190A}};
    expectRoundTrips<Texture::Format>(aRows, &Texture::Format2GL, &Texture::GL2Format, "format");
    constexpr unsigned aChannels[] = {1, 1, 1, 1, 1, 1, 3, 3, 4, 4, 1, 2};
    for (int i = 0; i < 12; ++i)
        EXPECT_EQ(aChannels[i], Texture::Channels(static_cast<Texture::Format>(i))) << i;
    ORVO_EXPECT_OGL(Texture::Channels(static_cast<Texture::Format>(12)), "Unknown format 12");
}

TEST(TextureConversions, TypesAreTheTable) {
    constexpr TokenRow aRows[] = {
        {0, 0x1401},  {1, 0x1400},  {2, 0x1A00},  {3, 0x1403},  {4, 0x1402},  {5, 0x1404},  {6, 0x1405},
        {7, 0x1406},  {8, 0x8032},  {9, 0x8362},  {10, 0x8363}, {11, 0x8364}, {12, 0x8033}, {13, 0x8365},
        {14, 0x8034}, {15, 0x8366}, {16, 0x8035}, {17, 0x8367}, {18, 0x8036}, {19, 0x8368}, {20, 0x140B}};
    expectRoundTrips<Texture::Type>(aRows, &Texture::Type2GL, &Texture::GL2Type, "type");
}

TEST(TextureConversions, WrapModesAreTheTable) {
    constexpr TokenRow aRows[] = {{0, 0x2900}, {1, 0x812F}, {2, 0x812D}, {3, 0x2901}, {4, 0x8370}};
    expectRoundTrips<Texture::WrapMode>(aRows, &Texture::WrapMode2GL, &Texture::GL2WrapMode, "wrap mode");
}

TEST(TextureConversions, FiltersAreTheTable) {
    constexpr TokenRow aRows[] = {{0, 0x2600}, {1, 0x2601}, {2, 0x2700},
                                  {3, 0x2701}, {4, 0x2702}, {5, 0x2703}};
    expectRoundTrips<Texture::Filter>(aRows, &Texture::Filter2GL, &Texture::GL2Filter, "filter");
    constexpr bool aLinear[] = {false, true, false, true, true, true};
    for (int i = 0; i < 6; ++i)
        EXPECT_EQ(aLinear[i], Texture::IsLinear(static_cast<Texture::Filter>(i))) << i;
}

TEST(TextureConversions, TargetsAreTheTable) {
    constexpr TokenRow aRows[] = {{0, 0x0DE0}, {1, 0x0DE1}, {2, 0x806F}, {3, 0x84F5}};
    expectRoundTrips<Texture::Target>(aRows, &Texture::Target2GL, &Texture::GL2Target, "texture target");
}

TEST(TextureConversions, EnvironmentsAreTheTable) {
    constexpr TokenRow aRows[] = {{0, 0x0104}, {1, 0x0BE2}, {2, 0x8570},
                                  {3, 0x2101}, {4, 0x2100}, {5, 0x1E01}};
    expectRoundTrips<OGL::TextureUnit::Environment>(aRows, &OGL::TextureUnit::Environment2GL,
                                                    &OGL::TextureUnit::GL2Environment, "texture environment");
}

TEST(BufferConversions, TypesAndUsagesAreTheTables) {
    constexpr TokenRow aTypes[] = {{0, 0x88EC}, {1, 0x88EB}, {2, 0x8892}, {3, 0x8893}};
    expectRoundTrips<OGL::Buffer::Type>(aTypes, &OGL::Buffer::Type2GL, &OGL::Buffer::GL2Type, "buffer type");
    constexpr TokenRow aUsages[] = {{0, 0x88E0}, {1, 0x88E1}, {2, 0x88E2}, {3, 0x88E4}, {4, 0x88E5},
                                    {5, 0x88E6}, {6, 0x88E8}, {7, 0x88E9}, {8, 0x88EA}};
    expectRoundTrips<OGL::Buffer::Usage>(aUsages, &OGL::Buffer::Usage2GL, &OGL::Buffer::GL2Usage,
                                         "buffer usage");
}

} // namespace
