#include "orvo/filter_graph/utility/ImageWrapper.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/AlignedMemory.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/Integers.h"
#include "orvo/filter_graph/impl/ImageCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptorCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptorGL.h"
#include "orvo/filter_graph/impl/ImageGL.h"
#include "orvo/filter_graph/internal/ImageAccessor.h"
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/image_runtime/images/TextureUpload.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/TextureRECT.h"
#include "orvo/ogl/TextureState.h"
#include "orvo/ogl/TextureUnit.h"

#include <cstdint>
#include <cstring>
#include <limits>
#include <utility>
#include <vector>

namespace ORVO::FilterGraph::Utility {

namespace {

constexpr int storageAlignment = 64;

/// Gives a texture back from wherever it has to be given back: a destructor lets nothing out.
void giveTextureBack(OGL::Texture2D* pTexture) noexcept {
    if (!ImageRuntime::Library::isInitialized()) {
        trackedDelete(pTexture);
        return;
    }
    TexturePool* pPool = nullptr;
    try {
        pPool = TexturePool::Instance();
        if (!pPool) {
            trackedDelete(pTexture);
            return;
        }
    } catch (...) {
        // No context is current, or one that no pool serves.
        TexturePool::returnTexture2DLater(pTexture);
        return;
    }
    try {
        pPool->returnTexture2DToPool(pTexture);
    } catch (...) {
        // The texture is the pool's already, which failed to keep to its budget.
    }
}

/// The size that a texture has to have for one of the asked size on the driver.
std::size_t supportedSize(std::size_t nPixels) {
    bool const bAnySize = OGL::TextureState::supportsNonPowerOfTwo() || OGL::TextureRECT::isSupported();
    return bAnySize ? nPixels : nextPowerOfTwo(static_cast<unsigned>(nPixels));
}

/// Binds a texture on unit 0, and nothing at the end of the scope.
class BoundOnUnit0 {
public:
    explicit BoundOnUnit0(OGL::Texture2D const* pTexture) { OGL::TextureUnit::Unit(0).bind(pTexture); }
    ~BoundOnUnit0() {
        try {
            OGL::TextureUnit::Unit(0).bind2DDefault();
        } catch (...) {
            // The context went meanwhile, and the binding with it.
        }
    }
    BoundOnUnit0(BoundOnUnit0 const&) = delete;
    BoundOnUnit0& operator=(BoundOnUnit0 const&) = delete;
};

/// Bytes of a pixel whose channels have the type; more than three are four.
std::size_t bytesOfPixel(std::size_t nChannel, OGL::Texture::Type eType) {
    std::size_t const nCopied = nChannel >= 1 && nChannel <= 3 ? nChannel : 4;
    if (eType == OGL::Texture::TYPE_UNSIGNED_BYTE) {
        return nCopied;
    }
    return nCopied * (eType == OGL::Texture::TYPE_UNSIGNED_SHORT ? 2 : 4);
}

void checkInside(ImageBase const& image, OGL::Texture2D const& texture) {
    ORVO_CHECK_PARAMETER(image.width() <= texture.width(0) && image.height() <= texture.height(0),
                         "The rectangle lies outside the texture");
}

} // namespace

ImageWrapper::ImageWrapper(ImageDescriptor::Format const& format, PixelExtentInWorldSpace const& pixelExtent,
                           TargetPlatform platform, PositionExtentInPixelSpace const& rect)
    : oRect_(rect) {
    if (platform == ORVO_TARGET_CPU) {
        initializeImage(ImageDescriptorCPU(format, pixelExtent));
    } else if (platform == ORVO_TARGET_GL) {
        initializeImage(ImageDescriptorGL(format, pixelExtent));
    }
}

ImageWrapper::ImageWrapper(ImageDescriptor const& descriptor, PositionExtentInPixelSpace const& rect)
    : ImageWrapper(descriptor.format(), descriptor.pixelExtent(), descriptor.type(), rect) {}

ImageWrapper::~ImageWrapper() {
    // The image goes with the wrapper, unless somebody shares it: then it must not point at freed storage.
    try {
        releaseStorage();
    } catch (...) {
        spImage_.reset();
        dropStorageGL();
        dropStorageCPU();
    }
}

void ImageWrapper::initializeImage(ImageDescriptorCPU const& descriptor) {
    if (!std::dynamic_pointer_cast<ImageCPU>(spImage_)) {
        spImage_ = std::make_shared<ImageCPU>(descriptor, oRect_, nullptr, 0);
    }
}

void ImageWrapper::initializeImage(ImageDescriptorGL const& descriptor) {
    if (!std::dynamic_pointer_cast<ImageGL>(spImage_)) {
        spImage_ = std::make_shared<ImageGL>(descriptor, oRect_, nullptr);
    }
}

ImageBase& ImageWrapper::image() {
    ORVO_ENFORCE(spImage_.get(), "spImage_");
    return *spImage_;
}

ImageBase const& ImageWrapper::image() const {
    ORVO_ENFORCE(spImage_.get(), "spImage_");
    return *spImage_;
}

void ImageWrapper::initializeStorage() {
    if (imageHasPixelStorage()) {
        return;
    }
    if (auto* const pImage = dynamic_cast<ImageCPU*>(spImage_.get())) {
        allocateStorageCPU();
        pImage->setPixelStorage(storageCPU_, 0);
    } else if (auto* const pTextureImage = dynamic_cast<ImageGL*>(spImage_.get())) {
        allocateStorageGL();
        pTextureImage->setPixelStorage(storageGL_);
    }
}

void ImageWrapper::releaseStorage() {
    if (auto* const pImage = dynamic_cast<ImageCPU*>(spImage_.get())) {
        pImage->setPixelStorage(nullptr, 0);
    } else if (auto* const pTextureImage = dynamic_cast<ImageGL*>(spImage_.get())) {
        pTextureImage->setPixelStorage(nullptr);
    }
    dropStorageGL();
    dropStorageCPU();
}

void ImageWrapper::dropStorageCPU() noexcept {
    ORVO_private::deleteAlignedMemory(MEMORY_TYPE_IMAGE, std::exchange(storageCPU_, nullptr));
    nStorageCPUSize_ = 0;
}

void ImageWrapper::dropStorageGL() noexcept {
    if (storageGL_) {
        giveTextureBack(std::exchange(storageGL_, nullptr));
    }
}

std::size_t ImageWrapper::storageSize() const {
    auto const nPixels = static_cast<std::uint32_t>(image().width() * image().height());
    return image().numBytesPerPixel() * nPixels;
}

std::size_t ImageWrapper::checkedStorageSize() const {
    std::size_t const nLargest = std::numeric_limits<std::uint32_t>::max();
    std::size_t const nPixels = image().width() * image().height();
    ORVO_CHECK_PARAMETER(nPixels <= nLargest && nPixels * image().numBytesPerPixel() <= nLargest,
                         "Image size exceeds 4294967295 bytes");
    return storageSize();
}

void ImageWrapper::allocateStorageCPU() {
    std::size_t const nSize = checkedStorageSize();
    bool const bInUse = dynamic_cast<ImageCPU*>(spImage_.get()) && imageHasPixelStorage();
    auto* const pStorage = static_cast<unsigned char*>(
        ORVO_private::newAlignedMemory(MEMORY_TYPE_IMAGE, nSize, storageAlignment));
    if (bInUse) {
        try {
            static_cast<ImageCPU&>(*spImage_).setPixelStorage(pStorage, 0);
        } catch (...) {
            ORVO_private::deleteAlignedMemory(MEMORY_TYPE_IMAGE, pStorage);
            throw;
        }
    }
    dropStorageCPU();
    storageCPU_ = pStorage;
    nStorageCPUSize_ = nSize;
}

void ImageWrapper::deallocateStorageCPU() {
    auto* const pImage = dynamic_cast<ImageCPU*>(spImage_.get());
    if (pImage && imageHasPixelStorage()) {
        pImage->setPixelStorage(nullptr, 0);
    }
    dropStorageCPU();
}

OGL::Texture2D* ImageWrapper::makeTexture() const {
    OGL::Texture::InternalFormat const eFormat = textureInternalFormatToUse();
    std::size_t const nWidth = image().width();
    std::size_t const nHeight = image().height();
    if (TexturePool* const pPool = TexturePool::Instance()) {
        return pPool->getTexture2DFromPool(static_cast<unsigned>(nWidth), static_cast<unsigned>(nHeight),
                                           eFormat, true);
    }
    return ORVO_NEW OGL::Texture2D(eFormat, supportedSize(nWidth), supportedSize(nHeight), false, nullptr);
}

void ImageWrapper::allocateStorageGL() {
    static_cast<void>(checkedStorageSize());
    auto* const pImage = dynamic_cast<ImageGL*>(spImage_.get());
    bool const bInUse = pImage && imageHasPixelStorage();
    OGL::Texture2D* const pTexture = makeTexture();
    if (bInUse) {
        try {
            pImage->setPixelStorage(pTexture);
        } catch (...) {
            giveTextureBack(pTexture);
            throw;
        }
    }
    dropStorageGL();
    storageGL_ = pTexture;
}

void ImageWrapper::deallocateStorageGL() {
    auto* const pImage = dynamic_cast<ImageGL*>(spImage_.get());
    if (pImage && imageHasPixelStorage()) {
        pImage->setPixelStorage(nullptr);
    }
    dropStorageGL();
}

void ImageWrapper::imageCPU2GL() {
    ORVO_CHECK(image().imageDescriptor().type() == ORVO_TARGET_CPU,
               "image().imageDescriptor().type() == ORVO_TARGET_CPU");
    ImageDescriptor const& descriptor = image().imageDescriptor();
    initializeImage(ImageDescriptorGL(descriptor.format(), descriptor.pixelExtent()));
}

void ImageWrapper::imageGL2CPU() {
    ORVO_CHECK(image().imageDescriptor().type() == ORVO_TARGET_GL,
               "image().imageDescriptor().type() == ORVO_TARGET_GL");
    ImageDescriptor const& descriptor = image().imageDescriptor();
    initializeImage(ImageDescriptorCPU(descriptor.format(), descriptor.pixelExtent()));
}

bool ImageWrapper::imageHasPixelStorage() const {
    if (auto const* const pImage = dynamic_cast<ImageCPU const*>(spImage_.get())) {
        return storageCPU_ != nullptr && storageCPU_ == pImage->getPixelStorage();
    }
    if (auto const* const pImage = dynamic_cast<ImageGL const*>(spImage_.get())) {
        return storageGL_ != nullptr && storageGL_ == pImage->getPixelStorage();
    }
    ORVO_FAIL("Unknown image type");
}

OGL::Texture::Format ImageWrapper::textureFormatToUse() const {
    switch (image().imageDescriptor().format().nChannel) {
    case 3:
        return OGL::Texture::FORMAT_RGB;
    case 1:
        return OGL::Texture::FORMAT_LUMINANCE;
    default:
        return OGL::Texture::FORMAT_RGBA;
    }
}

OGL::Texture::Format ImageWrapper::formatOfPixels() const {
    // Two channels in memory are no RGBA: four channels would be read for each pixel of two.
    bool const bTwo = image().imageDescriptor().format().nChannel == 2;
    return bTwo ? OGL::Texture::FORMAT_LUMINANCE_ALPHA : textureFormatToUse();
}

OGL::Texture::Type ImageWrapper::textureTypeToUse() const {
    switch (static_cast<int>(image().imageDescriptor().format().channelType)) {
    case ImageDescriptor::CHANNEL_TYPE_RESERVED8:
    case ImageDescriptor::CHANNEL_TYPE_UINT15_1:
        return OGL::Texture::TYPE_UNSIGNED_SHORT;
    case ImageDescriptor::CHANNEL_TYPE_INT32:
        return OGL::Texture::TYPE_INT;
    case ImageDescriptor::CHANNEL_TYPE_FLOAT32:
        return OGL::Texture::TYPE_FLOAT;
    default:
        return OGL::Texture::TYPE_UNSIGNED_BYTE;
    }
}

OGL::Texture::InternalFormat ImageWrapper::textureInternalFormatToUse() const {
    ImageDescriptor::Format const& format = image().imageDescriptor().format();
    auto const ePixelFormat =
        Internal::ImageAccessor::mapDescriptorToGPUPixelFormat(format.nChannel, format.channelType);
    return OGL::Texture::GL2InternalFormat(ORVO::ImageGPU::PixelFormatORVO2GL(ePixelFormat));
}

void ImageWrapper::storageCPU2GL() {
    ORVO_CHECK(storageGL_ != nullptr, "storageGL_ != 0");
    ORVO_CHECK(storageCPU_ != nullptr, "storageCPU_ != 0");
    storageCPU2GL(storageCPU_, storageGL_);
}

void ImageWrapper::storageGL2CPU() {
    ORVO_CHECK(storageGL_ != nullptr, "storageGL_ != 0");
    ORVO_CHECK(storageCPU_ != nullptr, "storageCPU_ != 0");
    storageGL2CPU(storageGL_, storageCPU_);
}

void ImageWrapper::storageCPU2GL(unsigned char const* storageCPU, OGL::Texture2D* storageGL) {
    ORVO_CHECK(storageGL != nullptr, "storageGL != 0");
    checkInside(image(), *storageGL);
    TextureUpload upload;
    upload.asyncUpload(storageGL, 0, PositionExtentInPixelSpace(image().rect().extent()), formatOfPixels(),
                       textureTypeToUse(), storageCPU, 0);
}

void ImageWrapper::storageGL2CPU(OGL::Texture2D const* storageGL, unsigned char* storageCPU) {
    ORVO_CHECK(storageGL != nullptr, "storageGL != 0");
    checkInside(image(), *storageGL);
    if (image().width() == 0 || image().height() == 0) {
        return;
    }
    BoundOnUnit0 const bound(storageGL);
    // Not always the image's own: channels of some types are copied as bytes.
    std::size_t const nPixel = bytesOfPixel(image().imageDescriptor().format().nChannel, textureTypeToUse());
    std::size_t const nRow = image().width() * nPixel;
    std::size_t const nTextureRow = storageGL->width(0) * nPixel;
    if (nRow == nTextureRow && image().height() == storageGL->height(0)) {
        storageGL->getPixelData(storageCPU, 0, formatOfPixels(), textureTypeToUse(), 1);
        return;
    }
    std::vector<unsigned char> aTexels(nTextureRow * storageGL->height(0));
    storageGL->getPixelData(aTexels.data(), 0, formatOfPixels(), textureTypeToUse(), 1);
    for (std::size_t y = 0; y < image().height(); ++y) {
        std::memcpy(storageCPU + y * nRow, aTexels.data() + y * nTextureRow, nRow);
    }
}

} // namespace ORVO::FilterGraph::Utility
