#pragma once

#include "orvo/ogl/Object.h"

namespace ORVO::OGL {

/// A buffer object.
///
/// Threads: as Object.
class ORVO_API Buffer : public Object {
public:
    /// What the buffer binds to.
    enum Type : int { TYPE_PIXEL_UNPACK = 0, TYPE_PIXEL_PACK = 1, TYPE_ARRAY = 2, TYPE_ELEMENT_ARRAY = 3 };

    /// What the driver is told of the contents' life: how often they change, and who writes and reads them.
    enum Usage : int {
        USAGE_STREAM_DRAW = 0,
        USAGE_STREAM_READ = 1,
        USAGE_STREAM_COPY = 2,
        USAGE_STATIC_DRAW = 3,
        USAGE_STATIC_READ = 4,
        USAGE_STATIC_COPY = 5,
        USAGE_DYNAMIC_DRAW = 6,
        USAGE_DYNAMIC_READ = 7,
        USAGE_DYNAMIC_COPY = 8
    };

    /// A buffer of size bytes with a copy of the data, undefined where pData is null. Leaves the bindings as
    /// they were. Throws ParameterException "size >= 0", ExceptionOGL.
    Buffer(long long size, Type type, Usage usage, void const* pData);
    /// Deletes the buffer, which ends a mapping: as Object says.
    ~Buffer() override;

    /// Size in bytes.
    long long size() const noexcept { return nSize_; }

    unsigned getBoundID() const override;

    /// Binds the buffer to its target.
    void bind();
    /// Memory of the bound buffer, valid until unmap; access is GL_READ_ONLY, GL_WRITE_ONLY or GL_READ_WRITE.
    /// Throws InternalException "isBound()", ExceptionOGL "The buffer could not be mapped".
    void* map(unsigned access);
    /// Ends the mapping of the bound buffer. Throws InternalException "isBound()", ExceptionOGL "The buffer's
    /// contents were lost while it was mapped".
    void unmap();

    /// Binds no buffer to the unpack target. Throws ExceptionOGL "No OpenGL context is current".
    static void bindDefaultUnpackBuffer();

    /// Conversions; each throws ExceptionOGL, naming the value, for one that has no counterpart. Threads:
    /// any.
    static Type GL2Type(unsigned token);
    static unsigned Type2GL(Type type);
    static Usage GL2Usage(unsigned token);
    static unsigned Usage2GL(Usage usage);

private:
    long long nSize_;
};

} // namespace ORVO::OGL
