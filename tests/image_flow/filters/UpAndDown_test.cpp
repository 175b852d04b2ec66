// Images go up into textures and down again, bit for bit where the texture's format can hold them.

#include "tests/image_flow/support/GPURoads.h"

#include <cmath>

namespace ORVO {

namespace {

using Test::Chain;
using Test::channelBytes;
using Test::HostImage;
using Test::pixels;
using Test::TexelLayout;
using Test::worldOf;

using Bytes = std::vector<unsigned char>;

class UpAndDownTest : public Test::GLFlowTest {};

enum class Road {
    nodes,         ///< host image, CPU2GPU, GPU2CPU, new host image
    swapped,       ///< the same, red and blue change places
    boundFloats,   ///< texture filled directly, GPU2CPU into a bound image of 32-bit floats
    boundIntegers, ///< the same; the floats are 16-bit integers over 65535
    none           ///< no texture can have the format
};

struct Row {
    ImageGPU::tePixelFormat eTexture;
    Road eRoad;
    ImageCPU::tePixelFormat eFormat;
};

/// Each format of textures, and each format of host images that goes up into it.
constexpr Row aRows[] = {
    {ImageGPU::PIXEL_FORMAT_RGBA8, Road::nodes, ImageCPU::PIXEL_FORMAT_RGBA8},
    {ImageGPU::PIXEL_FORMAT_RGBA8, Road::swapped, ImageCPU::PIXEL_FORMAT_BGRA8},
    {ImageGPU::PIXEL_FORMAT_RGBA16, Road::boundIntegers, ImageCPU::PIXEL_FORMAT_RGBA32F},
    {ImageGPU::PIXEL_FORMAT_RGBA16F, Road::nodes, ImageCPU::PIXEL_FORMAT_RGBA16F},
    {ImageGPU::PIXEL_FORMAT_RGBA16F, Road::nodes, ImageCPU::PIXEL_FORMAT_RGBA16},
    {ImageGPU::PIXEL_FORMAT_RGBA32F, Road::nodes, ImageCPU::PIXEL_FORMAT_RGBA32F},
    {ImageGPU::PIXEL_FORMAT_RGB8, Road::nodes, ImageCPU::PIXEL_FORMAT_RGB8},
    {ImageGPU::PIXEL_FORMAT_RGB8, Road::swapped, ImageCPU::PIXEL_FORMAT_BGR8},
    {ImageGPU::PIXEL_FORMAT_RGB16, Road::boundIntegers, ImageCPU::PIXEL_FORMAT_RGB32F},
    {ImageGPU::PIXEL_FORMAT_RGB16F, Road::nodes, ImageCPU::PIXEL_FORMAT_RGB16F},
    {ImageGPU::PIXEL_FORMAT_RGB32F, Road::nodes, ImageCPU::PIXEL_FORMAT_RGB32F},
    {ImageGPU::PIXEL_FORMAT_LUMINANCE8, Road::nodes, ImageCPU::PIXEL_FORMAT_LUMINANCE8},
    {ImageGPU::PIXEL_FORMAT_LUMINANCE16, Road::boundIntegers, ImageCPU::PIXEL_FORMAT_LUMINANCE32F},
    {ImageGPU::PIXEL_FORMAT_LUMINANCE16F, Road::boundFloats, ImageCPU::PIXEL_FORMAT_LUMINANCE32F},
    {ImageGPU::PIXEL_FORMAT_LUMINANCE32F, Road::nodes, ImageCPU::PIXEL_FORMAT_LUMINANCE32F},
    {ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, Road::nodes, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8},
    {ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, Road::none, ImageCPU::PIXEL_FORMAT_UNDEFINED},
    {ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F, Road::boundFloats, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F},
    {ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, Road::nodes, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F}};

/// Odd sizes, elsewhere than the origin.
PositionExtentInPixelSpace const oRegion = pixels(-11, 4, 37, 23);

class Trip {
public:
    Trip(OGL::Context const& context, Row const& row) : context_(context), row_(row), oLayout_(row.eTexture) {
        aContent_ = channelBytes(oLayout_.nType_, 37u * 23u * oLayout_.nChannels_);
    }

    /// Through both converters; the padding of a row in host memory is not part of the picture.
    void throughNodes(int nPadding) {
        HostImage host(row_.eFormat, oRegion, nPadding);
        host.set(aContent_);
        ImageCPUInput source;
        CPU2GPU up;
        GPU2CPU down;
        ImageCPUOutput sink;
        source.setImageCPUWithNoOwnership(&host.image());
        Chain chain(context_, {&source, &up, &down, &sink});
        chain.run(worldOf(oRegion));
        ImageCPU const* const pResult = sink.getImageCPU();
        ASSERT_NE(nullptr, pResult);
        HostImage result(pResult->pixelFormat(), oRegion,
                         pResult->capacityExtent().width() - oRegion.extent().width());
        std::memcpy(result.image().pixels(), pResult->pixels(),
                    std::size_t(pResult->capacityExtent().width()) * 23u * result.pixelBytes());
        EXPECT_EQ(row_.eRoad == Road::swapped ? swapped() : aContent_, result.get()) << row_.eFormat;
    }

    /// Up without a converter, and down into a host image of 32-bit floats.
    void intoBoundFloats() {
        ORVO::Test::ImageGPUPtr const upImage = ORVO::Test::textureImage(oRegion, row_.eTexture, false);
        ORVO::Test::writeTexels(*upImage, aContent_);
        HostImage host(row_.eFormat, oRegion, 3);
        ImageGPUInput source;
        GPU2CPU down;
        source.setImageGPUWithNoOwnership(upImage.get());
        Chain chain(context_, {&source, &down});
        down.setBoundOutputImage(&host.image());
        chain.run(worldOf(oRegion));
        EXPECT_EQ(aContent_, channelsOf(host.get())) << row_.eTexture;
    }

private:
    Bytes swapped() const {
        Bytes aBytes = aContent_;
        for (std::size_t i = 0; i + 2 < aBytes.size(); i += oLayout_.nChannels_)
            std::swap(aBytes[i], aBytes[i + 2]);
        return aBytes;
    }

    /// 32-bit floats as channels of the texture's own type.
    Bytes channelsOf(Bytes const& aFloats) const {
        std::vector<std::uint16_t> aChannels(aFloats.size() / 4);
        for (std::size_t i = 0; i < aChannels.size(); ++i) {
            float value;
            std::memcpy(&value, &aFloats[i * 4], 4);
            if (row_.eRoad == Road::boundIntegers) {
                aChannels[i] = static_cast<std::uint16_t>(std::lround(value * 65535.0f));
            } else {
                half const narrow(value);
                EXPECT_EQ(value, float(narrow));
                aChannels[i] = narrow.bits();
            }
        }
        return ORVO::Test::bytesOf(aChannels);
    }

    OGL::Context const& context_;
    Row const& row_;
    TexelLayout oLayout_;
    Bytes aContent_;
};

TEST_F(UpAndDownTest, everyFormatGoesUpAndDownAgain) {
    int nFormats = 0;
    for (Row const& row : aRows) {
        SCOPED_TRACE(testing::Message() << row.eTexture);
        if (row.eRoad == Road::none) {
            ORVO_EXPECT_PARAMETER(ORVO::Test::textureImage(oRegion, row.eTexture), "invalid pixel format");
            continue;
        }
        ++nFormats;
        Trip trip(context(), row);
        if (row.eRoad == Road::boundFloats || row.eRoad == Road::boundIntegers) {
            trip.intoBoundFloats();
        } else {
            trip.throughNodes(0);
            trip.throughNodes(5);
        }
    }
    EXPECT_EQ(18, nFormats);
}

TEST_F(UpAndDownTest, sixteenBitIntegersTravelAsTheBitsOfHalves) {
    // All of the scale, 0 to 32768: among its bits are those of infinities and of numbers that are none.
    HostImage host(ImageCPU::PIXEL_FORMAT_RGBA16, pixels(0, 0, 129, 64));
    std::vector<std::uint16_t> aValues(129 * 64 * 4);
    for (std::size_t i = 0; i < aValues.size(); ++i)
        aValues[i] = static_cast<std::uint16_t>(i % 32769);
    host.set(ORVO::Test::bytesOf(aValues));
    ImageCPUInput source;
    CPU2GPU up;
    ImageGPUOutput sink;
    source.setImageCPUWithNoOwnership(&host.image());
    Chain chain(context(), {&source, &up, &sink});
    chain.run(worldOf(pixels(0, 0, 129, 64)));
    ASSERT_NE(nullptr, sink.getImageGPU());
    EXPECT_EQ(ImageGPU::PIXEL_FORMAT_RGBA16F, sink.getImageGPU()->pixelFormat());
    Bytes const aTexels = ORVO::Test::readTexels(*sink.getImageGPU());
    std::size_t nWrong = 0;
    for (std::size_t i = 0; i < aValues.size(); ++i) {
        std::uint16_t bits;
        std::memcpy(&bits, &aTexels[i * 2], 2);
        bool const bNumber = (aValues[i] & 0x7c00) != 0x7c00 || (aValues[i] & 0x03ff) == 0;
        bool const bStillNone = (bits & 0x7c00) == 0x7c00 && (bits & 0x03ff) != 0;
        nWrong += bNumber ? bits != aValues[i] : !bStillNone;
    }
    EXPECT_EQ(0u, nWrong);
}

} // namespace

} // namespace ORVO
