#include "tests/support/gl/GLState.h"

#include <epoxy/gl.h>

#include <algorithm>
#include <sstream>

namespace ORVO::Test {

namespace {

struct Query {
    char const* pName_;
    GLenum nToken_;
    int nValues_;
};

#define QUERY(token, n)                                                                                      \
    { #token, token, n }

constexpr Query aQueries[] = {
    QUERY(GL_ACTIVE_TEXTURE, 1),
    QUERY(GL_CLIENT_ACTIVE_TEXTURE, 1),
    QUERY(GL_MATRIX_MODE, 1),
    QUERY(GL_MODELVIEW_MATRIX, 16),
    QUERY(GL_PROJECTION_MATRIX, 16),
    QUERY(GL_MODELVIEW_STACK_DEPTH, 1),
    QUERY(GL_PROJECTION_STACK_DEPTH, 1),
    QUERY(GL_ATTRIB_STACK_DEPTH, 1),
    QUERY(GL_CLIENT_ATTRIB_STACK_DEPTH, 1),
    QUERY(GL_VIEWPORT, 4),
    QUERY(GL_SCISSOR_BOX, 4),
    QUERY(GL_COLOR_CLEAR_VALUE, 4),
    QUERY(GL_CURRENT_COLOR, 4),
    QUERY(GL_COLOR_WRITEMASK, 4),
    QUERY(GL_BLEND_SRC, 1),
    QUERY(GL_BLEND_DST, 1),
    QUERY(GL_BLEND_SRC_ALPHA, 1),
    QUERY(GL_BLEND_DST_ALPHA, 1),
    QUERY(GL_BLEND_EQUATION_RGB, 1),
    QUERY(GL_BLEND_EQUATION_ALPHA, 1),
    QUERY(GL_POINT_SIZE, 1),
    QUERY(GL_CURRENT_PROGRAM, 1),
    QUERY(GL_DRAW_FRAMEBUFFER_BINDING, 1),
    QUERY(GL_READ_FRAMEBUFFER_BINDING, 1),
    QUERY(GL_RENDERBUFFER_BINDING, 1),
    QUERY(GL_READ_BUFFER, 1),
    QUERY(GL_DRAW_BUFFER, 1),
    QUERY(GL_ARRAY_BUFFER_BINDING, 1),
    QUERY(GL_ELEMENT_ARRAY_BUFFER_BINDING, 1),
    QUERY(GL_PIXEL_PACK_BUFFER_BINDING, 1),
    QUERY(GL_PIXEL_UNPACK_BUFFER_BINDING, 1),
    QUERY(GL_UNPACK_ALIGNMENT, 1),
    QUERY(GL_UNPACK_ROW_LENGTH, 1),
    QUERY(GL_UNPACK_IMAGE_HEIGHT, 1),
    QUERY(GL_UNPACK_SKIP_PIXELS, 1),
    QUERY(GL_UNPACK_SKIP_ROWS, 1),
    QUERY(GL_UNPACK_SKIP_IMAGES, 1),
    QUERY(GL_UNPACK_SWAP_BYTES, 1),
    QUERY(GL_UNPACK_LSB_FIRST, 1),
    QUERY(GL_PACK_ALIGNMENT, 1),
    QUERY(GL_PACK_ROW_LENGTH, 1),
    QUERY(GL_PACK_SKIP_PIXELS, 1),
    QUERY(GL_PACK_SKIP_ROWS, 1),
    QUERY(GL_PACK_SWAP_BYTES, 1),
};

constexpr Query aEnables[] = {QUERY(GL_BLEND, 0),        QUERY(GL_DEPTH_TEST, 0),
                              QUERY(GL_STENCIL_TEST, 0), QUERY(GL_SCISSOR_TEST, 0),
                              QUERY(GL_ALPHA_TEST, 0),   QUERY(GL_CULL_FACE, 0),
                              QUERY(GL_LIGHTING, 0),     QUERY(GL_FOG, 0),
                              QUERY(GL_VERTEX_ARRAY, 0), QUERY(GL_COLOR_ARRAY, 0),
                              QUERY(GL_DITHER, 0),       QUERY(GL_MULTISAMPLE, 0),
                              QUERY(GL_NORMAL_ARRAY, 0), QUERY(GL_TEXTURE_COORD_ARRAY, 0),
                              QUERY(GL_POINT_SPRITE, 0), QUERY(GL_VERTEX_PROGRAM_POINT_SIZE, 0)};

#undef QUERY

constexpr GLenum aBindings[] = {GL_TEXTURE_BINDING_1D, GL_TEXTURE_BINDING_2D, GL_TEXTURE_BINDING_3D,
                                GL_TEXTURE_BINDING_RECTANGLE};
constexpr GLenum aTargets[] = {GL_TEXTURE_1D, GL_TEXTURE_2D, GL_TEXTURE_3D, GL_TEXTURE_RECTANGLE};

double integerOf(GLenum token) {
    GLint value = 0;
    glGetIntegerv(token, &value);
    return value;
}

} // namespace

GLState GLState::capture() {
    GLState state;
    for (Query const& query : aQueries) {
        GLdouble aBuffer[16] = {};
        glGetDoublev(query.nToken_, aBuffer);
        state.aValues_[query.pName_].assign(aBuffer, aBuffer + query.nValues_);
    }
    for (Query const& enable : aEnables)
        state.aValues_[enable.pName_] = {static_cast<double>(glIsEnabled(enable.nToken_))};
    int const nFixed = static_cast<int>(integerOf(GL_MAX_TEXTURE_UNITS));
    int const nUnits = std::max(nFixed, static_cast<int>(integerOf(GL_MAX_TEXTURE_IMAGE_UNITS)));
    auto const nActive = static_cast<GLenum>(integerOf(GL_ACTIVE_TEXTURE));
    for (int unit = 0; unit < nUnits; ++unit) {
        glActiveTexture(GL_TEXTURE0 + static_cast<GLenum>(unit));
        auto& values = state.aValues_["texture unit " + std::to_string(unit)];
        for (GLenum const binding : aBindings)
            values.push_back(integerOf(binding));
        if (unit >= nFixed)
            continue;
        for (GLenum const target : aTargets)
            values.push_back(glIsEnabled(target));
        GLint nMode = 0;
        glGetTexEnviv(GL_TEXTURE_ENV, GL_TEXTURE_ENV_MODE, &nMode);
        values.push_back(nMode);
        GLint nReplaced = 0;
        glGetTexEnviv(GL_POINT_SPRITE, GL_COORD_REPLACE, &nReplaced);
        values.push_back(nReplaced);
    }
    glActiveTexture(nActive);
    auto& arrays = state.aValues_["generic arrays"];
    for (GLuint i = 0; i < static_cast<GLuint>(integerOf(GL_MAX_VERTEX_ATTRIBS)); ++i) {
        GLint nEnabled = 0;
        glGetVertexAttribiv(i, GL_VERTEX_ATTRIB_ARRAY_ENABLED, &nEnabled);
        arrays.push_back(nEnabled);
    }
    return state;
}

std::string GLState::differencesTo(GLState const& after) const {
    std::ostringstream text;
    for (auto const& [sName, aBefore] : aValues_) {
        auto const& aAfter = after.aValues_.at(sName);
        if (aBefore == aAfter)
            continue;
        text << sName << ":";
        for (double const value : aBefore)
            text << ' ' << value;
        text << " ->";
        for (double const value : aAfter)
            text << ' ' << value;
        text << '\n';
    }
    return text.str();
}

} // namespace ORVO::Test
