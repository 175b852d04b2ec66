#include "orvo/image_flow/controllers/FrameState.h"

#include "orvo/ogl/Context.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/Program.h"
#include "orvo/ogl/TextureRECT.h"
#include "orvo/ogl/internal/GL.h"
#include "orvo/ogl/internal/Scopes.h"

#include <algorithm>

namespace ORVO {

namespace {

using OGL::Internal::integerState;

constexpr GLbitfield nSavedAttributes = GL_TEXTURE_BIT | GL_ENABLE_BIT | GL_TRANSFORM_BIT | GL_VIEWPORT_BIT |
                                        GL_COLOR_BUFFER_BIT | GL_CURRENT_BIT | GL_POINT_BIT | GL_POLYGON_BIT |
                                        GL_SCISSOR_BIT;

constexpr std::array<GLenum, 3> aClampTargets{GL_CLAMP_VERTEX_COLOR, GL_CLAMP_FRAGMENT_COLOR,
                                              GL_CLAMP_READ_COLOR};

void activateUnit(std::size_t nUnit) noexcept {
    OGL::ExtensionManager::Instance()->table()->glActiveTexture(GL_TEXTURE0 + static_cast<GLenum>(nUnit));
}

void bindFramebuffer(GLenum target, int nName) noexcept {
    OGL::ExtensionManager::Instance()->table()->glBindFramebuffer(target, static_cast<GLuint>(nName));
}

void bindBuffer(GLenum target, int nName) noexcept {
    OGL::ExtensionManager::Instance()->table()->glBindBuffer(target, static_cast<GLuint>(nName));
}

void disableAll(std::initializer_list<GLenum> const& aCapabilities) noexcept {
    for (GLenum const capability : aCapabilities) {
        glDisable(capability);
    }
}

} // namespace

FrameState::Driver::Driver() {
    OGL::ExtensionManager const& manager = *OGL::ExtensionManager::Instance();
    bRectangles_ = OGL::TextureRECT::isSupported();
    bPrograms_ = OGL::Program::isSupported();
    bVertexAssembly_ = manager.isSupported(OGL::EXTENSION_ARB_VERTEX_PROGRAM);
    bFragmentAssembly_ = manager.isSupported(OGL::EXTENSION_ARB_FRAGMENT_PROGRAM);
    bSeparateFramebuffers_ = manager.isSupported(OGL::EXTENSION_ARB_FRAMEBUFFER_OBJECT);
    bPixelBuffers_ = manager.isSupported(OGL::EXTENSION_ARB_PIXEL_BUFFER_OBJECT) ||
                     manager.isSupported(OGL::EXTENSION_EXT_PIXEL_BUFFER_OBJECT);
    nVersion_ = 10 * manager.majorVersion() + manager.minorVersion();
    bClampedColors_ = nVersion_ >= 30 || epoxy_has_gl_extension("GL_ARB_color_buffer_float");
    bDiscards_ = nVersion_ >= 30 || epoxy_has_gl_extension("GL_EXT_transform_feedback");
    bSamplers_ = nVersion_ >= 33 || epoxy_has_gl_extension("GL_ARB_sampler_objects");
    bPipelines_ = nVersion_ >= 41 || epoxy_has_gl_extension("GL_ARB_separate_shader_objects");
    bClipControl_ = nVersion_ >= 45 || epoxy_has_gl_extension("GL_ARB_clip_control");
}

FrameState::FrameState(OGL::Context const& context) : context_(context) {
    save();
    makeDrawingPlain();
    makeUnitsPlain();
    makeArraysPlain();
}

FrameState::~FrameState() {
    try {
        // A failed frame may have left another one current.
        context_.makeCurrent();
    } catch (...) { // The context went away during the frame, and its state with it.
        return;
    }
    restore();
}

void FrameState::save() {
    glPushAttrib(nSavedAttributes);
    glPushClientAttrib(GL_CLIENT_VERTEX_ARRAY_BIT);
    glGetDoublev(GL_PROJECTION_MATRIX, aProjection_.data());
    glGetDoublev(GL_MODELVIEW_MATRIX, aModelview_.data());
    activateUnit(0);
    glGetDoublev(GL_TEXTURE_MATRIX, aTexture_.data());
    glGetDoublev(GL_CURRENT_COLOR, aColor_.data());
    bSumsColors_ = glIsEnabled(GL_COLOR_SUM) == GL_TRUE;
    nDraw_ = integerState(GL_FRAMEBUFFER_BINDING);
    if (oDriver_.bSeparateFramebuffers_) {
        nRead_ = integerState(GL_READ_FRAMEBUFFER_BINDING);
    }
    if (oDriver_.bPrograms_) {
        nProgram_ = integerState(GL_CURRENT_PROGRAM);
    }
    if (oDriver_.bPixelBuffers_) {
        nUnpackBuffer_ = integerState(GL_PIXEL_UNPACK_BUFFER_BINDING);
        nPackBuffer_ = integerState(GL_PIXEL_PACK_BUFFER_BINDING);
    }
    if (oDriver_.bClampedColors_) {
        std::transform(aClampTargets.begin(), aClampTargets.end(), aClamps_.begin(), &integerState);
    }
    if (oDriver_.bDiscards_) {
        bDiscards_ = glIsEnabled(GL_RASTERIZER_DISCARD) == GL_TRUE;
    }
    if (oDriver_.bPipelines_) {
        nPipeline_ = integerState(GL_PROGRAM_PIPELINE_BINDING);
    }
}

void FrameState::makeDrawingPlain() {
    disableAll({GL_ALPHA_TEST, GL_BLEND, GL_COLOR_LOGIC_OP, GL_COLOR_SUM, GL_CULL_FACE, GL_DEPTH_TEST, GL_FOG,
                GL_LIGHTING, GL_POINT_SMOOTH, GL_POLYGON_SMOOTH, GL_POLYGON_STIPPLE, GL_SCISSOR_TEST,
                GL_STENCIL_TEST});
    for (int i = integerState(GL_MAX_CLIP_PLANES); i-- > 0;) {
        glDisable(GL_CLIP_PLANE0 + static_cast<GLenum>(i));
    }
    glColorMask(GL_TRUE, GL_TRUE, GL_TRUE, GL_TRUE);
    glColor4f(1.0F, 1.0F, 1.0F, 1.0F);
    glPolygonMode(GL_FRONT_AND_BACK, GL_FILL);
    glBlendEquation(GL_FUNC_ADD);
    glPointSize(1.0F);
    glPointParameterf(GL_POINT_SIZE_MIN, 0.0F);
    if (oDriver_.bPrograms_) {
        glUseProgram(0);
    }
    if (oDriver_.bVertexAssembly_) {
        glDisable(GL_VERTEX_PROGRAM_ARB);
    }
    if (oDriver_.bFragmentAssembly_) {
        glDisable(GL_FRAGMENT_PROGRAM_ARB);
    }
    if (oDriver_.nVersion_ >= 20) {
        disableAll({GL_POINT_SPRITE, GL_VERTEX_PROGRAM_POINT_SIZE});
    }
    if (oDriver_.bClampedColors_) {
        OGL::Internal::clampNoFloats();
    }
    if (oDriver_.bDiscards_) {
        glDisable(GL_RASTERIZER_DISCARD);
    }
    if (nPipeline_ != 0) {
        glBindProgramPipeline(0);
    }
    if (oDriver_.bClipControl_) {
        glClipControl(GL_LOWER_LEFT, GL_NEGATIVE_ONE_TO_ONE);
    }
}

void FrameState::makeUnitsPlain() {
    // Passes without a program of their own see all of fixed function.
    auto const nFixed = static_cast<std::size_t>(integerState(GL_MAX_TEXTURE_UNITS));
    if (oDriver_.bSamplers_) {
        nUnits_ = std::min(static_cast<std::size_t>(integerState(GL_MAX_TEXTURE_IMAGE_UNITS)), nMostUnits_);
    }
    for (std::size_t i = std::max(nFixed, nUnits_); i-- > 0;) {
        activateUnit(i);
        if (i < nUnits_) {
            aSamplers_[i] = integerState(GL_SAMPLER_BINDING);
            if (aSamplers_[i] != 0) {
                glBindSampler(static_cast<GLuint>(i), 0);
            }
        }
        if (i < nFixed) {
            disableAll({GL_TEXTURE_1D, GL_TEXTURE_2D, GL_TEXTURE_3D, GL_TEXTURE_CUBE_MAP, GL_TEXTURE_GEN_S,
                        GL_TEXTURE_GEN_T, GL_TEXTURE_GEN_R, GL_TEXTURE_GEN_Q});
            if (oDriver_.bRectangles_) {
                glDisable(GL_TEXTURE_RECTANGLE);
            }
        }
    }
    glTexEnvi(GL_TEXTURE_ENV, GL_TEXTURE_ENV_MODE, GL_MODULATE);
    glMatrixMode(GL_TEXTURE);
    glLoadIdentity();
}

void FrameState::makeArraysPlain() const {
    // A driver may fetch from all that are enabled, also where a frame draws more vertices than they have.
    for (GLenum const array :
         {GL_COLOR_ARRAY, GL_EDGE_FLAG_ARRAY, GL_INDEX_ARRAY, GL_NORMAL_ARRAY, GL_VERTEX_ARRAY}) {
        glDisableClientState(array);
    }
    if (oDriver_.nVersion_ >= 14) {
        glDisableClientState(GL_SECONDARY_COLOR_ARRAY);
        glDisableClientState(GL_FOG_COORD_ARRAY);
    }
    for (int i = integerState(oDriver_.nVersion_ >= 20 ? GL_MAX_TEXTURE_COORDS : GL_MAX_TEXTURE_UNITS);
         i-- > 0;) {
        glClientActiveTexture(GL_TEXTURE0 + static_cast<GLenum>(i));
        glDisableClientState(GL_TEXTURE_COORD_ARRAY);
    }
    // The first of the generic ones would take the place of the vertices.
    for (int i = oDriver_.nVersion_ >= 20 ? integerState(GL_MAX_VERTEX_ATTRIBS) : 0; i-- > 0;) {
        glDisableVertexAttribArray(static_cast<GLuint>(i));
    }
    if (nUnpackBuffer_ != 0) {
        bindBuffer(GL_PIXEL_UNPACK_BUFFER, 0);
    }
    if (nPackBuffer_ != 0) {
        bindBuffer(GL_PIXEL_PACK_BUFFER, 0);
    }
}

void FrameState::restore() const noexcept {
    if (oDriver_.bPrograms_) {
        glUseProgram(static_cast<GLuint>(nProgram_));
    }
    if (nPipeline_ != 0) {
        glBindProgramPipeline(static_cast<GLuint>(nPipeline_));
    }
    if (oDriver_.bClampedColors_) {
        for (std::size_t i = 0; i < aClampTargets.size(); ++i) {
            glClampColor(aClampTargets[i], static_cast<GLenum>(aClamps_[i]));
        }
    }
    if (bDiscards_) {
        glEnable(GL_RASTERIZER_DISCARD);
    }
    if (nUnpackBuffer_ != 0) {
        bindBuffer(GL_PIXEL_UNPACK_BUFFER, nUnpackBuffer_);
    }
    if (nPackBuffer_ != 0) {
        bindBuffer(GL_PIXEL_PACK_BUFFER, nPackBuffer_);
    }
    for (std::size_t i = 0; i < nUnits_; ++i) {
        if (aSamplers_[i] != 0) {
            glBindSampler(static_cast<GLuint>(i), static_cast<GLuint>(aSamplers_[i]));
        }
    }
    bindFramebuffer(oDriver_.bSeparateFramebuffers_ ? GL_DRAW_FRAMEBUFFER : GL_FRAMEBUFFER, nDraw_);
    if (oDriver_.bSeparateFramebuffers_) {
        bindFramebuffer(GL_READ_FRAMEBUFFER, nRead_);
    }
    activateUnit(0);
    glMatrixMode(GL_TEXTURE);
    glLoadMatrixd(aTexture_.data());
    glMatrixMode(GL_PROJECTION);
    glLoadMatrixd(aProjection_.data());
    glMatrixMode(GL_MODELVIEW);
    glLoadMatrixd(aModelview_.data());
    glPopClientAttrib();
    glPopAttrib();
    // A driver may keep the colour of the vertices that it has yet to draw, which then comes after the pop,
    // and may save the sum of colours with the fog, or with nothing.
    glColor4dv(aColor_.data());
    if (bSumsColors_) {
        glEnable(GL_COLOR_SUM);
    }
}

} // namespace ORVO
