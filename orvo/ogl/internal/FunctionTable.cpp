#include "orvo/ogl/internal/FunctionTable.h"

#include "orvo/ogl/internal/GL.h"

namespace ORVO::OGL::Internal {

namespace {

unsigned char testObject(unsigned object, unsigned name) {
    if (!epoxy_has_gl_extension("GL_APPLE_fence"))
        return GL_TRUE;
    return epoxy_glTestObjectAPPLE(object, name);
}

void finishObject(unsigned object, int name) {
    if (epoxy_has_gl_extension("GL_APPLE_fence"))
        epoxy_glFinishObjectAPPLE(object, name);
}

FunctionTable makeTable() noexcept {
    FunctionTable table{};
    table.glActiveTexture = [](unsigned texture) { epoxy_glActiveTexture(texture); };
    table.glMultiTexCoord2f = [](unsigned target, float s, float t) {
        epoxy_glMultiTexCoord2f(target, s, t);
    };
    table.glMultiTexCoord2fv = [](unsigned target, float const* p) { epoxy_glMultiTexCoord2fv(target, p); };
    table.glGenQueries = [](int n, unsigned* pNames) { epoxy_glGenQueries(n, pNames); };
    table.glDeleteQueries = [](int n, unsigned const* pNames) { epoxy_glDeleteQueries(n, pNames); };
    table.glIsQuery = [](unsigned name) -> unsigned char { return epoxy_glIsQuery(name); };
    table.glBeginQuery = [](unsigned target, unsigned name) { epoxy_glBeginQuery(target, name); };
    table.glEndQuery = [](unsigned target) { epoxy_glEndQuery(target); };
    table.glGetQueryObjectuiv = [](unsigned name, unsigned what, unsigned* pResult) {
        epoxy_glGetQueryObjectuiv(name, what, pResult);
    };
    table.glGenBuffers = [](int n, unsigned* pNames) { epoxy_glGenBuffers(n, pNames); };
    table.glDeleteBuffers = [](int n, unsigned const* pNames) { epoxy_glDeleteBuffers(n, pNames); };
    table.glBindBuffer = [](unsigned target, unsigned name) { epoxy_glBindBuffer(target, name); };
    table.glBufferData = [](unsigned target, std::ptrdiff_t bytes, void const* pData, unsigned usage) {
        epoxy_glBufferData(target, bytes, pData, usage);
    };
    table.glGenFramebuffers = [](int n, unsigned* pNames) { epoxy_glGenFramebuffers(n, pNames); };
    table.glBindFramebuffer = [](unsigned target, unsigned name) { epoxy_glBindFramebuffer(target, name); };
    table.glTestObjectAPPLE = &testObject;
    table.glFinishObjectAPPLE = &finishObject;
    return table;
}

} // namespace

FunctionTable const& functionTable() noexcept {
    static FunctionTable const table = makeTable();
    return table;
}

} // namespace ORVO::OGL::Internal
