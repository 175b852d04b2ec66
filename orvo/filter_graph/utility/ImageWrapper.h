#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/TargetPlatform.h"
#include "orvo/core/spaces/PositionExtentInPixelSpace.h"
#include "orvo/filter_graph/impl/ImageBase.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"
#include "orvo/ogl/Texture.h"

#include <cstddef>
#include <cstdint>
#include <memory>

namespace ORVO {

class PixelExtentInWorldSpace;

namespace OGL {
class Texture2D;
}

} // namespace ORVO

namespace ORVO::FilterGraph {

class ImageDescriptorCPU;
class ImageDescriptorGL;

namespace Utility {

/// A client image together with storage of its own, in host memory or in a texture, which comes and goes:
///
///     ImageWrapper tile(descriptorCPU, rect);
///     tile.initializeStorage();       // memory, which the image now has
///     ... fill tile.storageCPU(), rows without padding ...
///     tile.imageCPU2GL();             // the image is one in a texture from here on, without pixels
///     tile.initializeStorage();       // a texture, which the image now has
///     tile.storageCPU2GL();           // the pixels go up
///     tile.deallocateStorageCPU();    // the memory is not needed any more
///     input->setImage(&tile.image());
///
/// The image stands from construction on. Storage of both kinds may be there at once; the image has at most
/// that of its own kind. Pixels of the image that are not the wrapper's do not count as its storage.
///
/// Textures come from the pool of the current context and go back there.
///
/// Threads: one at a time. What makes, moves or frees a texture needs the host's context current; a texture
/// that is freed without one goes back to its pool later.
class ORVO_API ImageWrapper {
public:
    /// An image without pixels. On another platform than these two there is no image at all, and the
    /// operations that need one throw "Enforce spImage_ != NULL".
    /// @throws ParameterException as `ImageBase::setRect`; InternalException as `ImageCPU::setPixelStorage`
    /// if images in host memory cannot have the format.
    ImageWrapper(ImageDescriptor::Format const& format, PixelExtentInWorldSpace const& pixelExtent,
                 TargetPlatform platform, PositionExtentInPixelSpace const& rect);

    /// The same with what the descriptor says.
    ImageWrapper(ImageDescriptor const& descriptor, PositionExtentInPixelSpace const& rect);

    /// As `releaseStorage`; lets nothing out.
    ~ImageWrapper();

    ImageWrapper(ImageWrapper const&) = delete;
    ImageWrapper& operator=(ImageWrapper const&) = delete;

    /// The client image. Another one after `imageCPU2GL` and `imageGL2CPU`: what was bound before is gone.
    /// @throws InternalException "Enforce spImage_ != NULL" if there is none.
    ImageBase& image();
    ImageBase const& image() const;
    ImageBase* operator->() { return &image(); }
    ImageBase const* operator->() const { return &image(); }

    PositionInPixelSpace const& position() const { return oRect_.position(); }
    ExtentInPixelSpace const& extent() const { return oRect_.extent(); }

    /// The wrapper's own memory, or null: `storageSize()` bytes, rows without padding, on a 64-byte boundary.
    unsigned char* storageCPU() { return storageCPU_; }
    unsigned char const* storageCPU() const { return storageCPU_; }
    /// The wrapper's own texture, or null.
    OGL::Texture2D* storageGL() { return storageGL_; }
    OGL::Texture2D const* storageGL() const { return storageGL_; }

    /// Gives the image storage of its kind, with undefined pixels; does nothing if it has it.
    /// @throws as the allocation of its kind and as `imageHasPixelStorage`.
    void initializeStorage();

    /// Frees storage of both kinds and takes the pixels off the image, foreign ones too.
    void releaseStorage();

    /// Allocates memory, with undefined contents, in place of what is there. An image that had the old one
    /// has the new one.
    /// @throws ParameterException "Image size exceeds 4294967295 bytes"; std::bad_alloc. Everything is then
    /// as it was.
    void allocateStorageCPU();

    /// Frees the memory, and takes it off the image.
    void deallocateStorageCPU();

    /// Takes a texture of the image's size from the pool in place of what is there, or makes one where there
    /// is no pool. An image that had the old one has the new one.
    /// @throws as `textureInternalFormatToUse`; InternalException if no pool serves the current context;
    /// ParameterException "Image size exceeds 4294967295 bytes", "Texture size is too large"; ExceptionOGL.
    /// Everything is then as it was.
    void allocateStorageGL();

    /// Gives the texture back to the pool, and takes it off the image.
    void deallocateStorageGL();

    /// Bytes of the image: bytes per pixel times width times height, the number of pixels counted in 32 bits.
    std::size_t storageSize() const;

    /// Replaces the image by one of the same format, pixel extent and rectangle in a texture, without pixels.
    /// Storage stays as it is.
    /// @throws InternalException "image().imageDescriptor().type() == ORVO_TARGET_CPU".
    void imageCPU2GL();

    /// The opposite.
    /// @throws InternalException "image().imageDescriptor().type() == ORVO_TARGET_GL"; as
    /// `ImageCPU::setPixelStorage` if images in host memory cannot have the format.
    void imageGL2CPU();

    /// Copies the pixels from the wrapper's memory into its texture. Bindings and pixel store stay as they
    /// were.
    /// @throws InternalException "storageGL_ != 0", "storageCPU_ != 0"; else as below.
    void storageCPU2GL();

    /// The opposite. Leaves texture unit 0 active, with no 2D texture bound.
    /// @throws InternalException "storageGL_ != 0", "storageCPU_ != 0"; else as below.
    void storageGL2CPU();

    /// Copies the image's pixels, rows without padding, into the top left part of a texture. The channels in
    /// memory are of the type `textureTypeToUse`: `storageSize()` bytes in all, but for channel types that
    /// this has no own type for. Of CHANNEL_TYPE_UINT16 and CHANNEL_TYPE_FLOAT16 they are single bytes from 0
    /// to 255, half of `storageSize()`, rows just as close; of the type 1, which no storage of a wrapper has,
    /// twice as much.
    ///
    /// They go up by `TextureUpload` alone, whatever the driver.
    /// @throws InternalException "storageGL != 0"; ParameterException "The rectangle lies outside the
    /// texture" if the texture is smaller than the image; as `TextureUpload::asyncUpload`.
    void storageCPU2GL(unsigned char const* storageCPU, OGL::Texture2D* storageGL);

    /// The opposite, with as many bytes. Leaves texture unit 0 active, with no 2D texture bound.
    /// @throws InternalException "storageGL != 0"; ParameterException "The rectangle lies outside the
    /// texture"; ExceptionOGL.
    void storageGL2CPU(OGL::Texture2D const* storageGL, unsigned char* storageCPU);

    /// Whether the image has the wrapper's own storage. False if its pixels are foreign.
    /// @throws InternalException "Unknown image type" if there is no image.
    bool imageHasPixelStorage() const;

    /// RGB for three channels, luminance for one, else RGBA. (Two channels are copied as luminance and
    /// alpha.)
    OGL::Texture::Format textureFormatToUse() const;

    /// The internal format of the wrapper's textures.
    /// @throws InternalException with a text that begins with "Not implemented: ", or ParameterException
    /// "invalid pixel format", if there is none.
    OGL::Texture::InternalFormat textureInternalFormatToUse() const;

    /// Unsigned short for channel types 1 and 2, int for 5, float for 6, else unsigned byte: also for 3 and
    /// 4.
    OGL::Texture::Type textureTypeToUse() const;

private:
    void initializeImage(ImageDescriptorCPU const& descriptor);
    void initializeImage(ImageDescriptorGL const& descriptor);
    std::size_t checkedStorageSize() const;
    OGL::Texture2D* makeTexture() const;
    void dropStorageCPU() noexcept;
    void dropStorageGL() noexcept;
    OGL::Texture::Format formatOfPixels() const;

    PositionExtentInPixelSpace oRect_;
    std::shared_ptr<FilterGraph::ImageBase> spImage_;
    OGL::Texture2D* storageGL_ = nullptr;
    unsigned char* storageCPU_ = nullptr;
    std::size_t nStorageCPUSize_ = 0;

    friend class Tiles;
    /// Bytes that stand for this tile in the ledger of its grid.
    std::int64_t nBookedSize_ = 0;
};

} // namespace Utility
} // namespace ORVO::FilterGraph
