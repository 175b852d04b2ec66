#include "orvo/image_runtime/VideoMemoryListener.h"

namespace ORVO::VideoMemory {

VideoMemoryListener::~VideoMemoryListener() = default;

void VideoMemoryListener::impendingMemoryAllcation(std::size_t) {}

void VideoMemoryListener::memoryFreed(std::size_t) {}

void VideoMemoryListener::memoryAllocated(std::size_t) {}

namespace {

VideoMemoryListener goDefaultVideoMemoryListener_;

} // namespace

VideoMemoryListener* GlobalDefaultListener() { return &goDefaultVideoMemoryListener_; }

} // namespace ORVO::VideoMemory
