#include "orvo/ogl/PixelUnpackParameters.h"

#include <climits>

#include "orvo/core/Check.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"

namespace ORVO::OGL {

PixelUnpackParameters::PixelUnpackParameters() noexcept = default;

void PixelUnpackParameters::apply() const {
    ORVO_CHECK_PARAMETER(nRowLength_ <= INT_MAX, "rowLength <= INT_MAX");
    ORVO_OGL_REQUIRE_CONTEXT();
    glPixelStorei(GL_UNPACK_ALIGNMENT, 1);
    glPixelStorei(GL_UNPACK_ROW_LENGTH, static_cast<GLint>(nRowLength_));
    glPixelStorei(GL_UNPACK_IMAGE_HEIGHT, 0);
    glPixelStorei(GL_UNPACK_SKIP_PIXELS, 0);
    glPixelStorei(GL_UNPACK_SKIP_ROWS, 0);
    glPixelStorei(GL_UNPACK_SKIP_IMAGES, 0);
    glPixelStorei(GL_UNPACK_SWAP_BYTES, GL_FALSE);
    glPixelStorei(GL_UNPACK_LSB_FIRST, GL_FALSE);
}

} // namespace ORVO::OGL
