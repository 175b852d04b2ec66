#include "orvo/image_flow/filters/VantleFilterGPU.h"

#include "tests/image_flow/support/ShaderRoad.h"

#include "orvo/image_flow/colour/CQuorError.h"
#include "orvo/image_flow/colour/QuorClient.h"
#include "orvo/image_flow/filters/VantleDataAdapter.h"
#include "orvo/image_flow/filters/VantleShaderAdapter.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/ExtensionManager.h"
#include "tests/support/RecordingEngine.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using Record = _t_Vantle_ShaderParameterData;

class OpenVantleFilter : public VantleFilterGPU {
public:
    using BasicGLShaderFilter::bCompiled_;
    using BasicGLShaderFilter::sFragmentSource_;
    using BasicGLShaderFilter::texUnitCount_;
    using VantleFilterGPU::initVantle;
    using VantleFilterGPU::pLastTransform_;
    using VantleFilterGPU::spDataAdapter_;
    using VantleFilterGPU::spShaderAdapter_;
    using VantleFilterGPU::vantleOptions_;
    using VantleFilterGPU::vantleTransform_;

    void preProcess() override {
        VantleFilterGPU::preProcess();
        if (onPreProcessed_)
            onPreProcessed_();
    }

    std::function<void()> onPreProcessed_;
};

ShaderTable makeTable(std::string const& sName, std::uint32_t kind, GLenum target, std::uint32_t height,
                      std::uint32_t depth, std::vector<float> aData) {
    ShaderTable result;
    result.sName_ = sName;
    Record& record = result.record_;
    record.kind = kind;
    record.target = target;
    record.internalFormat = GL_LUMINANCE32F_ARB;
    record.width = static_cast<std::uint32_t>(aData.size()) / height / depth;
    record.height = height;
    record.depth = depth;
    record.format = GL_LUMINANCE;
    record.type = GL_FLOAT;
    record.minFilter = GL_NEAREST;
    record.magFilter = GL_NEAREST;
    record.wrapR = GL_CLAMP_TO_EDGE;
    record.wrapS = GL_CLAMP_TO_EDGE;
    record.wrapT = GL_CLAMP_TO_EDGE;
    result.aData_ = std::move(aData);
    return result;
}

ShaderTable makeMatrix(std::string const& sName, std::uint32_t kind, std::vector<float> aData) {
    ShaderTable result;
    result.sName_ = sName;
    result.record_.kind = kind;
    result.aData_ = std::move(aData);
    return result;
}

/// One table of each kind and one matrix of each: the result is dyadic.
ShaderText everyKind() {
    ShaderText text;
    text.sEntryPoint_ = "mixAll";
    text.sCode_ =
        "uniform sampler1D one;\n"
        "uniform sampler2D two;\n"
        "uniform sampler3D three;\n"
        "uniform mat3 small;\n"
        "uniform mat4 large;\n"
        "void mixAll(inout vec4 c) {\n"
        "    vec3 v = vec3(texture1D(one, c.r).r, texture2D(two, c.rg).r, texture3D(three, c.rgb).r);\n"
        "    c = large * vec4(small * v, c.a);\n"
        "}\n";
    text.aTables_ = {
        makeTable("one", Record::KIND_TEXTURE_1D, GL_TEXTURE_1D, 1, 1, {0.125F, 0.25F}),
        makeTable("two", Record::KIND_TEXTURE_2D, GL_TEXTURE_2D, 2, 1, {0.5F, 0.75F, 0.25F, 1.0F}),
        makeTable("three", Record::KIND_TEXTURE_3D, GL_TEXTURE_3D, 1, 2, {0.5F, 0.625F, 0.375F, 0.0F}),
        // By columns: (x, y, z) becomes (y, z, x).
        makeMatrix("small", Record::KIND_MATRIX_3X3, {0, 0, 1, 1, 0, 0, 0, 1, 0}),
        // By columns, too: (x, y, z, a) becomes (y / 2, z / 2, x / 2, a).
        makeMatrix("large", Record::KIND_MATRIX_4X4, {0, 0, .5F, 0, .5F, 0, 0, 0, 0, .5F, 0, 0, 0, 0, 0, 1}),
    };
    return text;
}

Pixel mixedAll(Pixel const& c) {
    auto const upper = [&](std::size_t i) { return c[i] >= 0.5; };
    double const one = upper(0) ? 0.25 : 0.125;
    double const two = upper(1) ? (upper(0) ? 1.0 : 0.25) : (upper(0) ? 0.75 : 0.5);
    double const three = upper(2) ? (upper(0) ? 0.0 : 0.375) : (upper(0) ? 0.625 : 0.5);
    return {three / 2, one / 2, two / 2, c[3]};
}

class VantleFilterGPUTest : public ShaderFlowTest {
protected:
    VantleFilterGPUTest() {
        RecordingEngine::install();
        RecordingEngine::shader() = everyKind();
    }
    void TearDown() override {
        OGL::ExtensionManager::Instance()->clearOverrides();
        EXPECT_EQ(0, RecordingEngine::transforms());
        EXPECT_EQ(0, RecordingEngine::shaders());
        EXPECT_EQ(0, RecordingEngine::strings());
        ShaderFlowTest::TearDown();
    }

    static void setTransform(OpenVantleFilter& filter, VantleTransform* pTransform) {
        filter.transform()->setValue(pTransform);
    }
    static Texels picture(int width = 9, int height = 5) {
        return Texels(pixels(0, 0, width, height)).fill([&](int x, int y) {
            return Pixel{(x % 4) / 4.0 + 0.125, (y % 4) / 4.0 + 0.125, ((x + y) % 8) / 8.0 + 0.0625, 0.75};
        });
    }
    static Texels expected(Texels const& input) {
        return Texels(input.region()).fill([&](int x, int y) { return mixedAll(input.at(x, y)); });
    }
    /// Runs a frame over all of the picture and compares.
    static void expectMixed(ShaderRoad& road, Texels const& input) {
        Texels const actual(
            *road.run(world(input.left(), input.top(), float(input.width()), float(input.height()))));
        EXPECT_EQ("", differences(actual, expected(input), Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8)));
    }
};

TEST_F(VantleFilterGPUTest, HasItsInputAndParameters) {
    OpenVantleFilter filter;
    EXPECT_EQ("VantleFilterGPU", filter.name());
    ASSERT_EQ(1U, filter.numberOfImageInputs());
    EXPECT_EQ("InputImage", filter.imageInput(0)->name());
    EXPECT_EQ(filter.parameter("Transform"), filter.transform().get());
    EXPECT_EQ(filter.parameter("Vantle Options"), filter.options().get());
    EXPECT_EQ(nullptr, filter.transform()->value());
    EXPECT_EQ(nullptr, filter.options()->value());
    EXPECT_EQ(filter.parameter("Grey Result"), filter.greyResult().get());
    EXPECT_FALSE(filter.greyResult()->value());
    EXPECT_TRUE(filter.willRunInHardware());
    EXPECT_EQ("", filter.sFragmentSource_);
    filter.vantleTransform_.reset();
    filter.vantleOptions_.reset();
    ORVO_EXPECT_INTERNAL(filter.transform(), "Enforce vantleTransform_.get() != NULL");
    ORVO_EXPECT_INTERNAL(filter.options(), "Enforce vantleOptions_.get() != NULL");
}

TEST_F(VantleFilterGPUTest, AppliesTablesAndMatrices) {
    Texels const input = picture();
    ImageGPUPtr const upInput = textureOf(input, ImageGPU::PIXEL_FORMAT_RGBA32F, false);
    OpenVantleFilter filter;
    setTransform(filter, RecordingEngine::ownTransform());
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upInput);
    filter.onPreProcessed_ = [&] {
        EXPECT_EQ(2U, filter.spDataAdapter_->textures1D().at("one").second);
        EXPECT_EQ(4U, filter.spDataAdapter_->textures3D().at("three").second);
    };
    expectMixed(road, input);
    EXPECT_TRUE(filter.willRunInHardware());
    EXPECT_EQ(RecordingEngine::ownTransform(), filter.pLastTransform_);
    EXPECT_EQ(0U, filter.sFragmentSource_.find("uniform sampler1D one;\n"));
    // The comparison would see a table in another's place.
    std::swap(RecordingEngine::shader().aTables_[0].aData_[0],
              RecordingEngine::shader().aTables_[1].aData_[0]);
    OpenVantleFilter other;
    setTransform(other, RecordingEngine::ownTransform());
    ShaderRoad otherRoad(frameContext(), other);
    otherRoad.setInput(0, *upInput);
    EXPECT_NE("", differences(Texels(*otherRoad.run(world(0, 0, 9, 5))), expected(input),
                              Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8)));
}

TEST_F(VantleFilterGPUTest, LeavesNoUnitBoundOrEnabled) {
    ImageGPUPtr const upInput = textureOf(picture(), ImageGPU::PIXEL_FORMAT_RGBA8);
    for (VantleTransform* const pTransform : {RecordingEngine::ownTransform(), (VantleTransform*)nullptr}) {
        OpenVantleFilter filter;
        setTransform(filter, pTransform);
        ShaderRoad road(frameContext(), filter);
        road.setInput(0, *upInput);
        road.run(world(0, 0, 9, 5));
        EXPECT_EQ(1, filter.texUnitCount_);
        EXPECT_EQ(-1, upInput->boundTexUnit());
        frameContext().makeCurrent();
        for (GLenum unit = 0; unit < 6; ++unit) {
            glActiveTexture(GL_TEXTURE0 + unit);
            for (auto const& [target, binding] : {std::pair(GL_TEXTURE_1D, GL_TEXTURE_BINDING_1D),
                                                  {GL_TEXTURE_2D, GL_TEXTURE_BINDING_2D},
                                                  {GL_TEXTURE_3D, GL_TEXTURE_BINDING_3D}}) {
                GLint nBound = -1;
                glGetIntegerv(GLenum(binding), &nBound);
                EXPECT_EQ(0, nBound) << unit;
                // Unit 0 stays as the frame of shader filters leaves it.
                EXPECT_TRUE(unit == 0 || !glIsEnabled(GLenum(target))) << unit;
            }
        }
        glActiveTexture(GL_TEXTURE0);
        GLint nDepth = 0;
        glGetIntegerv(GL_TEXTURE_STACK_DEPTH, &nDepth);
        EXPECT_EQ(1, nDepth);
        host().makeCurrent();
    }
}

TEST_F(VantleFilterGPUTest, DrawsARedDiagonalWithoutATransform) {
    struct Row {
        PositionExtentInPixelSpace input_;
        PositionExtentInPixelSpace output_;
        bool bExact_;
    };
    Row const aRows[] = {{pixels(0, 0, 50, 50), pixels(0, 0, 50, 50), true},
                         {pixels(-7, 3, 50, 25), pixels(-2, 8, 30, 11), true},
                         // In a texture of 64 by 64, whose coordinates the line is drawn in.
                         {pixels(0, 0, 50, 40), pixels(0, 0, 50, 40), false}};
    for (Row const& row : aRows) {
        Texels const input = Texels(row.input_).fill([](int x, int y) {
            return Pixel{0.25, (x & 15) / 16.0, (y & 15) / 16.0, 0.5};
        });
        ImageGPUPtr const upInput = textureOf(input, ImageGPU::PIXEL_FORMAT_RGBA8, row.bExact_);
        OpenVantleFilter filter;
        ShaderRoad road(frameContext(), filter);
        road.setInput(0, *upInput);
        Texels const actual(*road.run(pixelToWorldSpace(row.output_, PixelExtentInWorldSpace())));
        auto const width = double(upInput->capacityExtent().width());
        auto const height = double(upInput->capacityExtent().height());
        Texels const expected = Texels(row.output_).fill([&](int x, int y) {
            double const s = (x - input.left() + 0.5) / width;
            double const t = (y - input.top() + 0.5) / height;
            double const distance = std::abs(s - t);
            if (std::abs(distance - 0.05) < 1e-4) // at the edge of the line rounding decides
                return actual.at(x, y);
            return distance < 0.05 ? Pixel{1, 0, 0, 1} : input.at(x, y);
        });
        EXPECT_EQ("", differences(actual, expected, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8)));
        EXPECT_TRUE(filter.willRunInHardware());
    }
    EXPECT_EQ(0U, RecordingEngine::shaderCalls());
}

TEST_F(VantleFilterGPUTest, AsksAndMakesNothingWhileTheTransformStays) {
    Texels const input = picture();
    ImageGPUPtr const upInput = textureOf(input, ImageGPU::PIXEL_FORMAT_RGBA8);
    OpenVantleFilter filter;
    setTransform(filter, RecordingEngine::ownTransform());
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upInput);
    road.run(world(0, 0, 9, 5));
    road.run(world(0, 0, 9, 5));
    int nOptions = 0;
    auto const nShaderCalls = RecordingEngine::shaderCalls();
    auto const nLinks = GLHooks::calls("glLinkProgram");
    auto const nTextures = GLHooks::calls("glGenTextures");
    auto const nUploads = GLHooks::calls("glTexSubImage1D") + GLHooks::calls("glTexSubImage3D");
    EXPECT_GT(nUploads, 0U);
    ObjectCounts const objects = GLHooks::objects();
    for (int i = 0; i < 20; ++i) {
        // Options are there for hosts alone.
        filter.options()->setValue(i % 2 == 0 ? &nOptions : nullptr);
        road.run(world(0, 0, 9, 5));
    }
    EXPECT_EQ(nShaderCalls, RecordingEngine::shaderCalls());
    EXPECT_EQ(nLinks, GLHooks::calls("glLinkProgram"));
    EXPECT_EQ(nTextures, GLHooks::calls("glGenTextures"));
    EXPECT_EQ(nUploads, GLHooks::calls("glTexSubImage1D") + GLHooks::calls("glTexSubImage3D"));
    EXPECT_EQ(objects, GLHooks::objects());
    EXPECT_EQ(1, RecordingEngine::transforms());
    EXPECT_EQ(1, RecordingEngine::shaders());

    // To none and back: one description more, the same textures again.
    setTransform(filter, nullptr);
    road.run(world(0, 0, 9, 5));
    EXPECT_EQ(0, RecordingEngine::transforms());
    setTransform(filter, RecordingEngine::ownTransform());
    expectMixed(road, input);
    EXPECT_EQ(nLinks + 2, GLHooks::calls("glLinkProgram"));
    EXPECT_EQ(nTextures, GLHooks::calls("glGenTextures"));
    EXPECT_EQ(2 * nShaderCalls, RecordingEngine::shaderCalls());
}

TEST_F(VantleFilterGPUTest, TriesAgainAfterWhatTheEngineRefused) {
    Texels const input = picture();
    ImageGPUPtr const upInput = textureOf(input, ImageGPU::PIXEL_FORMAT_RGBA8);
    for (char const* pSelector : {"Strings", "StringASCII", "NumParameters", "Parameter", "CopyData"}) {
        OpenVantleFilter filter;
        setTransform(filter, RecordingEngine::ownTransform());
        ShaderRoad road(frameContext(), filter);
        road.setInput(0, *upInput);
        RecordingEngine::fail(pSelector);
        for (int i = 0; i < 2; ++i)
            EXPECT_THROW(road.run(world(0, 0, 9, 5)), Quor_T_MT::CQuorError) << pSelector;
        RecordingEngine::failNothing();
        expectMixed(road, input);
        EXPECT_EQ(0, RecordingEngine::strings());
    }
}

TEST_F(VantleFilterGPUTest, ShowsTheDiagonalUntilTheEngineHasAShader) {
    Texels const input = picture();
    ImageGPUPtr const upInput = textureOf(input, ImageGPU::PIXEL_FORMAT_RGBA8);
    for (char const* pSelector : {"NewShader", "ReferenceTransform"}) {
        OpenVantleFilter filter;
        setTransform(filter, RecordingEngine::ownTransform());
        ShaderRoad road(frameContext(), filter);
        road.setInput(0, *upInput);
        RecordingEngine::fail(pSelector);
        auto nLinks = GLHooks::calls("glLinkProgram");
        for (int i = 0; i < 3; ++i) {
            EXPECT_EQ((Pixel{1, 0, 0, 1}), Texels(*road.run(world(0, 0, 9, 5))).at(0, 0)) << pSelector;
            EXPECT_EQ(0, RecordingEngine::transforms()) << pSelector;
        }
        EXPECT_EQ(nLinks + 1, GLHooks::calls("glLinkProgram")) << "asking again links nothing";
        RecordingEngine::failNothing();
        expectMixed(road, input);
        auto const nShaderCalls = RecordingEngine::shaderCalls();
        expectMixed(road, input);
        EXPECT_EQ(nShaderCalls, RecordingEngine::shaderCalls()) << "a shader is not asked for again";
    }
}

TEST_F(VantleFilterGPUTest, AsksTheEngineOfANewBinding) {
    Texels const input = picture();
    ImageGPUPtr const upInput = textureOf(input, ImageGPU::PIXEL_FORMAT_RGBA8);
    OpenVantleFilter filter;
    setTransform(filter, RecordingEngine::ownTransform());
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upInput);
    expectMixed(road, input);
    // Another engine, whose transform stands at the same address and does something else.
    ImageFlow::QuorClient::stop();
    RecordingEngine::loseAll();
    ASSERT_EQ(1, ImageFlow::QuorClient::start(GetQuorGetAddressProc()));
    RecordingEngine::shader() = {"turn", "void turn(inout vec4 c) { c = c.gbra; }\n", {}};
    Texels const turned = Texels(input.region()).fill([&](int x, int y) {
        Pixel const c = input.at(x, y);
        return Pixel{c[1], c[2], c[0], c[3]};
    });
    EXPECT_EQ("", differences(Texels(*road.run(world(0, 0, 9, 5))), turned,
                              Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8)));
    EXPECT_EQ(1, RecordingEngine::transforms());
    EXPECT_EQ(1, RecordingEngine::shaders());
}

TEST_F(VantleFilterGPUTest, HandsGreenOnWhereTheResultIsGrey) {
    Texels const input = picture();
    ImageGPUPtr const upInput = textureOf(input, ImageGPU::PIXEL_FORMAT_RGBA8);
    Texels const grey = Texels(input.region()).fill([&](int x, int y) {
        Pixel const c = mixedAll(input.at(x, y));
        return Pixel{c[1], c[1], c[1], c[3]};
    });
    OpenVantleFilter filter;
    setTransform(filter, RecordingEngine::ownTransform());
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upInput);
    expectMixed(road, input);
    filter.greyResult()->setValue(true);
    EXPECT_EQ("", differences(Texels(*road.run(world(0, 0, 9, 5))), grey,
                              Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8)));
    filter.greyResult()->setValue(false);
    expectMixed(road, input);
}

TEST_F(VantleFilterGPUTest, TriesAgainAfterATextThatDoesNotCompile) {
    Texels const input = picture();
    ImageGPUPtr const upInput = textureOf(input, ImageGPU::PIXEL_FORMAT_RGBA8);
    OpenVantleFilter filter;
    setTransform(filter, RecordingEngine::ownTransform());
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upInput);
    RecordingEngine::shader().sCode_ = "nonsense\n";
    for (int i = 0; i < 2; ++i)
        EXPECT_THROW(road.run(world(0, 0, 9, 5)), OGL::ExceptionOGL);
    RecordingEngine::shader() = everyKind();
    expectMixed(road, input);
    // So also after a table that cannot be made.
    setTransform(filter, nullptr);
    road.run(world(0, 0, 9, 5));
    setTransform(filter, RecordingEngine::ownTransform());
    RecordingEngine::shader().aTables_[0].record_.kind = Record::KIND_TEXTURE_4D;
    for (int i = 0; i < 2; ++i)
        ORVO_EXPECT_INTERNAL(road.run(world(0, 0, 9, 5)), "Parameter interface not implemented");
    RecordingEngine::shader() = everyKind();
    expectMixed(road, input);
}

TEST_F(VantleFilterGPUTest, RunsADescriptionWithoutParameters) {
    RecordingEngine::shader() = {"turn", "void turn(inout vec4 c) { c = c.gbra; }\n", {}};
    Texels const input = picture();
    ImageGPUPtr const upInput = textureOf(input, ImageGPU::PIXEL_FORMAT_RGBA8);
    OpenVantleFilter filter;
    setTransform(filter, RecordingEngine::ownTransform());
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upInput);
    Texels const actual(*road.run(world(0, 0, 9, 5)));
    Texels const expected = Texels(input.region()).fill([&](int x, int y) {
        Pixel const c = input.at(x, y);
        return Pixel{c[1], c[2], c[0], c[3]};
    });
    EXPECT_EQ("", differences(actual, expected, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8)));
}

TEST_F(VantleFilterGPUTest, ChecksTexturesAndNamesBeforeItDraws) {
    ImageGPUPtr const upInput = textureOf(picture(), ImageGPU::PIXEL_FORMAT_RGBA8);
    struct Row {
        std::size_t iTable_;
        char const* pMessage_;
    };
    for (Row const& row : {Row{0, "!tex1DIter->first.empty()"}, Row{1, "!tex2DIter->first.empty()"},
                           Row{2, "!tex3DIter->first.empty()"}, Row{3, "!mat3Iter->first.empty()"},
                           Row{4, "!mat4Iter->first.empty()"}}) {
        RecordingEngine::shader() = everyKind();
        RecordingEngine::shader().aTables_[row.iTable_].sName_.clear();
        OpenVantleFilter filter;
        setTransform(filter, RecordingEngine::ownTransform());
        ShaderRoad road(frameContext(), filter);
        road.setInput(0, *upInput);
        ORVO_EXPECT_INTERNAL(road.run(world(0, 0, 9, 5)), row.pMessage_);
        EXPECT_EQ(-1, upInput->boundTexUnit());
    }
    // A table on the unit of the output pass.
    for (std::size_t iTable = 0; iTable < 3; ++iTable) {
        RecordingEngine::shader() = everyKind();
        RecordingEngine::shader().aTables_ = {RecordingEngine::shader().aTables_[iTable]};
        OpenVantleFilter filter;
        setTransform(filter, RecordingEngine::ownTransform());
        ShaderRoad road(frameContext(), filter);
        road.setInput(0, *upInput);
        filter.onPreProcessed_ = [&] { filter.spDataAdapter_->populateGLObjects(0); };
        ORVO_EXPECT_INTERNAL(road.run(world(0, 0, 9, 5)), "textureUnit > 0");
    }
}

TEST_F(VantleFilterGPUTest, SaysWhetherATransformRunsHere) {
    EXPECT_FALSE(VantleFilterGPU::isCompatible(nullptr));
    EXPECT_TRUE(VantleFilterGPU::isCompatible(RecordingEngine::ownTransform()));
    OGL::ExtensionManager::Instance()->overrideSupport(OGL::EXTENSION_EXT_TEXTURE3D, false);
    EXPECT_FALSE(VantleFilterGPU::isCompatible(RecordingEngine::ownTransform()));
    OGL::ExtensionManager::Instance()->clearOverrides();
    OGL::ExtensionManager::Instance()->overrideNumberOfTextureUnits(4); // the input's and three tables'
    EXPECT_FALSE(VantleFilterGPU::isCompatible(RecordingEngine::ownTransform()));
    OGL::ExtensionManager::Instance()->overrideNumberOfTextureUnits(5);
    EXPECT_TRUE(VantleFilterGPU::isCompatible(RecordingEngine::ownTransform()));
    RecordingEngine::fail("NewShader");
    EXPECT_FALSE(VantleFilterGPU::isCompatible(RecordingEngine::ownTransform()));
    RecordingEngine::failNothing();
    for (char const* pSelector : {"NumParameters", "Parameter", "StringASCII"}) {
        RecordingEngine::fail(pSelector);
        EXPECT_THROW(VantleFilterGPU::isCompatible(RecordingEngine::ownTransform()), Quor_T_MT::CQuorError)
            << pSelector;
        RecordingEngine::failNothing();
        EXPECT_EQ(0, RecordingEngine::transforms()) << pSelector;
    }
}

TEST_F(VantleFilterGPUTest, SaysThatItRunsInHardwareOnceCompiled) {
    Texels const input = picture();
    ImageGPUPtr const upInput = textureOf(input, ImageGPU::PIXEL_FORMAT_RGBA8);
    OpenVantleFilter filter;
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upInput);
    frameContext().makeCurrent();
    EXPECT_NE("", filter.initVantle(RecordingEngine::ownTransform()));
    EXPECT_TRUE(filter.willRunInHardware());
    OGL::ExtensionManager::Instance()->overrideSupport(OGL::EXTENSION_SGIS_TEXTURE_EDGE_CLAMP, false);
    EXPECT_NE("", filter.initVantle(RecordingEngine::ownTransform()));
    EXPECT_FALSE(filter.willRunInHardware());
    host().makeCurrent();
    // A frame runs what the driver compiles, whatever it says of itself.
    setTransform(filter, RecordingEngine::ownTransform());
    expectMixed(road, input);
    EXPECT_TRUE(filter.willRunInHardware());
}

TEST_F(VantleFilterGPUTest, SurvivesEveryFailingCall) {
    Texels const input = picture();
    ImageGPUPtr const upInput = textureOf(input, ImageGPU::PIXEL_FORMAT_RGBA8);
    OpenVantleFilter filter;
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upInput);
    // Runs a frame that makes everything, with the n-th call of an entry point failing, then one without;
    // whether one failed.
    auto const failedCall = [&](std::string const& sName, std::uint64_t n) {
        SCOPED_TRACE(sName + " " + std::to_string(n));
        setTransform(filter, nullptr);
        road.run(world(0, 0, 9, 5));
        TexturePool::Instance()->clearAll();
        setTransform(filter, RecordingEngine::ownTransform());
        bool bFailed = false;
        {
            GLCallFailure const failure(sName, n);
            try {
                road.run(world(0, 0, 9, 5));
            } catch (OGL::ExceptionOGL const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            bFailed = failure.hasFired();
        }
        // After a refused context none is current.
        host().makeCurrent();
        EXPECT_EQ(0U, drainErrors());
        expectMixed(road, input);
        EXPECT_EQ(-1, upInput->boundTexUnit());
        return bFailed;
    };
    for (char const* pName :
         {"glGenTextures", "glTexImage1D", "glTexImage2D", "glTexImage3D", "glTexSubImage1D",
          "glTexSubImage2D", "glTexSubImage3D", "glCreateProgram", "glCreateShader", "glCompileShader",
          "glLinkProgram", "glFramebufferTexture2D", "glCheckFramebufferStatus", "eglMakeCurrent"}) {
        std::uint64_t n = 1;
        while (failedCall(pName, n))
            ++n;
        EXPECT_GT(n, 1U) << pName << " was not called";
    }
}

} // namespace
