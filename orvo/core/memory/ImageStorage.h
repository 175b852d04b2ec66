/// The store of freed image blocks.
///
/// Touching fresh memory costs several times a copy of it, so the pixel storage of an image that dies is kept
/// and given to the next image of about its size: a frame that allocates images of the same sizes as the last
/// one takes no page faults for them. Sizes are rounded up to classes, eight to a doubling. What the store
/// holds is bounded; beyond the bound the blocks that were held longest go back to the system. Under address
/// sanitizer the store poisons what it holds, and the part of a class that an image did not ask for.
///
/// Threads: every function here may be called from any thread.
#pragma once

#include <cstddef>

#include "orvo/core/Export.h"

namespace ORVO::Core {

/// Sets how many bytes of freed image blocks are kept for reuse; 0 keeps none. Blocks beyond the new bound go
/// back to the system at once. Images in use are not counted. The default is 1 GiB.
ORVO_API void setImageStorageLimit(std::size_t bytes);

/// The bound on kept bytes.
ORVO_API std::size_t imageStorageLimit() noexcept;

/// The bytes that are kept now.
ORVO_API std::size_t heldImageStorage() noexcept;

/// Gives every kept block back to the system.
ORVO_API void releaseImageStorage();

} // namespace ORVO::Core
