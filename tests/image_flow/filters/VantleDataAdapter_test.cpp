#include "orvo/image_flow/filters/VantleDataAdapter.h"

#include "tests/image_flow/support/GLFlowTest.h"

#include <functional>
#include <numeric>

#include "orvo/image_flow/ScopedTexturePoolAccessors.h"
#include "orvo/image_flow/filters/VantleShaderAdapter.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/Texture3D.h"
#include "tests/support/RecordingEngine.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using OGL::Texture;
using Record = _t_Vantle_ShaderParameterData;

/// A description of the test's own.
class StatedShader : public VantleShaderAdapter {
public:
    bool isValid() override { return bValid_; }
    void getShaderInfo(std::string& entryPoint, std::string& code) override {
        entryPoint = "turn";
        code = "void turn(inout vec4 c) { c = c.gbra; }\n";
    }
    Record getParameter(unsigned index, std::string& name) override {
        name = aTables_.at(index).sName_;
        Record record = aTables_.at(index).record_;
        record.data = aTables_.at(index).aData_.data();
        return record;
    }
    void copyMatrixData(float* target, unsigned index, unsigned& size) override {
        std::vector<float> const& aData = aTables_.at(index).aData_;
        size = static_cast<unsigned>(aData.size() * sizeof(float));
        std::copy(aData.begin(), aData.end(), target);
    }
    unsigned numParameters() override { return static_cast<unsigned>(aTables_.size()); }

    bool bValid_ = true;
    std::vector<ShaderTable> aTables_;
};

ShaderTable table(std::string const& sName, std::uint32_t kind, std::uint32_t target, std::uint32_t width,
                  std::uint32_t height = 1, std::uint32_t depth = 1) {
    ShaderTable result;
    result.sName_ = sName;
    Record& record = result.record_;
    record.kind = kind;
    record.target = target;
    record.internalFormat = GL_RGBA32F;
    record.width = width;
    record.height = height;
    record.depth = depth;
    record.format = GL_RGBA;
    record.type = GL_FLOAT;
    record.minFilter = GL_NEAREST;
    record.magFilter = GL_NEAREST;
    record.wrapR = GL_CLAMP_TO_EDGE;
    record.wrapS = GL_CLAMP_TO_EDGE;
    record.wrapT = GL_CLAMP_TO_EDGE;
    result.aData_.resize(std::size_t(4) * width * height * depth);
    std::iota(result.aData_.begin(), result.aData_.end(), 0.0F);
    return result;
}
ShaderTable table1D(std::string const& sName = "a", std::uint32_t width = 4) {
    return table(sName, Record::KIND_TEXTURE_1D, GL_TEXTURE_1D, width);
}
ShaderTable table2D(std::string const& sName = "b") {
    return table(sName, Record::KIND_TEXTURE_2D, GL_TEXTURE_2D, 3, 2);
}
ShaderTable table3D(std::string const& sName = "c") {
    return table(sName, Record::KIND_TEXTURE_3D, GL_TEXTURE_3D, 3, 2, 2);
}
ShaderTable matrix(std::string const& sName, std::uint32_t kind, std::size_t nFloats) {
    ShaderTable result;
    result.sName_ = sName;
    result.record_.kind = kind;
    result.aData_.resize(nFloats);
    std::iota(result.aData_.begin(), result.aData_.end(), 0.5F);
    return result;
}

long textureObjects() { return GLHooks::objects()["texture"]; }

class VantleDataAdapterTest : public GLFlowTest {
protected:
    void TearDown() override {
        OGL::ExtensionManager::Instance()->clearOverrides();
        GLFlowTest::TearDown();
    }
    /// The format that a table of one dimension gets.
    static Texture::InternalFormat formatOf(ShaderTable const& stated) {
        StatedShader shader;
        shader.aTables_ = {stated};
        VantleDataAdapter adapter(&shader);
        adapter.populateGLObjects(2);
        return adapter.textures1D().at(stated.sName_).first->get()->format();
    }
};

TEST_F(VantleDataAdapterTest, NeedsAShaderAdapter) {
    ORVO_EXPECT_INTERNAL(VantleDataAdapter(nullptr), "vantleShader_ != NULL");
}

TEST_F(VantleDataAdapterTest, WritesTheProgramAroundTheEnginesText) {
    StatedShader shader;
    VantleDataAdapter adapter(&shader);
    EXPECT_EQ("InputImage", adapter.getInputSamplerName());
    EXPECT_EQ("void turn(inout vec4 c) { c = c.gbra; }\n"
              "#define _PROFILE_TILED\n"
              "#define _PROFILE_NORMALIZED\n"
              "uniform sampler2D InputImage_sampler;\n"
              "uniform vec2 _outOffset;\n"
              "uniform vec2 _outPixelExtent;\n"
              "uniform vec2 InputImage_offset;\n"
              "uniform vec2 InputImage_delta;\n"
              "void main(void)\n"
              "{\n"
              "   vec4 inputColor = texture2D(InputImage_sampler, "
              "(gl_TexCoord[0].xy*_outPixelExtent+_outOffset-InputImage_offset)*InputImage_delta);\n"
              "turn(inputColor);\n"
              "   (gl_FragData[0]) = inputColor;\n"
              "}\n",
              adapter.buildGLObjects());
}

TEST_F(VantleDataAdapterTest, HandsGreenOnInAllChannelsWhereTheResultIsGrey) {
    StatedShader shader;
    VantleDataAdapter adapter(&shader);
    std::string const sColour = adapter.buildGLObjects();
    adapter.setGreyResult(true);
    std::string sExpected = sColour;
    sExpected.insert(sExpected.find("   (gl_FragData[0])"), "   inputColor.rgb = inputColor.ggg;\n");
    EXPECT_EQ(sExpected, adapter.buildGLObjects());
    adapter.setGreyResult(false);
    EXPECT_EQ(sColour, adapter.buildGLObjects());
}

TEST_F(VantleDataAdapterTest, WritesARedDiagonalWithoutAShader) {
    VantleShaderAdapter shader;
    VantleDataAdapter adapter(&shader);
    std::string const sExpected =
        "uniform sampler2D InputImage;\n"
        "const float Epsilon = 0.05;\n"
        "const vec4 Red = vec4(1, 0, 0, 1);\n"
        "void main(void)\n"
        "{\n"
        "    vec4 bg = texture2D(InputImage, vec2(gl_TexCoord[0]));\n"
        "    gl_FragColor = mix(Red, bg, step(Epsilon, abs(gl_TexCoord[0].x - gl_TexCoord[0].y)));\n"
        "}\n";
    EXPECT_EQ(sExpected, adapter.buildGLObjects());
    auto const nObjects = textureObjects();
    EXPECT_EQ(sExpected, adapter.buildAndPopulateGLObjects());
    EXPECT_EQ(nObjects, textureObjects());
}

TEST_F(VantleDataAdapterTest, MakesTexturesOnRisingUnitsAndKeepsMatrices) {
    StatedShader shader;
    shader.aTables_ = {table1D("one"), matrix("m3", Record::KIND_MATRIX_3X3, 9),  table3D("three"),
                       table2D("two"), matrix("m4", Record::KIND_MATRIX_4X4, 16), table1D("last", 7)};
    VantleDataAdapter adapter(&shader);
    glActiveTexture(GL_TEXTURE3);
    adapter.populateGLObjects(5);
    GLint nActive = 0;
    glGetIntegerv(GL_ACTIVE_TEXTURE, &nActive);
    EXPECT_EQ(GL_TEXTURE3, nActive);
    glActiveTexture(GL_TEXTURE0);

    ASSERT_EQ(2U, adapter.textures1D().size());
    EXPECT_EQ(5U, adapter.textures1D().at("one").second);
    EXPECT_EQ(6U, adapter.textures3D().at("three").second);
    EXPECT_EQ(7U, adapter.textures2D().at("two").second);
    EXPECT_EQ(8U, adapter.textures1D().at("last").second);
    EXPECT_EQ(7U, adapter.textures1D().at("last").first->get()->width(0));
    EXPECT_EQ(shader.aTables_[1].aData_, adapter.matrices3().at("m3"));
    EXPECT_EQ(shader.aTables_[4].aData_, adapter.matrices4().at("m4"));

    OGL::Texture3D const& texture = *adapter.textures3D().at("three").first->get();
    EXPECT_EQ(3U, texture.width(0));
    EXPECT_EQ(2U, texture.height(0));
    EXPECT_EQ(2U, texture.depth(0));
    glBindTexture(GL_TEXTURE_3D, texture.objectID());
    std::vector<float> aTexels(shader.aTables_[2].aData_.size());
    glGetTexImage(GL_TEXTURE_3D, 0, GL_RGBA, GL_FLOAT, aTexels.data());
    EXPECT_EQ(shader.aTables_[2].aData_, aTexels);
    glBindTexture(GL_TEXTURE_3D, 0);

    VantleDataAdapter standard(&shader);
    standard.buildAndPopulateGLObjects();
    EXPECT_EQ(2U, standard.textures1D().at("one").second);
}

TEST_F(VantleDataAdapterTest, SetsFiltersAndWrapModes) {
    StatedShader shader;
    shader.aTables_ = {table1D(), table2D(), table3D()};
    for (ShaderTable& stated : shader.aTables_) {
        stated.record_.minFilter = GL_LINEAR;
        stated.record_.wrapS = GL_REPEAT;
        stated.record_.wrapT = GL_CLAMP;
        stated.record_.wrapR = GL_MIRRORED_REPEAT;
    }
    VantleDataAdapter adapter(&shader);
    adapter.populateGLObjects(1);
    struct Row {
        GLenum target_;
        GLuint name_;
        std::vector<std::pair<GLenum, GLint>> aValues_;
    };
    Row const aRows[] = {
        {GL_TEXTURE_1D,
         adapter.textures1D().at("a").first->get()->objectID(),
         {{GL_TEXTURE_WRAP_S, GL_REPEAT}}},
        {GL_TEXTURE_2D,
         adapter.textures2D().at("b").first->get()->objectID(),
         {{GL_TEXTURE_WRAP_S, GL_REPEAT}, {GL_TEXTURE_WRAP_T, GL_CLAMP}}},
        {GL_TEXTURE_3D,
         adapter.textures3D().at("c").first->get()->objectID(),
         {{GL_TEXTURE_WRAP_S, GL_REPEAT},
          {GL_TEXTURE_WRAP_T, GL_CLAMP},
          {GL_TEXTURE_WRAP_R, GL_MIRRORED_REPEAT}}},
    };
    for (Row const& row : aRows) {
        glBindTexture(row.target_, row.name_);
        auto aValues = row.aValues_;
        aValues.insert(aValues.end(),
                       {{GL_TEXTURE_MIN_FILTER, GL_LINEAR}, {GL_TEXTURE_MAG_FILTER, GL_NEAREST}});
        for (auto const& [token, expected] : aValues) {
            GLint value = 0;
            glGetTexParameteriv(row.target_, token, &value);
            EXPECT_EQ(expected, value) << row.target_ << " " << token;
        }
        glBindTexture(row.target_, 0);
    }
}

TEST_F(VantleDataAdapterTest, ReadsTheWrapModesOfItsDimensionsAlone) {
    StatedShader shader;
    shader.aTables_ = {table1D(), table2D()};
    shader.aTables_[0].record_.wrapT = 0; // no wrap mode of OpenGL's
    for (ShaderTable& stated : shader.aTables_)
        stated.record_.wrapR = 0;
    VantleDataAdapter adapter(&shader);
    adapter.populateGLObjects(2);
    EXPECT_EQ(1U, adapter.textures1D().size());
    EXPECT_EQ(1U, adapter.textures2D().size());
    // Those that a table has are looked at.
    std::pair<ShaderTable, std::vector<std::uint32_t Record::*>> const aRows[] = {
        {table1D(), {&Record::wrapS}},
        {table2D(), {&Record::wrapS, &Record::wrapT}},
        {table3D(), {&Record::wrapS, &Record::wrapT, &Record::wrapR}}};
    for (auto const& [stated, aWraps] : aRows) {
        for (auto const wrap : aWraps) {
            shader.aTables_ = {stated};
            shader.aTables_[0].record_.*wrap = 0;
            VantleDataAdapter refusing(&shader);
            EXPECT_THROW(refusing.populateGLObjects(2), OGL::ExceptionOGL);
        }
    }
}

TEST_F(VantleDataAdapterTest, WidensTablesOfFloats) {
    struct Row {
        std::vector<int> aFormats_;
        GLenum upload_;
        int interpolated_;
        int nearest_;
    };
    Row const aRows[] = {{{0, 2, 48, 54}, GL_ALPHA, 54, 48},
                         {{5, 7, 50, 56}, GL_LUMINANCE, 56, 50},
                         {{17, 19, 49, 55}, GL_LUMINANCE, 55, 49},
                         {{31, 34, 47, 53}, GL_RGB, 53, 47},
                         {{38, 42, 46, 52}, GL_RGBA, 52, 46}};
    std::vector<bool> aSupported(58, false);
    for (Row const& row : aRows) {
        for (int const format : row.aFormats_) {
            aSupported[static_cast<std::size_t>(format)] = true;
            ShaderTable stated = table1D();
            stated.record_.internalFormat = Texture::InternalFormat2GL(Texture::InternalFormat(format));
            stated.record_.format = row.upload_;
            EXPECT_EQ(row.nearest_, formatOf(stated)) << format;
            stated.record_.minFilter = GL_LINEAR;
            EXPECT_EQ(row.interpolated_, formatOf(stated)) << format;
            stated.record_.minFilter = GL_NEAREST;
            stated.record_.magFilter = GL_LINEAR;
            EXPECT_EQ(row.interpolated_, formatOf(stated)) << format;
        }
    }
    for (int format = 0; format < 58; ++format) {
        if (aSupported[static_cast<std::size_t>(format)] ||
            !Texture::IsValid(Texture::InternalFormat(format)))
            continue;
        ShaderTable stated = table1D();
        stated.record_.internalFormat = Texture::InternalFormat2GL(Texture::InternalFormat(format));
        ORVO_EXPECT_INTERNAL(formatOf(stated), "Requested internal format not supported");
    }
}

TEST_F(VantleDataAdapterTest, LeavesOtherTablesTheirFormat) {
    ShaderTable bytes = table1D();
    bytes.record_.internalFormat = GL_LUMINANCE8_ALPHA8;
    bytes.record_.type = GL_UNSIGNED_BYTE;
    EXPECT_EQ(Texture::INTERNAL_FORMAT_LUMINANCE8_ALPHA8, formatOf(bytes));
    StatedShader shader;
    shader.aTables_ = {table2D(), table3D()};
    for (ShaderTable& stated : shader.aTables_) {
        stated.record_.internalFormat = GL_RGB16;
        stated.record_.minFilter = GL_LINEAR;
    }
    VantleDataAdapter adapter(&shader);
    adapter.populateGLObjects(1);
    EXPECT_EQ(Texture::INTERNAL_FORMAT_RGB16, adapter.textures2D().at("b").first->get()->format());
    EXPECT_EQ(Texture::INTERNAL_FORMAT_RGB16, adapter.textures3D().at("c").first->get()->format());
    // Without textures of floats there is nothing to widen to.
    ShaderTable floats = table1D();
    floats.record_.internalFormat = GL_RGB8;
    for (auto const extension : {OGL::EXTENSION_ARB_TEXTURE_FLOAT, OGL::EXTENSION_ATI_TEXTURE_FLOAT,
                                 OGL::EXTENSION_APPLE_FLOAT_PIXELS})
        OGL::ExtensionManager::Instance()->overrideSupport(extension, false);
    EXPECT_EQ(Texture::INTERNAL_FORMAT_RGB8, formatOf(floats));
}

TEST_F(VantleDataAdapterTest, RefusesWhatItCannotMake) {
    struct Row {
        ShaderTable table_;
        char const* pMessage_;
    };
    auto const with = [](ShaderTable stated, std::function<void(Record&)> const& change) {
        change(stated.record_);
        return stated;
    };
    auto const onRectangles = [](Record& record) { record.target = 0x84F5; };
    Row const aRows[] = {
        {with(table1D(), onRectangles), "Vantle is requesting an unsupported texture target for 1D textures"},
        {with(table2D(), onRectangles), "Vantle is requesting an unsupported texture target for 2D textures"},
        {with(table3D(), onRectangles), "Vantle is requesting an unsupported texture target for 3D textures"},
        {matrix("m", Record::KIND_MATRIX_3X3, 8), "matSize == 9 * sizeof(float)"},
        {matrix("m", Record::KIND_MATRIX_3X3, 16), "matSize == 9 * sizeof(float)"},
        {matrix("m", Record::KIND_MATRIX_4X4, 9), "matSize == 16 * sizeof(float)"},
        {table("d", Record::KIND_TEXTURE_4D, GL_TEXTURE_3D, 2), "Parameter interface not implemented"},
        {matrix("n", 0, 9), "Parameter interface not implemented"},
    };
    for (Row const& row : aRows) {
        StatedShader shader;
        shader.aTables_ = {row.table_};
        VantleDataAdapter adapter(&shader);
        ORVO_EXPECT_INTERNAL(adapter.populateGLObjects(2), row.pMessage_);
        EXPECT_TRUE(adapter.textures1D().empty() && adapter.textures2D().empty() &&
                    adapter.textures3D().empty() && adapter.matrices3().empty() &&
                    adapter.matrices4().empty());
    }
    StatedShader shader;
    shader.aTables_ = {with(table1D(), [](Record& record) { record.level = 1; })};
    VantleDataAdapter adapter(&shader);
    ORVO_EXPECT_PARAMETER(adapter.populateGLObjects(2), "The level does not exist");
    shader.aTables_ = {with(table1D(), [](Record& record) { record.wrapS = 1; })};
    EXPECT_THROW(adapter.populateGLObjects(2), OGL::ExceptionOGL);
    shader.aTables_ = {table1D()};
    shader.aTables_[0].aData_ = std::vector<float>();
    ORVO_EXPECT_INTERNAL(adapter.populateGLObjects(2), "Enforce parameterData.data != NULL");
}

TEST_F(VantleDataAdapterTest, GivesReplacedTexturesBackAtOnce) {
    StatedShader shader;
    shader.aTables_ = {table1D("one"), table1D("two"), table2D(), table3D()};
    auto const nBefore = textureObjects();
    {
        VantleDataAdapter adapter(&shader);
        for (int i = 0; i < 5; ++i) {
            adapter.populateGLObjects(2);
            EXPECT_EQ(nBefore + 4, textureObjects());
        }
        // Two hold the same four only while one does not: nothing is left in the pool.
        VantleDataAdapter other(&shader);
        other.populateGLObjects(2);
        EXPECT_EQ(nBefore + 8, textureObjects());
    }
    // Both have given all of theirs back.
    VantleDataAdapter third(&shader);
    third.populateGLObjects(2);
    VantleDataAdapter fourth(&shader);
    fourth.populateGLObjects(2);
    EXPECT_EQ(nBefore + 8, textureObjects());
}

TEST_F(VantleDataAdapterTest, SurvivesEveryFailingCall) {
    StatedShader shader;
    shader.aTables_ = {table1D(), matrix("m", Record::KIND_MATRIX_3X3, 9), table2D(), table3D()};
    TexturePool::Instance()->clearAll();
    failEveryCallBeforeThePool(
        [&] {
            VantleDataAdapter adapter(&shader);
            adapter.populateGLObjects(2);
        },
        [] {
            GLint nActive = 0;
            glGetIntegerv(GL_ACTIVE_TEXTURE, &nActive);
            EXPECT_EQ(GL_TEXTURE0, nActive);
            TexturePool::Instance()->clearAll();
        },
        {"glGenTextures", "glTexImage1D", "glTexImage2D", "glTexImage3D", "glTexSubImage1D",
         "glTexSubImage2D", "glTexSubImage3D"});
}

TEST_F(VantleDataAdapterTest, AnswersWhetherTheDriverCanDoIt) {
    OGL::ExtensionManager& manager = *OGL::ExtensionManager::Instance();
    auto const can = [](std::vector<ShaderTable> const& aTables) {
        StatedShader shader;
        shader.aTables_ = aTables;
        return VantleDataAdapter::canCreateGLObjectsAsRequested(shader);
    };
    VantleShaderAdapter invalid;
    EXPECT_TRUE(VantleDataAdapter::canCreateGLObjectsAsRequested(invalid));
    EXPECT_TRUE(can({}));
    EXPECT_TRUE(can({table1D(), table2D(), table3D()}));

    ShaderTable anyWrap = table1D();
    anyWrap.record_.wrapS = GL_REPEAT;
    ShaderTable flat = table2D();
    flat.record_.wrapS = GL_CLAMP;
    manager.overrideSupport(OGL::EXTENSION_EXT_TEXTURE3D, false);
    EXPECT_FALSE(can({table3D()}));
    EXPECT_TRUE(can({table1D(), table2D()}));
    manager.clearOverrides();
    manager.overrideSupport(OGL::EXTENSION_SGIS_TEXTURE_EDGE_CLAMP, false);
    EXPECT_FALSE(can({table2D()}));
    EXPECT_TRUE(can({anyWrap, flat}));
    manager.clearOverrides();
    // It is the format that is compared with the number of floats, and not the type.
    ShaderTable floatFormat = table1D();
    floatFormat.record_.format = GL_FLOAT;
    EXPECT_TRUE(can({floatFormat}));
    for (auto const extension : {OGL::EXTENSION_ARB_TEXTURE_FLOAT, OGL::EXTENSION_ATI_TEXTURE_FLOAT,
                                 OGL::EXTENSION_APPLE_FLOAT_PIXELS})
        manager.overrideSupport(extension, false);
    EXPECT_FALSE(can({floatFormat}));
    EXPECT_TRUE(can({table1D()}));
    manager.clearOverrides();

    // Without programs nothing can be done, whatever the tables are.
    manager.overrideSupport(OGL::EXTENSION_ARB_SHADER_OBJECTS, false);
    EXPECT_FALSE(can({}));
    EXPECT_FALSE(can({table1D()}));
    EXPECT_FALSE(VantleDataAdapter::canCreateGLObjectsAsRequested(invalid));
    manager.clearOverrides();
    EXPECT_TRUE(can({table1D()}));

    // One unit is the input's, and one has to be left.
    manager.overrideNumberOfTextureUnits(4);
    EXPECT_TRUE(can({table1D("a"), table2D("b")}));
    EXPECT_FALSE(can({table1D("a"), table2D("b"), table3D("c")}));
    EXPECT_TRUE(can({table1D("a"), table2D("b"), matrix("m", Record::KIND_MATRIX_3X3, 9),
                     table("d", Record::KIND_TEXTURE_4D, GL_TEXTURE_3D, 2)}));
    manager.overrideNumberOfTextureUnits(1);
    EXPECT_FALSE(can({}));
}

} // namespace
