#include "orvo/image_runtime/SampleQueries.h"

#include "orvo/ogl/internal/GL.h"

namespace ORVO {

namespace {

unsigned currentQuery(unsigned nTarget) noexcept {
    GLint nQuery = 0;
    glGetQueryiv(nTarget, GL_CURRENT_QUERY, &nQuery);
    return static_cast<unsigned>(nQuery);
}

} // namespace

unsigned currentSampleQuery() noexcept { return currentQuery(GL_SAMPLES_PASSED); }

bool isAnySampleQueryActive() noexcept {
    int const nVersion = epoxy_gl_version();
    bool const bAny = nVersion >= 33 || epoxy_has_gl_extension("GL_ARB_occlusion_query2");
    bool const bConservative = nVersion >= 43 || epoxy_has_gl_extension("GL_ARB_ES3_compatibility");
    return currentSampleQuery() != 0 || (bAny && currentQuery(GL_ANY_SAMPLES_PASSED) != 0) ||
           (bConservative && currentQuery(GL_ANY_SAMPLES_PASSED_CONSERVATIVE) != 0);
}

} // namespace ORVO
