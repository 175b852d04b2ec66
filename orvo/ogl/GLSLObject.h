#pragma once

#include "orvo/core/Export.h"

namespace ORVO::OGL {

/// Base of the objects of the shading language: a name, which is no texture's or buffer's.
///
/// Threads: any thread with a context of the share group current, one thread at a time for one object.
class ORVO_API GLSLObject {
public:
    GLSLObject(GLSLObject const&) = delete;
    GLSLObject& operator=(GLSLObject const&) = delete;
    virtual ~GLSLObject();

    /// The OpenGL name.
    unsigned objectID() const noexcept { return nName_; }

protected:
    GLSLObject() noexcept;
    void setObjectID(unsigned nName) noexcept { nName_ = nName; }

private:
    unsigned nName_ = 0;
};

} // namespace ORVO::OGL
