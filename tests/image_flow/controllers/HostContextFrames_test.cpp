// Frames that run in the host's own context: its state is what it was, also after a frame that failed.
#include "tests/image_flow/support/ShaderRoad.h"

#include "orvo/core/Check.h"
#include "orvo/ogl/Texture2D.h"
#include "tests/support/Expect.h"
#include "tests/support/gl/GLState.h"

namespace ORVO {

namespace {

using namespace Test;

class HostContextFramesTest : public ShaderFlowTest {
protected:
    /// Sets all that a pass sets to something else.
    void makeStateOdd() {
        glPushAttrib(GL_ALL_ATTRIB_BITS);
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
        glActiveTexture(GL_TEXTURE1);
        glViewport(1, 2, 3, 4);
        for (GLenum const mode : {GL_PROJECTION, GL_MODELVIEW, GL_TEXTURE}) {
            glMatrixMode(mode);
            glPushMatrix();
            glTranslatef(1.0f, 2.0f, 3.0f);
        }
        char const* pText = "void main() { gl_FragColor = vec4(1.0); }";
        pProgram_ = std::make_unique<OGL::Program>();
        pProgram_->loadFragmentShader(1, &pText, nullptr);
        pProgram_->link(true);
        pProgram_->enable();
    }

    void makeStateNormal() {
        pProgram_->disable();
        pProgram_.reset();
        for (GLenum const mode : {GL_PROJECTION, GL_MODELVIEW, GL_TEXTURE}) {
            glMatrixMode(mode);
            glPopMatrix();
        }
        pTexture_.reset();
        glBindFramebuffer(GL_FRAMEBUFFER, 0);
        glDeleteFramebuffers(2, aFramebuffers_.data());
        glPopAttrib();
    }

private:
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

} // namespace

} // namespace ORVO
