// Frames in a context in which a host draws: whatever the host has set there, the pixels are those of a
// context of the library's own, and the setting is what it was.
#include "tests/image_flow/support/GPUBilateralReference.h"
#include "tests/image_flow/support/GPURoads.h"

#include "orvo/image_flow/filters/FastBilateralFilterGPU.h"
#include "orvo/ogl/Buffer.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/TextureRECT.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;

using HostValues = std::vector<double>;

/// Arrays that drivers may fetch from, though nothing of the frame is in them.
void expectNoArrays() {
    for (GLenum const array : {GL_SECONDARY_COLOR_ARRAY, GL_FOG_COORD_ARRAY})
        EXPECT_EQ(GLboolean{GL_FALSE}, glIsEnabled(array)) << array;
    GLint nUnit = 0;
    glGetIntegerv(GL_CLIENT_ACTIVE_TEXTURE, &nUnit);
    EXPECT_EQ(GL_TEXTURE0, nUnit);
    for (GLenum const unit : {GL_TEXTURE3, GL_TEXTURE1, GL_TEXTURE0}) {
        glClientActiveTexture(unit);
        EXPECT_EQ(GLboolean{GL_FALSE}, glIsEnabled(GL_TEXTURE_COORD_ARRAY)) << unit;
    }
}

/// Draws its input without a program.
class FixedFunctionCopy : public SimpleFilterGPU {
public:
    FixedFunctionCopy() : SimpleFilterGPU("FixedFunctionCopy") {}
    ~FixedFunctionCopy() override { disconnect(); }

protected:
    void internalProcess() override {
        expectNoArrays();
        preRender();
        inputImageGPU(0)->bind(0);
        inputImageGPU(0)->setFilter(GL_NEAREST, GL_NEAREST);
        inputImageGPU(0)->setWrap(GL_CLAMP_TO_EDGE, GL_CLAMP_TO_EDGE);
        renderAndTearDown();
    }
};

PositionExtentInPixelSpace const oHostRegion = pixels(0, 0, 12, 9);

/// One of each way in which a frame draws, uploads and reads back, in one context.
class AllRoads {
public:
    explicit AllRoads(OGL::Context const& context)
        : oPicture_(gpuBilateral::scene(oHostRegion, 3, -0.1, 1.3, false)),
          upPicture_(textureOf(oPicture_, ImageGPU::PIXEL_FORMAT_RGBA16F)),
          oShader_(shaderOf({"src"}, readInput("src") + "*texture1D(half_sampler, 0.5)",
                            "uniform sampler1D half_sampler;\n")),
          oFixedRoad_(context, oFixed_),
          oShaderRoad_(context, oShader_),
          oBilateralRoad_(context, oBilateral_),
          oBytes_(ImageCPU::PIXEL_FORMAT_RGBA8, oHostRegion, 2),
          oGrey_(ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, oHostRegion),
          oBytesChain_(context, {&oBytesSource_, &oBytesUp_, &oBytesDown_, &oBytesSink_}),
          oGreyChain_(context, {&oGreySource_, &oGreyUp_, &oGreyDown_, &oGreySink_}) {
        oShader_.onPreProcessed_ = [this] { oShader_.addUniformArray("half", aHalf_.data(), 2); };
        for (ImageFilter* const pFilter :
             {static_cast<ImageFilter*>(&oShader_), static_cast<ImageFilter*>(&oBilateral_)})
            pFilter->outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT);
        oBilateral_.spatialSigma().setValue(float2(2.0f, 2.0f));
        oBilateral_.colorize().setValue(true);
        for (ShaderRoad* const pRoad : {&oFixedRoad_, &oShaderRoad_, &oBilateralRoad_})
            pRoad->setInput(0, *upPicture_);
        oBytes_.set(channelBytes(GL_UNSIGNED_BYTE, 12 * 9 * 4));
        std::vector<float> aGrey(12 * 9 * 2);
        for (std::size_t i = 0; i < aGrey.size(); ++i)
            aGrey[i] = float(i) / 100.0f;
        oGrey_.set(bytesOf(aGrey));
        oBytesSource_.setImageCPUWithNoOwnership(&oBytes_.image());
        oGreySource_.setImageCPUWithNoOwnership(&oGrey_.image());
    }

    void launch() {
        apResults_.clear();
        for (ShaderRoad* const pRoad : {&oFixedRoad_, &oShaderRoad_, &oBilateralRoad_})
            apResults_.push_back(pRoad->run(worldOf(oHostRegion)));
        for (Chain* const pChain : {&oBytesChain_, &oGreyChain_}) {
            pChain->oController_.flushGraph();
            pChain->run(worldOf(oHostRegion));
        }
    }

    /// What all of them gave.
    std::vector<HostValues> values() {
        std::vector<HostValues> aValues;
        for (ImageGPU const* const pResult : apResults_)
            aValues.push_back(valuesOf(Texels(*pResult)));
        for (ImageCPUOutput* const pSink : {&oBytesSink_, &oGreySink_})
            aValues.push_back(valuesOf(*pSink->getImageCPU()));
        return aValues;
    }

private:
    static HostValues valuesOf(ImageCPU const& image) {
        std::size_t const nPixel = pixelSizeBytes(image.pixelFormat());
        std::size_t const nPitch = std::size_t(image.capacityExtent().width()) * nPixel;
        HostValues aValues;
        for (int row = 0; row < oHostRegion.extent().height(); ++row) {
            unsigned char const* const pRow = image.pixels() + std::size_t(row) * nPitch;
            aValues.insert(aValues.end(), pRow, pRow + std::size_t(oHostRegion.extent().width()) * nPixel);
        }
        return aValues;
    }
    static HostValues valuesOf(Texels const& picture) {
        HostValues aValues;
        for (int y = picture.top(); y < picture.top() + picture.height(); ++y)
            for (int x = picture.left(); x < picture.left() + picture.width(); ++x) {
                Pixel const pixel = picture.at(x, y);
                aValues.insert(aValues.end(), pixel.begin(), pixel.end());
            }
        return aValues;
    }

    std::array<float, 2> aHalf_{0.5f, 0.5f};
    Texels oPicture_;
    ImageGPUPtr upPicture_;
    FixedFunctionCopy oFixed_;
    ShaderNode oShader_;
    FastBilateralFilterGPU oBilateral_;
    ShaderRoad oFixedRoad_;
    ShaderRoad oShaderRoad_;
    ShaderRoad oBilateralRoad_;
    HostImage oBytes_;
    HostImage oGrey_;
    ImageCPUInput oBytesSource_;
    CPU2GPU oBytesUp_;
    GPU2CPU oBytesDown_;
    ImageCPUOutput oBytesSink_;
    ImageCPUInput oGreySource_;
    CPU2GPU oGreyUp_;
    GPU2CPU oGreyDown_;
    ImageCPUOutput oGreySink_;
    Chain oBytesChain_;
    Chain oGreyChain_;
    std::vector<ImageGPU const*> apResults_; // of the graphs' own, until the next frame
};

/// What a host sets, how it looks at it, and how it takes it back.
struct HostSetting {
    char const* pName_;
    void (*pSet_)();
    HostValues (*pGet_)();
    void (*pReset_)();
};

double hostInteger(GLenum name) {
    GLint value = 0;
    glGetIntegerv(name, &value);
    return value;
}

double hostNumber(GLenum name) {
    GLdouble value = 0;
    glGetDoublev(name, &value);
    return value;
}

double hostEnabled(GLenum name) { return glIsEnabled(name); }

/// Names that a setting makes, deleted when it is taken back.
GLuint aHostNames[2] = {0, 0};

unsigned char const aHostStipple[128] = {};
float const aHostNowhere[] = {-9, -9, -9, 1};

GLuint pipelineOfRed() {
    char const* const pText = "void main() { gl_FragColor = vec4(1.0, 0.0, 0.0, 1.0); }";
    aHostNames[1] = glCreateShaderProgramv(GL_FRAGMENT_SHADER, 1, &pText);
    glGenProgramPipelines(1, aHostNames);
    glUseProgramStages(aHostNames[0], GL_FRAGMENT_SHADER_BIT, aHostNames[1]);
    return aHostNames[0];
}

void loadAssembly(GLenum target, std::string const& sText) {
    glBindProgramARB(target, aHostNames[target == GL_VERTEX_PROGRAM_ARB ? 0 : 1]);
    glProgramStringARB(target, GL_PROGRAM_FORMAT_ASCII_ARB, GLsizei(sText.size()), sText.c_str());
    glEnable(target);
}

HostSetting const aHostSettings[] = {
    {"nothing", [] {}, [] { return HostValues(); }, [] {}},
    {"ARectangleTexture",
     [] {
         unsigned char const aGreen[] = {0, 255, 0, 255};
         glGenTextures(1, aHostNames);
         glBindTexture(GL_TEXTURE_RECTANGLE, aHostNames[0]);
         glTexImage2D(GL_TEXTURE_RECTANGLE, 0, GL_RGBA8, 1, 1, 0, GL_RGBA, GL_UNSIGNED_BYTE, aGreen);
         glEnable(GL_TEXTURE_RECTANGLE);
     },
     [] {
         return HostValues{hostEnabled(GL_TEXTURE_RECTANGLE), hostInteger(GL_TEXTURE_BINDING_RECTANGLE)};
     },
     [] {
         glDisable(GL_TEXTURE_RECTANGLE);
         glDeleteTextures(1, aHostNames);
     }},
    {"PointSprites",
     [] {
         glEnable(GL_POINT_SPRITE);
         glTexEnvi(GL_POINT_SPRITE, GL_COORD_REPLACE, GL_TRUE);
     },
     [] {
         GLint nReplace = 0;
         glGetTexEnviv(GL_POINT_SPRITE, GL_COORD_REPLACE, &nReplace);
         return HostValues{hostEnabled(GL_POINT_SPRITE), double(nReplace)};
     },
     [] {
         glDisable(GL_POINT_SPRITE);
         glTexEnvi(GL_POINT_SPRITE, GL_COORD_REPLACE, GL_FALSE);
     }},
    {"PointSizesOfPrograms", [] { glEnable(GL_VERTEX_PROGRAM_POINT_SIZE); },
     [] { return HostValues{hostEnabled(GL_VERTEX_PROGRAM_POINT_SIZE)}; },
     [] { glDisable(GL_VERTEX_PROGRAM_POINT_SIZE); }},
    {"ALeastPointSize", [] { glPointParameterf(GL_POINT_SIZE_MIN, 6.0f); },
     [] { return HostValues{hostNumber(GL_POINT_SIZE_MIN)}; },
     [] { glPointParameterf(GL_POINT_SIZE_MIN, 0.0f); }},
    {"PointSizesByDistance",
     [] {
         float const aFactors[] = {0.01f, 0, 0};
         glPointParameterfv(GL_POINT_DISTANCE_ATTENUATION, aFactors);
     },
     [] {
         GLdouble aFactors[3] = {};
         glGetDoublev(GL_POINT_DISTANCE_ATTENUATION, aFactors);
         return HostValues(aFactors, aFactors + 3);
     },
     [] {
         float const aFactors[] = {1, 0, 0};
         glPointParameterfv(GL_POINT_DISTANCE_ATTENUATION, aFactors);
     }},
    {"TheSumOfColours",
     [] {
         glEnable(GL_COLOR_SUM);
         glSecondaryColor3f(0.5f, 0.25f, 0.125f);
     },
     [] {
         GLdouble aColor[4] = {};
         glGetDoublev(GL_CURRENT_SECONDARY_COLOR, aColor);
         return HostValues{hostEnabled(GL_COLOR_SUM), aColor[0], aColor[1], aColor[2]};
     },
     [] {
         glDisable(GL_COLOR_SUM);
         glSecondaryColor3f(0, 0, 0);
     }},
    {"TheEnvironmentAndTheColour",
     [] {
         glTexEnvi(GL_TEXTURE_ENV, GL_TEXTURE_ENV_MODE, GL_BLEND);
         glColor4f(0.5f, 0.25f, 0.75f, 0.5f);
     },
     [] {
         GLint nMode = 0;
         glGetTexEnviv(GL_TEXTURE_ENV, GL_TEXTURE_ENV_MODE, &nMode);
         GLdouble aColor[4] = {};
         glGetDoublev(GL_CURRENT_COLOR, aColor);
         return HostValues{double(nMode), aColor[0], aColor[1], aColor[2], aColor[3]};
     },
     [] {
         glTexEnvi(GL_TEXTURE_ENV, GL_TEXTURE_ENV_MODE, GL_MODULATE);
         glColor4f(1, 1, 1, 1);
     }},
    {"TheBlendEquation", [] { glBlendEquationSeparate(GL_MIN, GL_MAX); },
     [] {
         return HostValues{hostInteger(GL_BLEND_EQUATION_RGB), hostInteger(GL_BLEND_EQUATION_ALPHA)};
     },
     [] { glBlendEquation(GL_FUNC_ADD); }},
    {"ClampedColours",
     [] {
         for (GLenum const target : {GL_CLAMP_VERTEX_COLOR, GL_CLAMP_FRAGMENT_COLOR, GL_CLAMP_READ_COLOR})
             glClampColor(target, GL_TRUE);
     },
     [] {
         return HostValues{hostInteger(GL_CLAMP_VERTEX_COLOR), hostInteger(GL_CLAMP_FRAGMENT_COLOR),
                           hostInteger(GL_CLAMP_READ_COLOR)};
     },
     [] {
         glClampColor(GL_CLAMP_VERTEX_COLOR, GL_TRUE);
         glClampColor(GL_CLAMP_FRAGMENT_COLOR, GL_FIXED_ONLY);
         glClampColor(GL_CLAMP_READ_COLOR, GL_FIXED_ONLY);
     }},
    {"Samplers",
     [] {
         float const aRed[] = {1, 0, 0, 1};
         glGenSamplers(1, aHostNames);
         glSamplerParameteri(aHostNames[0], GL_TEXTURE_WRAP_S, GL_MIRRORED_REPEAT);
         glSamplerParameteri(aHostNames[0], GL_TEXTURE_MIN_FILTER, GL_LINEAR);
         glSamplerParameteri(aHostNames[0], GL_TEXTURE_MAG_FILTER, GL_LINEAR);
         glSamplerParameterfv(aHostNames[0], GL_TEXTURE_BORDER_COLOR, aRed);
         glSamplerParameteri(aHostNames[0], GL_TEXTURE_WRAP_T, GL_CLAMP_TO_BORDER);
         for (GLuint const unit : {0U, 1U, 2U, 5U})
             glBindSampler(unit, aHostNames[0]);
     },
     [] {
         HostValues aBound;
         for (GLenum const unit : {GL_TEXTURE5, GL_TEXTURE2, GL_TEXTURE1, GL_TEXTURE0}) {
             glActiveTexture(unit);
             aBound.push_back(hostInteger(GL_SAMPLER_BINDING));
         }
         return aBound;
     },
     [] { glDeleteSamplers(1, aHostNames); }},
    {"AGenericArray",
     [] {
         glVertexAttribPointer(0, 4, GL_FLOAT, GL_FALSE, 0, aHostNowhere);
         glVertexAttribPointer(3, 4, GL_FLOAT, GL_FALSE, 0, aHostNowhere);
         glEnableVertexAttribArray(0);
         glEnableVertexAttribArray(3);
     },
     [] {
         HostValues aEnabled;
         for (GLuint const array : {0U, 3U}) {
             GLint nEnabled = 0;
             glGetVertexAttribiv(array, GL_VERTEX_ATTRIB_ARRAY_ENABLED, &nEnabled);
             aEnabled.push_back(nEnabled);
         }
         return aEnabled;
     },
     [] {
         glDisableVertexAttribArray(0);
         glDisableVertexAttribArray(3);
     }},
    {"ArraysThatNothingIsDrawnFrom",
     [] {
         glSecondaryColorPointer(3, GL_FLOAT, 0, aHostNowhere);
         glFogCoordPointer(GL_FLOAT, 0, aHostNowhere);
         for (GLenum const array : {GL_SECONDARY_COLOR_ARRAY, GL_FOG_COORD_ARRAY})
             glEnableClientState(array);
         for (GLenum const unit : {GL_TEXTURE3, GL_TEXTURE1}) {
             glClientActiveTexture(unit);
             glTexCoordPointer(4, GL_FLOAT, 0, aHostNowhere);
             glEnableClientState(GL_TEXTURE_COORD_ARRAY);
         }
     },
     [] {
         HostValues aValues{hostInteger(GL_CLIENT_ACTIVE_TEXTURE), hostEnabled(GL_SECONDARY_COLOR_ARRAY),
                            hostEnabled(GL_FOG_COORD_ARRAY)};
         for (GLenum const unit : {GL_TEXTURE3, GL_TEXTURE1}) {
             glClientActiveTexture(unit);
             aValues.push_back(hostEnabled(GL_TEXTURE_COORD_ARRAY));
         }
         return aValues;
     },
     [] {
         for (GLenum const array : {GL_SECONDARY_COLOR_ARRAY, GL_FOG_COORD_ARRAY})
             glDisableClientState(array);
         for (GLenum const unit : {GL_TEXTURE3, GL_TEXTURE1, GL_TEXTURE0}) {
             glClientActiveTexture(unit);
             glDisableClientState(GL_TEXTURE_COORD_ARRAY);
         }
     }},
    {"AVertexArrayObject",
     [] {
         glGenVertexArrays(1, aHostNames);
         glBindVertexArray(aHostNames[0]);
         glGenBuffers(1, aHostNames + 1);
         glBindBuffer(GL_ARRAY_BUFFER, aHostNames[1]);
         glBufferData(GL_ARRAY_BUFFER, sizeof aHostNowhere, aHostNowhere, GL_STATIC_DRAW);
         glVertexAttribPointer(0, 4, GL_FLOAT, GL_FALSE, 0, nullptr);
         glEnableVertexAttribArray(0);
         glEnableClientState(GL_NORMAL_ARRAY);
     },
     [] {
         GLint nEnabled = 0;
         glGetVertexAttribiv(0, GL_VERTEX_ATTRIB_ARRAY_ENABLED, &nEnabled);
         return HostValues{hostInteger(GL_VERTEX_ARRAY_BINDING), hostInteger(GL_ARRAY_BUFFER_BINDING),
                           double(nEnabled), hostEnabled(GL_NORMAL_ARRAY)};
     },
     [] {
         glBindVertexArray(0);
         glBindBuffer(GL_ARRAY_BUFFER, 0);
         glDeleteBuffers(1, aHostNames + 1);
         glDeleteVertexArrays(1, aHostNames);
     }},
    {"AProgramPipeline", [] { glBindProgramPipeline(pipelineOfRed()); },
     [] { return HostValues{hostInteger(GL_PROGRAM_PIPELINE_BINDING)}; },
     [] {
         glDeleteProgramPipelines(1, aHostNames);
         glDeleteProgram(aHostNames[1]);
     }},
    {"AssemblyPrograms",
     [] {
         glGenProgramsARB(2, aHostNames);
         loadAssembly(GL_VERTEX_PROGRAM_ARB, "!!ARBvp1.0\nMOV result.position, vertex.position;\nEND");
         loadAssembly(GL_FRAGMENT_PROGRAM_ARB, "!!ARBfp1.0\nMOV result.color, {1, 0, 0, 1};\nEND");
     },
     [] {
         return HostValues{hostEnabled(GL_VERTEX_PROGRAM_ARB), hostEnabled(GL_FRAGMENT_PROGRAM_ARB)};
     },
     [] {
         glDisable(GL_VERTEX_PROGRAM_ARB);
         glDisable(GL_FRAGMENT_PROGRAM_ARB);
         glDeleteProgramsARB(2, aHostNames);
     }},
    {"TheOriginOfClipSpace", [] { glClipControl(GL_UPPER_LEFT, GL_ZERO_TO_ONE); },
     [] {
         return HostValues{hostInteger(GL_CLIP_ORIGIN), hostInteger(GL_CLIP_DEPTH_MODE)};
     },
     [] { glClipControl(GL_LOWER_LEFT, GL_NEGATIVE_ONE_TO_ONE); }},
    {"TheLastClipPlane",
     [] {
         double const aNothing[] = {0, 0, 0, -1};
         auto const last = GLenum(GL_CLIP_PLANE0 + hostInteger(GL_MAX_CLIP_PLANES) - 1);
         glClipPlane(last, aNothing);
         glEnable(last);
     },
     [] { return HostValues{hostEnabled(GLenum(GL_CLIP_PLANE0 + hostInteger(GL_MAX_CLIP_PLANES) - 1))}; },
     [] { glDisable(GLenum(GL_CLIP_PLANE0 + hostInteger(GL_MAX_CLIP_PLANES) - 1)); }},
    {"NoRasterisation", [] { glEnable(GL_RASTERIZER_DISCARD); },
     [] { return HostValues{hostEnabled(GL_RASTERIZER_DISCARD)}; }, [] { glDisable(GL_RASTERIZER_DISCARD); }},
    {"TheTransferOfPixels",
     [] {
         float const aMap[] = {1, 0};
         for (GLenum const scale : {GL_RED_SCALE, GL_GREEN_SCALE, GL_BLUE_SCALE, GL_ALPHA_SCALE})
             glPixelTransferf(scale, 0.5f);
         for (GLenum const bias : {GL_RED_BIAS, GL_GREEN_BIAS, GL_BLUE_BIAS, GL_ALPHA_BIAS})
             glPixelTransferf(bias, 0.125f);
         glPixelMapfv(GL_PIXEL_MAP_R_TO_R, 2, aMap);
         glPixelTransferi(GL_MAP_COLOR, GL_TRUE);
     },
     [] {
         return HostValues{hostNumber(GL_RED_SCALE),  hostNumber(GL_ALPHA_SCALE),
                           hostNumber(GL_GREEN_BIAS), hostNumber(GL_BLUE_BIAS),
                           hostInteger(GL_MAP_COLOR), hostInteger(GL_PIXEL_MAP_R_TO_R_SIZE)};
     },
     [] {
         float const aMap[] = {0};
         for (GLenum const scale : {GL_RED_SCALE, GL_GREEN_SCALE, GL_BLUE_SCALE, GL_ALPHA_SCALE})
             glPixelTransferf(scale, 1);
         for (GLenum const bias : {GL_RED_BIAS, GL_GREEN_BIAS, GL_BLUE_BIAS, GL_ALPHA_BIAS})
             glPixelTransferf(bias, 0);
         glPixelMapfv(GL_PIXEL_MAP_R_TO_R, 1, aMap);
         glPixelTransferi(GL_MAP_COLOR, GL_FALSE);
     }},
    {"TheStoreOfPixels",
     [] {
         for (GLenum const name : {GL_UNPACK_SWAP_BYTES, GL_PACK_SWAP_BYTES, GL_UNPACK_LSB_FIRST})
             glPixelStorei(name, GL_TRUE);
         for (GLenum const name : {GL_UNPACK_ROW_LENGTH, GL_PACK_ROW_LENGTH})
             glPixelStorei(name, 40);
         for (GLenum const name :
              {GL_UNPACK_SKIP_PIXELS, GL_UNPACK_SKIP_ROWS, GL_PACK_SKIP_PIXELS, GL_PACK_SKIP_ROWS})
             glPixelStorei(name, 1);
         for (GLenum const name : {GL_UNPACK_ALIGNMENT, GL_PACK_ALIGNMENT})
             glPixelStorei(name, 8);
     },
     [] {
         return HostValues{hostInteger(GL_UNPACK_SWAP_BYTES), hostInteger(GL_PACK_SWAP_BYTES),
                           hostInteger(GL_UNPACK_ROW_LENGTH), hostInteger(GL_PACK_ROW_LENGTH),
                           hostInteger(GL_PACK_SKIP_ROWS),    hostInteger(GL_PACK_ALIGNMENT)};
     },
     [] {
         for (GLenum const name : {GL_UNPACK_SWAP_BYTES, GL_PACK_SWAP_BYTES, GL_UNPACK_LSB_FIRST})
             glPixelStorei(name, GL_FALSE);
         for (GLenum const name : {GL_UNPACK_ROW_LENGTH, GL_PACK_ROW_LENGTH, GL_UNPACK_SKIP_PIXELS,
                                   GL_UNPACK_SKIP_ROWS, GL_PACK_SKIP_PIXELS, GL_PACK_SKIP_ROWS})
             glPixelStorei(name, 0);
         for (GLenum const name : {GL_UNPACK_ALIGNMENT, GL_PACK_ALIGNMENT})
             glPixelStorei(name, 4);
     }},
    {"BuffersOfPixels",
     [] {
         glGenBuffers(2, aHostNames);
         glBindBuffer(GL_PIXEL_UNPACK_BUFFER, aHostNames[0]);
         glBufferData(GL_PIXEL_UNPACK_BUFFER, 4, nullptr, GL_STREAM_DRAW);
         glBindBuffer(GL_PIXEL_PACK_BUFFER, aHostNames[1]);
         glBufferData(GL_PIXEL_PACK_BUFFER, 4, nullptr, GL_STREAM_READ);
     },
     [] {
         return HostValues{hostInteger(GL_PIXEL_UNPACK_BUFFER_BINDING),
                           hostInteger(GL_PIXEL_PACK_BUFFER_BINDING)};
     },
     [] {
         glBindBuffer(GL_PIXEL_UNPACK_BUFFER, 0);
         glBindBuffer(GL_PIXEL_PACK_BUFFER, 0);
         glDeleteBuffers(2, aHostNames);
     }},
    {"WhatCoversSamples",
     [] {
         for (GLenum const name : {GL_SAMPLE_ALPHA_TO_COVERAGE, GL_SAMPLE_ALPHA_TO_ONE, GL_SAMPLE_COVERAGE,
                                   GL_SAMPLE_MASK, GL_SAMPLE_SHADING})
             glEnable(name);
         glSampleCoverage(0.0f, GL_FALSE);
         glSampleMaski(0, 0);
     },
     [] {
         return HostValues{hostEnabled(GL_SAMPLE_ALPHA_TO_ONE), hostEnabled(GL_SAMPLE_MASK),
                           hostNumber(GL_SAMPLE_COVERAGE_VALUE)};
     },
     [] {
         for (GLenum const name : {GL_SAMPLE_ALPHA_TO_COVERAGE, GL_SAMPLE_ALPHA_TO_ONE, GL_SAMPLE_COVERAGE,
                                   GL_SAMPLE_MASK, GL_SAMPLE_SHADING})
             glDisable(name);
         glSampleCoverage(1.0f, GL_FALSE);
         glSampleMaski(0, ~0U);
     }},
    {"HowLinesAndPolygonsAreDrawn",
     [] {
         glPolygonStipple(aHostStipple);
         for (GLenum const name : {GL_POLYGON_STIPPLE, GL_LINE_STIPPLE, GL_POLYGON_SMOOTH, GL_LINE_SMOOTH,
                                   GL_POLYGON_OFFSET_FILL, GL_CULL_FACE})
             glEnable(name);
         glPolygonMode(GL_FRONT_AND_BACK, GL_LINE);
         glShadeModel(GL_FLAT);
         glCullFace(GL_FRONT_AND_BACK);
     },
     [] {
         return HostValues{hostEnabled(GL_POLYGON_STIPPLE), hostEnabled(GL_POLYGON_SMOOTH),
                           hostInteger(GL_SHADE_MODEL)};
     },
     [] {
         for (GLenum const name : {GL_POLYGON_STIPPLE, GL_LINE_STIPPLE, GL_POLYGON_SMOOTH, GL_LINE_SMOOTH,
                                   GL_POLYGON_OFFSET_FILL, GL_CULL_FACE})
             glDisable(name);
         glPolygonMode(GL_FRONT_AND_BACK, GL_FILL);
         glShadeModel(GL_SMOOTH);
         glCullFace(GL_BACK);
     }},
    {"ALogicOperation",
     [] {
         glEnable(GL_COLOR_LOGIC_OP);
         glLogicOp(GL_CLEAR);
     },
     [] {
         return HostValues{hostEnabled(GL_COLOR_LOGIC_OP), hostInteger(GL_LOGIC_OP_MODE)};
     },
     [] {
         glDisable(GL_COLOR_LOGIC_OP);
         glLogicOp(GL_COPY);
     }},
    {"FramebuffersOfSRGB", [] { glEnable(GL_FRAMEBUFFER_SRGB); },
     [] { return HostValues{hostEnabled(GL_FRAMEBUFFER_SRGB)}; }, [] { glDisable(GL_FRAMEBUFFER_SRGB); }},
    {"ClampedDepthAndRestart",
     [] {
         glEnable(GL_DEPTH_CLAMP);
         glEnable(GL_PRIMITIVE_RESTART);
         glPrimitiveRestartIndex(0);
         glDisable(GL_DITHER);
         glDepthRange(0.75, 0.25);
     },
     [] {
         return HostValues{hostEnabled(GL_DEPTH_CLAMP), hostEnabled(GL_PRIMITIVE_RESTART),
                           hostEnabled(GL_DITHER)};
     },
     [] {
         glDisable(GL_DEPTH_CLAMP);
         glDisable(GL_PRIMITIVE_RESTART);
         glEnable(GL_DITHER);
         glDepthRange(0, 1);
     }},
};

class HostSettingsTest : public ShaderFlowTest {
protected:
    void expectNoEffect();
};

void HostSettingsTest::expectNoEffect() {
    constexpr char const* aRoads[] = {"fixed function", "shader", "bilateral filter", "bytes", "floats"};
    AllRoads ownRoads(frameContext());
    ownRoads.launch();
    std::vector<HostValues> const aExpected = ownRoads.values();
    AllRoads hostRoads(context());
    for (HostSetting const& setting : aHostSettings) {
        SCOPED_TRACE(setting.pName_);
        setting.pSet_();
        ASSERT_EQ(GLenum(GL_NO_ERROR), glGetError());
        HostValues const aBefore = setting.pGet_();
        bool bRan = false;
        EXPECT_NO_THROW(hostRoads.launch(); bRan = true);
        EXPECT_EQ(aBefore, setting.pGet_());
        setting.pReset_();
        ASSERT_EQ(GLenum(GL_NO_ERROR), glGetError());
        if (!bRan)
            continue;
        // Looked at without the setting, which might change what is read back.
        std::vector<HostValues> const aActual = hostRoads.values();
        ASSERT_EQ(aExpected.size(), aActual.size());
        for (std::size_t i = 0; i < aExpected.size(); ++i)
            EXPECT_TRUE(aExpected[i] == aActual[i]) << aRoads[i];
    }
}

TEST_F(HostSettingsTest, ChangeNoPixelAndStayAsTheyAre) { expectNoEffect(); }

TEST_F(HostSettingsTest, DoSoAlsoWhereOnlyExtensionsHaveThem) {
    OGL::ExtensionManager::Instance()->overrideVersion(2, 1);
    expectNoEffect();
}

} // namespace
