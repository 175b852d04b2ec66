#include "orvo/ogl/Buffer.h"

#include <array>
#include <string>

#include "orvo/core/Check.h"
#include "orvo/ogl/internal/Scopes.h"
#include "orvo/ogl/internal/ShareGroup.h"
#include "orvo/ogl/internal/TokenTable.h"

namespace ORVO::OGL {

namespace {

using Internal::fromToken;
using Internal::toToken;

constexpr std::array<unsigned, 4> aTypes{GL_PIXEL_UNPACK_BUFFER, GL_PIXEL_PACK_BUFFER, GL_ARRAY_BUFFER,
                                         GL_ELEMENT_ARRAY_BUFFER};
constexpr std::array<unsigned, 9> aUsages{GL_STREAM_DRAW,  GL_STREAM_READ,  GL_STREAM_COPY,
                                          GL_STATIC_DRAW,  GL_STATIC_READ,  GL_STATIC_COPY,
                                          GL_DYNAMIC_DRAW, GL_DYNAMIC_READ, GL_DYNAMIC_COPY};

} // namespace

Buffer::Buffer(long long size, Type type, Usage usage, void const* pData)
    : Object(Type2GL(type)), nSize_(size) {
    ORVO_CHECK_PARAMETER(size >= 0);
    unsigned const nUsage = Usage2GL(usage);
    joinShareGroup();
    GLuint nName = 0;
    epoxy_glGenBuffers(1, &nName);
    if (nName == 0) {
        Internal::clearErrors();
        ORVO_OGL_FAIL("The buffer could not be created", GL_OUT_OF_MEMORY);
    }
    try {
        Internal::ScopedBufferBinding const binding(target(), nName);
        epoxy_glBufferData(target(), static_cast<GLsizeiptr>(size), pData, nUsage);
        ORVO_OGL_THROW_ON_ERROR("The buffer could not be allocated");
    } catch (...) {
        epoxy_glDeleteBuffers(1, &nName);
        throw;
    }
    setObjectID(nName);
}

Buffer::~Buffer() {
    if (Internal::ShareGroup const* const pGroup = shareGroup())
        pGroup->destroy(Internal::ShareGroup::Kind::buffer, Buffer::objectID());
}

unsigned Buffer::getBoundID() const {
    ORVO_OGL_REQUIRE_CONTEXT();
    return Internal::boundBuffer(target());
}

void Buffer::bind() {
    ORVO_OGL_REQUIRE_CONTEXT();
    epoxy_glBindBuffer(target(), objectID());
}

void* Buffer::map(unsigned access) {
    ORVO_CHECK(isBound());
    void* const pMemory = glMapBuffer(target(), access);
    if (pMemory == nullptr) {
        ORVO_OGL_THROW_ON_ERROR("The buffer could not be mapped");
        ORVO_OGL_FAIL("The buffer could not be mapped", GL_OUT_OF_MEMORY);
    }
    return pMemory;
}

void Buffer::unmap() {
    ORVO_CHECK(isBound());
    if (glUnmapBuffer(target()) == GL_TRUE)
        return;
    ORVO_OGL_THROW_ON_ERROR("The buffer could not be unmapped");
    ORVO_OGL_FAIL("The buffer's contents were lost while it was mapped", 0);
}

void Buffer::bindDefaultUnpackBuffer() {
    ORVO_OGL_REQUIRE_CONTEXT();
    epoxy_glBindBuffer(GL_PIXEL_UNPACK_BUFFER, 0);
}

Buffer::Type Buffer::GL2Type(unsigned token) { return fromToken<Type>(aTypes, token, "buffer type"); }
unsigned Buffer::Type2GL(Type type) { return toToken(aTypes, type, "buffer type"); }
Buffer::Usage Buffer::GL2Usage(unsigned token) { return fromToken<Usage>(aUsages, token, "buffer usage"); }
unsigned Buffer::Usage2GL(Usage usage) { return toToken(aUsages, usage, "buffer usage"); }

} // namespace ORVO::OGL
