#include "orvo/core/memory/ImageStorage.h"

#include "orvo/core/memory/ImageStore.h"

namespace ORVO::Core {

using ORVO_private::ImageStore;

void setImageStorageLimit(std::size_t bytes) { ImageStore::instance().setLimit(bytes); }

std::size_t imageStorageLimit() noexcept { return ImageStore::instance().limit(); }

std::size_t heldImageStorage() noexcept { return ImageStore::instance().heldBytes(); }

void releaseImageStorage() { ImageStore::instance().releaseAll(); }

} // namespace ORVO::Core
