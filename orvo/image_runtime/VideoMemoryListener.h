#pragma once

#include "orvo/core/Export.h"

#include <cstddef>

namespace ORVO::VideoMemory {

/// Tells a host about pressure on video memory. All operations do nothing unless overridden. A listener is
/// not owned by those it is given to and has to outlive them.
///
/// Threads: called on any thread that works with textures.
class ORVO_API VideoMemoryListener {
public:
    virtual ~VideoMemoryListener();
    /// So many bytes are about to be allocated. The spelling is part of the interface.
    virtual void impendingMemoryAllcation(std::size_t nBytes);
    /// So many bytes were given back to the driver.
    virtual void memoryFreed(std::size_t nBytes);
    /// So many bytes were taken from the driver.
    virtual void memoryAllocated(std::size_t nBytes);
};

/// The listener that does nothing. It lives as long as the process.
ORVO_API VideoMemoryListener* GlobalDefaultListener();

} // namespace ORVO::VideoMemory
