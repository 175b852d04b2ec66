#include "orvo/image_runtime/VideoMemoryConfiguration.h"

namespace ORVO::VideoMemory {

Configuration::Configuration()
    : nMaximumTexturePoolSize_(0x8000000),
      pVideoMemoryListener_(GlobalDefaultListener()),
      bProhibitReuseLargerTextures_(false) {}

std::size_t Configuration::maximumTexturePoolSize() const { return nMaximumTexturePoolSize_; }

void Configuration::setMaximumTexturePoolSize(std::size_t nBytes) { nMaximumTexturePoolSize_ = nBytes; }

VideoMemoryListener* Configuration::videoMemoryListener() const { return pVideoMemoryListener_; }

void Configuration::setVideoMemoryListener(VideoMemoryListener* pListener) {
    pVideoMemoryListener_ = pListener;
}

bool Configuration::prohibitReuseLargerTextures() const { return bProhibitReuseLargerTextures_; }

void Configuration::setProhibitReuseLargerTextures(bool bProhibit) {
    bProhibitReuseLargerTextures_ = bProhibit;
}

} // namespace ORVO::VideoMemory
