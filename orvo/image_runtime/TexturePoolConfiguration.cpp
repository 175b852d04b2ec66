#include "orvo/image_runtime/TexturePool.h"

namespace ORVO {

TexturePool::Configuration::Configuration()
    : nMaximumFreelistSize_(0x8000000),
      pVideoMemoryListener_(VideoMemory::GlobalDefaultListener()),
      pContext_(nullptr),
      bProhibitReuseLargerTextures_(false) {}

std::size_t TexturePool::Configuration::maximumFreelistSize() const { return nMaximumFreelistSize_; }

void TexturePool::Configuration::setMaximumFreelistSize(std::size_t nBytes) {
    nMaximumFreelistSize_ = nBytes;
}

VideoMemory::VideoMemoryListener* TexturePool::Configuration::videoMemoryListener() const {
    return pVideoMemoryListener_;
}

void TexturePool::Configuration::setVideoMemoryListener(VideoMemory::VideoMemoryListener* pListener) {
    pVideoMemoryListener_ = pListener;
}

OGL::Context const* TexturePool::Configuration::context() const { return pContext_; }

void TexturePool::Configuration::setContext(OGL::Context const* pContext) { pContext_ = pContext; }

bool TexturePool::Configuration::prohibitReuseLargerTextures() const { return bProhibitReuseLargerTextures_; }

void TexturePool::Configuration::setProhibitReuseLargerTextures(bool bProhibit) {
    bProhibitReuseLargerTextures_ = bProhibit;
}

} // namespace ORVO
