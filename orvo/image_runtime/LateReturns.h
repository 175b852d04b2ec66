/// Not a public header.
#pragma once

namespace ORVO {

namespace OGL {
class Texture2D;
}

/// Textures whose holders died where no pool could be asked, because no context or a foreign one was current.
/// Each waits here until a pool makes a context of its share group current.
///
/// Threads: any.
namespace LateReturns {

/// Takes a texture over; if there is no memory to keep it, it is deleted.
void add(OGL::Texture2D* pTexture) noexcept;

/// Hands out the oldest texture that shares with the current context; the caller's. Null if there is none.
OGL::Texture2D* takeOneOfCurrentContext() noexcept;

/// Deletes what is left: at the end of the last pool.
void clear() noexcept;

} // namespace LateReturns
} // namespace ORVO
