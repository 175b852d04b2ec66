/// The OpenGL entry points for sources of the library: every call goes through a function pointer of the
/// loader, which tests replace. Not a public header, and never included by one.
///
/// Sources above this layer reach the entry points of OGL::FunctionTable through that table alone.
#pragma once

#include <epoxy/gl.h>

// The loader names its pointers by macros, which would rename the members of FunctionTable. Sources of this
// layer call these by the pointers' own names (epoxy_gl...).
#undef glActiveTexture
#undef glMultiTexCoord2f
#undef glMultiTexCoord2fv
#undef glGenQueries
#undef glDeleteQueries
#undef glIsQuery
#undef glBeginQuery
#undef glEndQuery
#undef glGetQueryObjectuiv
#undef glGenBuffers
#undef glDeleteBuffers
#undef glBindBuffer
#undef glBufferData
#undef glGenFramebuffers
#undef glBindFramebuffer
#undef glTestObjectAPPLE
#undef glFinishObjectAPPLE
