#pragma once

#include <memory>

#include "orvo/core/Export.h"

namespace ORVO::OGL {

namespace Internal {
class ShareGroup;
}

/// Base of the objects of the shading language: a name, which is no texture's or buffer's. Made, destroyed
/// and deleted as Object is.
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
    /// Remembers the current context's share group. Throws ExceptionOGL.
    void joinShareGroup();
    /// That group; null before.
    Internal::ShareGroup const* shareGroup() const noexcept { return spGroup_.get(); }

private:
    unsigned nName_ = 0;
    std::shared_ptr<Internal::ShareGroup const> spGroup_;
};

} // namespace ORVO::OGL
