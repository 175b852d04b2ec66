/// A sync object that marks a share group: it is known in every context of the group and in no other.
#pragma once

namespace ORVO::OGL::Internal::Sentinel {

/// A new one in the current context's group; null if the driver has no sync objects. Throws ExceptionOGL.
void* create();

/// Whether it belongs to the group of the current context. Null never does.
bool isAlive(void* pSync) noexcept;

/// Deletes one that is alive in the current context's group; null is allowed.
void destroy(void* pSync) noexcept;

} // namespace ORVO::OGL::Internal::Sentinel
