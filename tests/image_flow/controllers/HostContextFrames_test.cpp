// Frames that run in the host's own context: its state is what it was, also after a frame that failed.
#include "tests/image_flow/support/GPUBilateralReference.h"
#include "tests/image_flow/support/ShaderRoad.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/filters/FastBilateralFilterGPU.h"
#include "orvo/ogl/Texture2D.h"
#include "tests/support/Expect.h"
#include "tests/support/gl/GLState.h"

namespace ORVO {

namespace {

using namespace Test;

/// Two for each pixel of the pictures, and more.
std::array<float, 256> aGenericVertices{};

/// One setting of a host that points, sums or what is read back would show.
struct HostPointState {
    char const* pName_;
    void (*pSet_)();
};

constexpr HostPointState aPointStates[] = {
    {"blend equation", [] { glBlendEquationSeparate(GL_FUNC_REVERSE_SUBTRACT, GL_MIN); }},
    {"blend equation of colours", [] { glBlendEquation(GL_MAX); }},
    {"swapped bytes", [] { glPixelStorei(GL_PACK_SWAP_BYTES, GL_TRUE); }},
    {"point sprites",
     [] {
         glActiveTexture(GL_TEXTURE0);
         glTexEnvi(GL_POINT_SPRITE, GL_COORD_REPLACE, GL_TRUE);
         glEnable(GL_POINT_SPRITE);
         glActiveTexture(GL_TEXTURE1);
     }},
    {"generic array 0",
     [] {
         glVertexAttribPointer(0, 2, GL_FLOAT, GL_FALSE, 0, aGenericVertices.data());
         glEnableVertexAttribArray(0);
         glVertexAttribPointer(3, 2, GL_FLOAT, GL_FALSE, 0, aGenericVertices.data());
         glEnableVertexAttribArray(3);
     }},
};

class HostContextFramesTest : public ShaderFlowTest {
protected:
    /// Sets all that a pass sets to something else.
    void makeStateOdd() {
        glPushAttrib(GL_ALL_ATTRIB_BITS);
        glPushClientAttrib(GL_CLIENT_ALL_ATTRIB_BITS);
        glGenFramebuffers(2, aFramebuffers_.data());
        glBindFramebuffer(GL_DRAW_FRAMEBUFFER, aFramebuffers_[0]);
        glBindFramebuffer(GL_READ_FRAMEBUFFER, aFramebuffers_[1]);
        pTexture_ =
            std::make_unique<OGL::Texture2D>(OGL::Texture::INTERNAL_FORMAT_RGBA8, 2, 2, false, nullptr);
        for (GLenum const unit : {GL_TEXTURE0, GL_TEXTURE1, GL_TEXTURE2}) {
            glActiveTexture(unit);
            glBindTexture(GL_TEXTURE_2D, pTexture_->objectID());
        }
        glEnable(GL_TEXTURE_2D);
        glActiveTexture(GL_TEXTURE0);
        glMatrixMode(GL_TEXTURE);
        glPushMatrix();
        glTranslatef(0.25f, 0.5f, 0.0f);
        glEnable(GL_TEXTURE_GEN_S);
        glActiveTexture(GL_TEXTURE1);
        glViewport(1, 2, 3, 4);
        for (GLenum const mode : {GL_PROJECTION, GL_MODELVIEW, GL_TEXTURE}) {
            glMatrixMode(mode);
            glPushMatrix();
            glTranslatef(1.0f, 2.0f, 3.0f);
        }
        glEnable(GL_SCISSOR_TEST);
        glScissor(0, 0, 1, 1);
        glEnable(GL_BLEND);
        glBlendFunc(GL_ZERO, GL_SRC_ALPHA);
        glEnable(GL_ALPHA_TEST);
        glAlphaFunc(GL_NEVER, 0.0f);
        glColorMask(GL_FALSE, GL_TRUE, GL_FALSE, GL_TRUE);
        glClearColor(0.1f, 0.2f, 0.3f, 0.4f);
        glColor4f(0.5f, 0.25f, 0.75f, 1.0f);
        glPointSize(5.0f);
        glEnable(GL_VERTEX_PROGRAM_POINT_SIZE);
        for (HostPointState const& state : aPointStates) {
            state.pSet_();
        }
        std::array<double, 4> const aNothing{0.0, 0.0, 0.0, -1.0};
        glClipPlane(GL_CLIP_PLANE3, aNothing.data());
        glEnable(GL_CLIP_PLANE3);
        glEnableClientState(GL_NORMAL_ARRAY);
        glVertexPointer(3, GL_FLOAT, 12, aVertices_.data());
        char const* pText = "void main() { gl_FragColor = vec4(1.0); }";
        pProgram_ = std::make_unique<OGL::Program>();
        pProgram_->loadFragmentShader(1, &pText, nullptr);
        pProgram_->link(true);
        pProgram_->enable();
    }

    void makeStateNormal() {
        pProgram_->disable();
        pProgram_.reset();
        glPopClientAttrib();
        for (GLenum const mode : {GL_PROJECTION, GL_MODELVIEW, GL_TEXTURE}) {
            glMatrixMode(mode);
            glPopMatrix();
        }
        glActiveTexture(GL_TEXTURE0);
        glPopMatrix();
        pTexture_.reset();
        glBindFramebuffer(GL_FRAMEBUFFER, 0);
        glDeleteFramebuffers(2, aFramebuffers_.data());
        glPopAttrib();
    }

    static std::array<float, 16> textureMatrix() {
        std::array<float, 16> aMatrix{};
        glActiveTexture(GL_TEXTURE0);
        glGetFloatv(GL_TEXTURE_MATRIX, aMatrix.data());
        glActiveTexture(GL_TEXTURE1);
        return aMatrix;
    }

    static GLvoid* vertexPointer() {
        GLvoid* pVertices = nullptr;
        glGetPointerv(GL_VERTEX_ARRAY_POINTER, &pVertices);
        return pVertices;
    }

private:
    std::array<float, 3> aVertices_{};
    std::array<GLuint, 2> aFramebuffers_{};
    std::unique_ptr<OGL::Texture2D> pTexture_;
    std::unique_ptr<OGL::Program> pProgram_;
};

TEST_F(HostContextFramesTest, LeaveTheStateAsItWas) {
    PositionExtentInPixelSpace const region = pixels(0, 0, 5, 3);
    ImageGPUPtr const upInput = textureImage(region, ImageGPU::PIXEL_FORMAT_RGBA8);
    ShaderNode node(shaderOf({"src"}, readInput("src")), {"src"});
    ShaderRoad road(context(), node);
    road.setInput(0, *upInput);
    for (bool const bThrow : {false, true}) {
        node.onPreProcessed_ = [bThrow] { ORVO_CHECK(!bThrow, "in between"); };
        makeStateOdd();
        GLState const before = GLState::capture();
        if (bThrow) {
            ORVO_EXPECT_INTERNAL(road.run(world(0, 0, 5, 3)), "in between");
        } else {
            EXPECT_NE(nullptr, road.run(world(0, 0, 5, 3)));
        }
        EXPECT_EQ("", before.differencesTo(GLState::capture())) << bThrow;
        makeStateNormal();
    }
}

TEST_F(HostContextFramesTest, TheBilateralFilterSeesNothingOfTheHostsStateAndPutsItBack) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 9, 7), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    FastBilateralFilterGPU filter;
    filter.spatialSigma().setValue(float2(2.0f, 2.0f));
    ShaderRoad road(context(), filter);
    road.setInput(0, *upInput);
    Texels const plain(*road.run(world(0, 0, 9, 7)));
    makeStateOdd();
    GLState const before = GLState::capture();
    GLvoid const* const pVertices = vertexPointer();
    std::array<float, 16> const aMatrix = textureMatrix();
    ImageGPU const* const pResult = road.run(world(0, 0, 9, 7));
    EXPECT_EQ("", before.differencesTo(GLState::capture()));
    EXPECT_EQ(pVertices, vertexPointer());
    EXPECT_EQ(aMatrix, textureMatrix());
    makeStateNormal();
    EXPECT_EQ(0.0, gpuBilateral::largestDifference(Texels(*pResult), plain, false));
}

TEST_F(HostContextFramesTest, TheBilateralFiltersPointsAreThoseOfEveryHost) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 9, 7), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    FastBilateralFilterGPU filter;
    filter.spatialSigma().setValue(float2(2.0f, 2.0f));
    filter.colorize().setValue(true);
    ShaderRoad road(context(), filter);
    road.setInput(0, *upInput);
    Texels const plain(*road.run(world(0, 0, 9, 7)));
    for (HostPointState const& state : aPointStates) {
        SCOPED_TRACE(state.pName_);
        glPushAttrib(GL_ALL_ATTRIB_BITS);
        glPushClientAttrib(GL_CLIENT_ALL_ATTRIB_BITS);
        glActiveTexture(GL_TEXTURE1);
        state.pSet_();
        GLState const before = GLState::capture();
        ImageGPU const* const pResult = road.run(world(0, 0, 9, 7));
        EXPECT_EQ("", before.differencesTo(GLState::capture()));
        glPopClientAttrib();
        glPopAttrib();
        EXPECT_EQ(0.0, gpuBilateral::largestDifference(Texels(*pResult), plain, false));
    }
}

TEST_F(HostContextFramesTest, ABilateralFilterThatFailsPutsTheHostsStateBack) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 9, 7), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    FastBilateralFilterGPU filter;
    filter.spatialSigma().setValue(float2(2.0f, 2.0f));
    ShaderRoad road(context(), filter);
    road.setInput(0, *upInput);
    Texels const plain(*road.run(world(0, 0, 9, 7)));
    bool bMore = true;
    for (std::uint64_t n = 1; bMore; ++n) {
        ASSERT_LT(n, 200U);
        makeStateOdd();
        GLState const before = GLState::capture();
        std::string sFailed;
        {
            GLCallFailure const failure(n);
            try {
                road.run(world(0, 0, 9, 7));
            } catch (OGL::ExceptionOGL const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            bMore = failure.hasFired();
            sFailed = failure.name();
        }
        EXPECT_EQ("", before.differencesTo(GLState::capture())) << sFailed;
        makeStateNormal();
        Texels const after(*road.run(world(0, 0, 9, 7)));
        EXPECT_EQ(0.0, gpuBilateral::largestDifference(after, plain, false)) << sFailed;
    }
}

} // namespace

} // namespace ORVO
