#include "orvo/filter_graph/impl/ImageGL.h"

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/filter_graph/internal/ImageAccessor.h"
#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/ogl/Framebuffer.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/ScopedFramebufferBindings.h"

#include <memory>
#include <utility>

namespace ORVO::FilterGraph {

namespace {

/// A runtime image gives its texture to the pool when it dies; the client's stays the client's.
struct ForgetTexture {
    void operator()(ORVO::ImageGPU* pImage) const noexcept {
        pImage->forgetTexture();
        trackedDelete(pImage);
    }
};

} // namespace

ImageGL::ImageGL(ImageDescriptorGL const& descriptor) : ImageBase(descriptor) {}

ImageGL::ImageGL(ImageDescriptorGL const& descriptor, PositionExtentInPixelSpace const& rect,
                 OGL::Texture2D* pTexture)
    : ImageBase(descriptor, rect) {
    setPixelStorage(pTexture);
}

ImageGL::~ImageGL() = default;

void ImageGL::setPixelStorage(OGL::Texture2D* pTexture) {
    std::shared_ptr<ORVO::ImageBase> pImage;
    if (pTexture) {
        std::unique_ptr<ORVO::ImageGPU, ForgetTexture> pWrapper(
            ORVO_NEW ORVO::ImageGPU(rect(), pTexture, imageDescriptor().pixelExtent()));
        pImage = std::shared_ptr<ORVO::ImageGPU>(std::move(pWrapper));
    }
    setWrappedImage(std::move(pImage));
}

OGL::Texture2D* ImageGL::getPixelStorage() {
    auto* const pImage = Internal::ImageAccessor::getImpl<ORVO::ImageGPU>(this);
    return pImage ? pImage->texture() : nullptr;
}

OGL::Texture2D const* ImageGL::getPixelStorage() const {
    auto const* const pImage = Internal::ImageAccessor::getImpl<ORVO::ImageGPU>(this);
    return pImage ? pImage->texture() : nullptr;
}

void ImageGL::clear() {
    auto* const pImage = Internal::ImageAccessor::getImpl<ORVO::ImageGPU>(this);
    if (!pImage) {
        return;
    }
    OGL::Internal::ScopedFramebufferBindings const restore;
    OGL::Framebuffer framebuffer;
    framebuffer.bind();
    framebuffer.attach(pImage->texture(), 0, 0);
    pImage->initializeToTransparentBlack();
    ORVO_OGL_THROW_ON_ERROR("The texture could not be cleared");
}

} // namespace ORVO::FilterGraph
