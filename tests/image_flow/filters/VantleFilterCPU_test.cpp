#include "orvo/image_flow/filters/VantleFilterCPU.h"

#include "orvo/colour_engine/EmbeddedEngine.h"
#include "orvo/colour_engine/VantlePackingSpec.h"
#include "orvo/colour_engine/VantleProcedures.h"
#include "orvo/image_flow/colour/CVantle.h"
#include "tests/image_flow/support/FilterRoad.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <mutex>

namespace {

using namespace ORVO;
using namespace ORVO::Test;

/// One call of ApplyGeneral with its records as bytes.
struct ApplyCall {
    VantleTransform* transform;
    std::array<unsigned char, sizeof(_t_Vantle_PackingSpec)> source;
    std::array<unsigned char, sizeof(_t_Vantle_PackingSpec)> destination;
    std::uint32_t rows;
    std::uint32_t columns;
    _t_Vantle_Options const* options;
};

std::mutex oCallsLock;
std::vector<ApplyCall> aCalls;

/// Writes no pixel, and fails: the result is nobody's concern.
VantleResult recordApply(VantleTransform* pTransform, _t_Vantle_PackingSpec const* pSource,
                         _t_Vantle_PackingSpec const* pDestination, std::uint32_t rows, std::uint32_t columns,
                         _t_Vantle_Options const* pOptions) {
    std::lock_guard<std::mutex> const lock(oCallsLock);
    ApplyCall call{pTransform, {}, {}, rows, columns, pOptions};
    std::memcpy(call.source.data(), pSource, sizeof(*pSource));
    std::memcpy(call.destination.data(), pDestination, sizeof(*pDestination));
    aCalls.push_back(call);
    return 77;
}

void* recordingAddress(char const* pInterface, char const* pSelector, char const* pProcName) {
    if (std::strcmp(pProcName, "Vantle_ApplyGeneralProc2") == 0) {
        return reinterpret_cast<void*>(&recordApply);
    }
    return ColourEngine::embeddedEngine()(pInterface, pSelector, pProcName);
}

struct EngineInstalled {
    explicit EngineInstalled(QuorGetAddressProc pProc) {
        aCalls.clear();
        Core::Library::setQuorGetAddressProc(pProc);
    }
};

/// The layers up to image flow on an engine of the test's choice.
struct EngineLayers {
    explicit EngineLayers(QuorGetAddressProc pProc) : oEngine_(pProc) {}

    Core::AutoInitializer oCore_;
    EngineInstalled oEngine_;
    OGL::AutoInitializer oOGL_;
    ImageRuntime::AutoInitializer oImageRuntime_{static_cast<OGL::Context const*>(nullptr),
                                                 VideoMemory::Configuration()};
    DataFlow::AutoInitializer oDataFlow_;
    ImageFlow::AutoInitializer oImageFlow_{false};
};

/// The filter on images of the test's own, without a graph.
struct OpenVantleFilter : VantleFilterCPU {
    using VantleFilterCPU::oOutputRegionInPixels_;
    using VantleFilterCPU::spOutputImage_;
    using VantleFilterCPU::vantleOptions_;
    using VantleFilterCPU::vantleTransform_;

    void setImages(ImageCPU& input, ImageCPU& output) {
        dynamic_cast<DataFlow::ConstInput<ImageCPU>&>(*imageInput(0)).setData(ORVO_NEW ImageCPU(input));
        spOutputImage_.setDataWithNoOwnership(&output);
        oOutputRegionInPixels_ = output.positionExtent();
    }
    /// The filter's copy of the input.
    unsigned char const* inputPixels() {
        return dynamic_cast<DataFlow::ConstInput<ImageCPU>&>(*imageInput(0))->pixels();
    }
};

ImageCPU imageOf(ImageCPU::tePixelFormat format, PositionExtentInPixelSpace const& rectangle,
                 int capacityWidth = 0) {
    ExtentInPixelSpace const capacity(capacityWidth > 0 ? capacityWidth : rectangle.extent().width(),
                                      rectangle.extent().height());
    ImageCPU image(format, rectangle, PixelExtentInWorldSpace(1.0F, 1.0F), capacity);
    std::size_t const nBytes = static_cast<std::size_t>(capacity.width()) *
                               static_cast<std::size_t>(capacity.height()) * pixelSizeBytes(format);
    for (std::size_t i = 0; i < nBytes; ++i) {
        image.pixels()[i] = static_cast<unsigned char>(i * 7 + 3);
    }
    return image;
}

std::vector<unsigned char> bytesOf(ImageCPU const& image) {
    ExtentInPixelSpace const capacity = image.capacityExtent();
    return {image.pixels(), image.pixels() + static_cast<std::size_t>(capacity.width()) *
                                                 static_cast<std::size_t>(capacity.height()) *
                                                 pixelSizeBytes(image.pixelFormat())};
}

template <typename Field>
Field fieldAt(std::array<unsigned char, sizeof(_t_Vantle_PackingSpec)> const& record, std::size_t offset) {
    Field field;
    std::memcpy(&field, record.data() + offset, sizeof(field));
    return field;
}

/// Every field of a record by its place, and zeros in between.
void expectRecord(std::array<unsigned char, sizeof(_t_Vantle_PackingSpec)> const& record, bool gray,
                  unsigned bytes, unsigned char const* pFirst, int rowBytes, int columnBytes) {
    EXPECT_EQ(0U, fieldAt<std::uint32_t>(record, 0));
    EXPECT_EQ(gray ? 0x47524159U : 0x52474220U, fieldAt<std::uint32_t>(record, 4));
    EXPECT_EQ(gray ? 1U : 3U, fieldAt<std::uint32_t>(record, 8));
    EXPECT_EQ(bytes, fieldAt<std::uint32_t>(record, 12));
    EXPECT_EQ(0U, fieldAt<std::uint64_t>(record, 16));
    EXPECT_EQ(0U, fieldAt<std::uint64_t>(record, 24));
    std::size_t const nPlanes = gray ? 1 : 3;
    for (std::size_t i = 0; i < nPlanes; ++i) {
        EXPECT_EQ(pFirst + i * bytes, fieldAt<unsigned char const*>(record, 32 + 24 * i));
        EXPECT_EQ(rowBytes, fieldAt<std::int32_t>(record, 40 + 24 * i));
        EXPECT_EQ(columnBytes, fieldAt<std::int32_t>(record, 44 + 24 * i));
        EXPECT_EQ(0, fieldAt<std::int32_t>(record, 48 + 24 * i));
    }
    for (std::size_t offset = 32 + 24 * nPlanes; offset < record.size(); ++offset) {
        EXPECT_EQ(0, record[offset]) << offset;
    }
}

struct FormatRow {
    ImageCPU::tePixelFormat format;
    bool gray;
    unsigned bytes;
    int pixel;
};

constexpr FormatRow kFormats[] = {
    {ImageCPU::PIXEL_FORMAT_RGB8, false, 1, 3},       {ImageCPU::PIXEL_FORMAT_RGBA8, false, 1, 4},
    {ImageCPU::PIXEL_FORMAT_RGB16, false, 2, 6},      {ImageCPU::PIXEL_FORMAT_RGBA16, false, 2, 8},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE8, true, 1, 1},  {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, true, 1, 2},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE16, true, 2, 2}, {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, true, 2, 4},
};

TEST(VantleFilterCPU, HasNameConnectorsTargetsAndParameters) {
    EngineLayers const layers(nullptr);
    VantleFilterCPU node;
    EXPECT_EQ("ORVO::VantleFilterCPU", node.name());
    EXPECT_EQ(ORVO_TARGET_CPU, node.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_CPU, node.getOutputTargetPlatform());
    ASSERT_EQ(1U, node.numberOfImageInputs());
    EXPECT_EQ("InputImage", node.imageInput(0)->name());
    EXPECT_EQ("OutputImage", node.imageOutput()->name());
    ASSERT_EQ(4U, node.numberOfParameters());
    EXPECT_EQ("Transform", node.parameter(2)->name());
    EXPECT_EQ("Vantle Options", node.parameter(3)->name());
    EXPECT_EQ(node.transform().get(), node.parameter("Transform"));
    EXPECT_EQ(node.options().get(), node.parameter("Vantle Options"));
    EXPECT_EQ(nullptr, node.transform()->value());
    EXPECT_EQ(nullptr, node.options()->value());
    EXPECT_EQ(world(1, 2, 3, 4), node.needed(world(1, 2, 3, 4), "InputImage", {}));
}

TEST(VantleFilterCPU, DescribesEveryFormatToTheEngine) {
    EngineLayers const layers(&recordingAddress);
    int transform = 0;
    int options = 0;
    for (FormatRow const& from : kFormats) {
        for (FormatRow const& to : kFormats) {
            SCOPED_TRACE(testing::Message() << from.format << " to " << to.format);
            ImageCPU input = imageOf(from.format, pixels(0, 0, 5, 4));
            ImageCPU output = imageOf(to.format, pixels(0, 0, 5, 4));
            OpenVantleFilter node;
            node.transform()->setValue(&transform);
            node.options()->setValue(&options);
            node.setImages(input, output);
            aCalls.clear();
            node.processSlice(1, 3);
            ASSERT_EQ(1U, aCalls.size());
            EXPECT_EQ(static_cast<void*>(&transform), aCalls[0].transform);
            EXPECT_EQ(static_cast<void const*>(&options), aCalls[0].options);
            EXPECT_EQ(2U, aCalls[0].rows);
            EXPECT_EQ(5U, aCalls[0].columns);
            expectRecord(aCalls[0].source, from.gray, from.bytes, node.inputPixels() + 5 * from.pixel,
                         5 * from.pixel, from.pixel);
            expectRecord(aCalls[0].destination, to.gray, to.bytes, output.pixels() + 5 * to.pixel,
                         5 * to.pixel, to.pixel);
        }
    }
}

TEST(VantleFilterCPU, PixelsAreMatchedByPositionAndPitch) {
    EngineLayers const layers(&recordingAddress);
    ImageCPU input = imageOf(ImageCPU::PIXEL_FORMAT_RGB8, pixels(-3, 10, 6, 8), 9);
    ImageCPU output = imageOf(ImageCPU::PIXEL_FORMAT_RGB8, pixels(-5, 8, 12, 20), 13);
    OpenVantleFilter node;
    node.setImages(input, output);
    node.oOutputRegionInPixels_ = pixels(-2, 11, 3, 5);
    node.processSlice(2, 4);
    ASSERT_EQ(1U, aCalls.size());
    EXPECT_EQ(2U, aCalls[0].rows);
    EXPECT_EQ(3U, aCalls[0].columns);
    // Row 13, column -2.
    expectRecord(aCalls[0].source, false, 1, node.inputPixels() + (3 * 9 + 1) * 3, 27, 3);
    expectRecord(aCalls[0].destination, false, 1, output.pixels() + (5 * 13 + 3) * 3, 39, 3);
    EXPECT_EQ(bytesOf(imageOf(ImageCPU::PIXEL_FORMAT_RGB8, pixels(-5, 8, 12, 20), 13)), bytesOf(output));
}

TEST(VantleFilterCPU, PixelsOutsideTheInputBecomeTransparentBlack) {
    EngineLayers const layers(&recordingAddress);
    ImageCPU input = imageOf(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(2, 1, 3, 2));
    ImageCPU output = imageOf(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 6, 5), 7);
    OpenVantleFilter node;
    node.setImages(input, output);
    node.oOutputRegionInPixels_ = pixels(1, 0, 5, 4);
    auto expected = bytesOf(output);
    node.processSlice(0, 4);
    for (std::size_t y = 0; y < 4; ++y) {
        for (std::size_t i = 4; i < 24; ++i) {
            // Alpha comes from the input where there is one; the engine has written no colour.
            bool const bInside = y >= 1 && y < 3 && i >= 8 && i < 20 && i % 4 == 3;
            expected[28 * y + i] = bInside ? node.inputPixels()[12 * (y - 1) + i - 8] : 0;
        }
    }
    EXPECT_EQ(expected, bytesOf(output));
    ASSERT_EQ(1U, aCalls.size());
    EXPECT_EQ(2U, aCalls[0].rows);
    EXPECT_EQ(3U, aCalls[0].columns);
    expectRecord(aCalls[0].source, false, 1, node.inputPixels(), 12, 4);
    expectRecord(aCalls[0].destination, false, 1, output.pixels() + 28 + 8, 28, 4);

    // Nothing in common: no call, and the whole rectangle is cleared; beyond it the rows stay as they are.
    ImageCPU far = imageOf(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(100, 100, 3, 2));
    node.setImages(far, output);
    node.processSlice(0, 5);
    EXPECT_EQ(1U, aCalls.size());
    for (std::size_t y = 0; y < 5; ++y) {
        std::fill_n(expected.begin() + static_cast<std::ptrdiff_t>(28 * y), 24,
                    static_cast<unsigned char>(0));
    }
    EXPECT_EQ(expected, bytesOf(output));
}

/// What the copy of alpha leaves in the output: byte i of pixel p is that of the input's at `from`.
struct AlphaRow {
    char const* name;
    ImageCPU::tePixelFormat input;
    ImageCPU::tePixelFormat output;
    int from; ///< offset in a pixel of the input; -1: nothing is copied
    int to;
    int bytes;
};

constexpr AlphaRow kAlpha[] = {
    {"RGBA8 to RGBA8", ImageCPU::PIXEL_FORMAT_RGBA8, ImageCPU::PIXEL_FORMAT_RGBA8, 3, 3, 1},
    {"RGBA16 to RGBA16", ImageCPU::PIXEL_FORMAT_RGBA16, ImageCPU::PIXEL_FORMAT_RGBA16, 6, 6, 2},
    {"LA8 to LA8", ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, 1, 1, 1},
    {"LA16 to LA16", ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, 2, 2,
     2},
    {"LA8 to RGBA8", ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, ImageCPU::PIXEL_FORMAT_RGBA8, 1, 3, 1},
    // An output without alpha loses its last colour sample.
    {"RGBA16 to RGB16", ImageCPU::PIXEL_FORMAT_RGBA16, ImageCPU::PIXEL_FORMAT_RGB16, 6, 4, 2},
    {"RGBA8 to L8", ImageCPU::PIXEL_FORMAT_RGBA8, ImageCPU::PIXEL_FORMAT_LUMINANCE8, 3, 0, 1},
    // Other bytes: no copy.
    {"RGBA8 to RGBA16", ImageCPU::PIXEL_FORMAT_RGBA8, ImageCPU::PIXEL_FORMAT_RGBA16, -1, 0, 0},
    {"RGBA16 to RGBA8", ImageCPU::PIXEL_FORMAT_RGBA16, ImageCPU::PIXEL_FORMAT_RGBA8, -1, 0, 0},
    // No alpha to be copied.
    {"RGB8 to RGBA8", ImageCPU::PIXEL_FORMAT_RGB8, ImageCPU::PIXEL_FORMAT_RGBA8, -1, 0, 0},
    {"L16 to LA16", ImageCPU::PIXEL_FORMAT_LUMINANCE16, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, -1, 0, 0},
};

/// The engine of these tests writes nothing, so that all that changes is the copy of alpha; without an engine
/// the same happens.
TEST(VantleFilterCPU, CopiesAlphaWithAndWithoutAnEngine) {
    for (bool bEngine : {true, false}) {
        EngineLayers const layers(bEngine ? &recordingAddress : nullptr);
        EXPECT_EQ(bEngine, CVantle::isAvailable());
        for (AlphaRow const& row : kAlpha) {
            SCOPED_TRACE(row.name);
            ImageCPU input = imageOf(row.input, pixels(0, 0, 7, 5));
            ImageCPU output = imageOf(row.output, pixels(0, 0, 7, 5));
            auto expected = bytesOf(output);
            std::fill(expected.begin(), expected.end(), static_cast<unsigned char>(0xEE));
            std::memcpy(output.pixels(), expected.data(), expected.size());
            auto const nFrom = static_cast<int>(pixelSizeBytes(row.input));
            auto const nTo = static_cast<int>(pixelSizeBytes(row.output));
            for (int pixel = 7; row.from >= 0 && pixel < 28; ++pixel) {
                std::memcpy(expected.data() + pixel * nTo + row.to, input.pixels() + pixel * nFrom + row.from,
                            static_cast<std::size_t>(row.bytes));
            }
            OpenVantleFilter node;
            node.setImages(input, output);
            node.processSlice(1, 4);
            EXPECT_EQ(expected, bytesOf(output));
        }
        EXPECT_EQ(bEngine ? std::size(kAlpha) : 0U, aCalls.size());
    }
}

TEST(VantleFilterCPU, OtherFormatsAreRefusedBeforeAnythingIsWritten) {
    EngineLayers const layers(&recordingAddress);
    ImageCPU good = imageOf(ImageCPU::PIXEL_FORMAT_RGB8, pixels(0, 0, 4, 4));
    auto const before = bytesOf(good);
    for (auto format : {ImageCPU::PIXEL_FORMAT_BGR8, ImageCPU::PIXEL_FORMAT_BGRA8,
                        ImageCPU::PIXEL_FORMAT_RGB32F, ImageCPU::PIXEL_FORMAT_RGBA32F,
                        ImageCPU::PIXEL_FORMAT_LUMINANCE32F, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F,
                        ImageCPU::PIXEL_FORMAT_RGB16F, ImageCPU::PIXEL_FORMAT_RGBA16F}) {
        SCOPED_TRACE(testing::Message() << format);
        ImageCPU wrong = imageOf(format, pixels(1, 1, 2, 2));
        auto const wrongBefore = bytesOf(wrong);
        OpenVantleFilter node;
        node.setImages(wrong, good);
        ORVO_EXPECT_INTERNAL(node.processSlice(0, 4), "Invalid input image type");
        node.setImages(good, wrong);
        ORVO_EXPECT_INTERNAL(node.processSlice(0, 2), "Invalid input image type");
        EXPECT_EQ(wrongBefore, bytesOf(wrong));
    }
    // Formats that have no storage.
    ImageCPU undefined;
    OpenVantleFilter node;
    node.setImages(good, good);
    node.spOutputImage_.setDataWithNoOwnership(&undefined);
    ORVO_EXPECT_INTERNAL(node.processSlice(0, 1), "Invalid input image type");
    EXPECT_EQ(before, bytesOf(good));
    EXPECT_TRUE(aCalls.empty());
}

TEST(VantleFilterCPU, MissingImagesAndParametersFail) {
    EngineLayers const layers(&recordingAddress);
    ImageCPU image = imageOf(ImageCPU::PIXEL_FORMAT_RGB8, pixels(0, 0, 4, 4));
    OpenVantleFilter node;
    node.oOutputRegionInPixels_ = pixels(0, 0, 4, 4);
    ORVO_EXPECT_INTERNAL(node.processSlice(0, 1), "Enforce spData_.get() != NULL");
    node.setImages(image, image);
    node.spOutputImage_.reset();
    ORVO_EXPECT_INTERNAL(node.processSlice(0, 1), "Enforce spData_.get() != NULL");
    node.setImages(image, image);
    // The node's list of parameters goes on pointing at them.
    auto const spTransform = node.transform();
    auto const spOptions = node.options();
    node.vantleTransform_.reset();
    ORVO_EXPECT_INTERNAL(node.processSlice(0, 1), "Enforce vantleTransform_.get() != NULL");
    ORVO_EXPECT_INTERNAL(node.transform(), "Enforce vantleTransform_.get() != NULL");
    node.vantleTransform_ = spTransform;
    node.vantleOptions_.reset();
    ORVO_EXPECT_INTERNAL(node.processSlice(0, 1), "Enforce vantleOptions_.get() != NULL");
    ORVO_EXPECT_INTERNAL(node.options(), "Enforce vantleOptions_.get() != NULL");
    EXPECT_TRUE(aCalls.empty());
}

TEST(VantleFilterCPU, SlicesOfAFrameShareTheTransformAndCoverEveryRowOnce) {
    EngineLayers const layers(&recordingAddress);
    int transform = 0;
    ImageCPU input = imageOf(ImageCPU::PIXEL_FORMAT_RGB8, pixels(0, 0, 8, 200));
    ImageCPU output = imageOf(ImageCPU::PIXEL_FORMAT_RGB8, pixels(0, 0, 8, 200));
    FilterRoad<VantleFilterCPU> road;
    road.filter().transform()->setValue(&transform);
    road.runInto(input, output, world(0, 3, 8, 190));
    std::vector<int> aCovered(200);
    for (ApplyCall const& call : aCalls) {
        EXPECT_EQ(static_cast<void*>(&transform), call.transform);
        EXPECT_EQ(8U, call.columns);
        auto const first = fieldAt<unsigned char const*>(call.destination, 32) - output.pixels();
        EXPECT_EQ(first, fieldAt<unsigned char const*>(call.source, 32) - input.pixels());
        EXPECT_EQ(0, first % 24);
        for (std::uint32_t row = 0; row < call.rows; ++row) {
            ++aCovered.at(static_cast<std::size_t>(first / 24) + row);
        }
    }
    for (std::size_t row = 0; row < 200; ++row) {
        EXPECT_EQ(row >= 3 && row < 193 ? 1 : 0, aCovered[row]) << row;
    }
}

} // namespace
