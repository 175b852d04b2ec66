#pragma once

#include <memory>

#include "orvo/core/Export.h"

namespace ORVO::OGL {

namespace Internal {
class ShareGroup;
}

/// Base of objects that OpenGL knows by a name: a target to bind to, and what is bound there.
///
/// Objects are made in the calling thread's current context. Destroyed while a context of the same share
/// group is current, they delete their name; without one, or with a foreign one, the name is deleted when a
/// context of the group is next made current through this layer, or an object is made in one. Once no object
/// and no context of the library is left in the group, names that still wait live as long as the group. No
/// name waits on a driver without sync objects, where any context passes for one of the group: objects that
/// die without a context leave theirs to the group's end. Every operation that speaks to OpenGL throws
/// ExceptionOGL "No OpenGL context is current" if there is none.
///
/// Threads: any thread with a context of the share group current, one thread at a time for one object.
class ORVO_API Object {
public:
    Object(Object const&) = delete;
    Object& operator=(Object const&) = delete;
    virtual ~Object();

    /// The OpenGL name.
    virtual unsigned objectID() const;
    /// The OpenGL target that the object binds to.
    unsigned target() const noexcept { return nTarget_; }
    /// The name that is bound to target() now, for textures on the active unit.
    virtual unsigned getBoundID() const = 0;
    /// Whether this object is bound to its target now.
    bool isBound() const;
    /// Whether a context of the share group in which the object was made is current: only then does its name
    /// mean this object, and is it deleted with it. False if none is current.
    bool isShareGroupCurrent() const noexcept;

protected:
    explicit Object(unsigned nTarget) noexcept;

    void setObjectID(unsigned nName) noexcept { nName_ = nName; }
    /// Remembers the current context's share group. Throws ExceptionOGL.
    void joinShareGroup();
    /// That group; null before.
    Internal::ShareGroup const* shareGroup() const noexcept { return spGroup_.get(); }

private:
    unsigned nTarget_;
    unsigned nName_ = 0;
    std::shared_ptr<Internal::ShareGroup const> spGroup_;
};

} // namespace ORVO::OGL
