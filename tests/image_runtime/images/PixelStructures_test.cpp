#include "orvo/image_runtime/images/PixelStructures.h"

#include <gtest/gtest.h>

#include <cstddef>

namespace ORVO {
namespace {

TEST(PixelStructures, HaveTheSizesOfTheirFormats) {
    EXPECT_EQ(3u, sizeof(PixelBGR8));
    EXPECT_EQ(4u, sizeof(PixelBGRA8));
    EXPECT_EQ(3u, sizeof(PixelRGB8));
    EXPECT_EQ(4u, sizeof(PixelRGBA8));
    EXPECT_EQ(1u, sizeof(PixelLuminance8));
    EXPECT_EQ(2u, sizeof(PixelLuminanceAlpha8));
    EXPECT_EQ(6u, sizeof(PixelRGB16F));
    EXPECT_EQ(8u, sizeof(PixelRGBA16F));
    EXPECT_EQ(2u, sizeof(PixelLuminance16F));
    EXPECT_EQ(4u, sizeof(PixelLuminanceAlpha16F));
    EXPECT_EQ(12u, sizeof(PixelRGB32F));
    EXPECT_EQ(16u, sizeof(PixelRGBA32F));
    EXPECT_EQ(4u, sizeof(PixelLuminance32F));
    EXPECT_EQ(8u, sizeof(PixelLuminanceAlpha32F));
}

TEST(PixelStructures, HaveTheirChannelsInMemoryOrder) {
    EXPECT_EQ(0u, offsetof(PixelBGRA8, b));
    EXPECT_EQ(1u, offsetof(PixelBGRA8, g));
    EXPECT_EQ(2u, offsetof(PixelBGRA8, r));
    EXPECT_EQ(3u, offsetof(PixelBGRA8, a));
    EXPECT_EQ(0u, offsetof(PixelBGR8, b));
    EXPECT_EQ(2u, offsetof(PixelBGR8, r));
    EXPECT_EQ(0u, offsetof(PixelRGBA8, r));
    EXPECT_EQ(3u, offsetof(PixelRGBA8, a));
    EXPECT_EQ(0u, offsetof(PixelRGB16F, r));
    EXPECT_EQ(4u, offsetof(PixelRGB16F, b));
    EXPECT_EQ(6u, offsetof(PixelRGBA16F, a));
    EXPECT_EQ(8u, offsetof(PixelRGB32F, b));
    EXPECT_EQ(12u, offsetof(PixelRGBA32F, a));
    EXPECT_EQ(1u, offsetof(PixelLuminanceAlpha8, a));
    EXPECT_EQ(2u, offsetof(PixelLuminanceAlpha16F, a));
    EXPECT_EQ(4u, offsetof(PixelLuminanceAlpha32F, a));
}

TEST(PixelStructures, AddAndScaleEveryComponentOfRGBA) {
    PixelRGBA32F const a{1, 2, 3, 4};
    PixelRGBA32F const sum = a + PixelRGBA32F{10, 20, 30, 40};
    EXPECT_EQ(11.0f, sum.r);
    EXPECT_EQ(22.0f, sum.g);
    EXPECT_EQ(33.0f, sum.b);
    EXPECT_EQ(44.0f, sum.a);

    PixelRGBA32F const product = a * 0.5f;
    EXPECT_EQ(0.5f, product.r);
    EXPECT_EQ(1.0f, product.g);
    EXPECT_EQ(1.5f, product.b);
    EXPECT_EQ(2.0f, product.a);

    PixelRGBA32F changed = a;
    EXPECT_EQ(&changed, &(changed += a));
    EXPECT_EQ(&changed, &(changed *= 2.0f));
    EXPECT_EQ(4.0f, changed.r);
    EXPECT_EQ(8.0f, changed.g);
    EXPECT_EQ(12.0f, changed.b);
    EXPECT_EQ(16.0f, changed.a);
    EXPECT_EQ(1.0f, a.r);
}

TEST(PixelStructures, AddAndScaleEveryComponentOfLuminanceAlpha) {
    PixelLuminanceAlpha32F const a{1, 2};
    PixelLuminanceAlpha32F const sum = a + PixelLuminanceAlpha32F{10, 20};
    EXPECT_EQ(11.0f, sum.l);
    EXPECT_EQ(22.0f, sum.a);

    PixelLuminanceAlpha32F const product = a * 0.5f;
    EXPECT_EQ(0.5f, product.l);
    EXPECT_EQ(1.0f, product.a);

    PixelLuminanceAlpha32F changed = a;
    EXPECT_EQ(&changed, &(changed += a));
    EXPECT_EQ(&changed, &(changed *= 2.0f));
    EXPECT_EQ(4.0f, changed.l);
    EXPECT_EQ(8.0f, changed.a);
}

} // namespace
} // namespace ORVO
