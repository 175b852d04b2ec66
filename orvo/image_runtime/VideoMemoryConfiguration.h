#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/VideoMemoryListener.h"

#include <cstddef>

namespace ORVO::VideoMemory {

/// How the image runtime deals with video memory. Without an OpenGL context it is carried and not used.
///
/// Threads: a plain value.
class ORVO_API Configuration {
public:
    /// 128 MiB of pooled textures, the default listener, larger textures may be reused.
    Configuration();

    /// The bytes that unused textures may hold.
    std::size_t maximumTexturePoolSize() const;
    void setMaximumTexturePoolSize(std::size_t nBytes);

    /// Who is told of allocations. Not owned, never null unless set so.
    VideoMemoryListener* videoMemoryListener() const;
    void setVideoMemoryListener(VideoMemoryListener* pListener);

    /// Whether a pooled texture has to have exactly the size class that is asked for.
    bool prohibitReuseLargerTextures() const;
    void setProhibitReuseLargerTextures(bool bProhibit);

private:
    std::size_t nMaximumTexturePoolSize_;
    VideoMemoryListener* pVideoMemoryListener_;
    bool bProhibitReuseLargerTextures_;
};

} // namespace ORVO::VideoMemory
