#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/ImageBase.h"
#include "orvo/filter_graph/impl/ImageDescriptorGL.h"

namespace ORVO::OGL {
class Texture2D;
}

namespace ORVO::FilterGraph {

/// A client image in an OpenGL texture. The handle does not own the texture: the host keeps it alive while
/// the handle has it, and frames never return it to the library's pool.
///
/// The pixel at the image's position is the texture's first texel; the texture may be larger than the
/// rectangle. A frame reads, or writes, the pixels of the rectangle. What the texels are follows from the
/// texture's own internal format; the descriptor says what the graph is compiled for, so the two should
/// agree. `CHANNEL_TYPE_UINT15_1` says that the texels are on the scale 0..32768, which the graph then
/// rescales where it reads and writes them.
///
/// Threads: as `ImageBase`; storage is given, and `clear` called, with a context current that shares with one
/// of those that the image runtime was started with.
class ORVO_API ImageGL : public ImageBase {
public:
    /// No storage and no rectangle.
    explicit ImageGL(ImageDescriptorGL const& descriptor);

    /// The rectangle, and the texture as `setPixelStorage` takes it.
    /// @throws ParameterException as `setRect`; else as `setPixelStorage`.
    ImageGL(ImageDescriptorGL const& descriptor, PositionExtentInPixelSpace const& rect,
            OGL::Texture2D* pTexture);

    ImageGL(ImageGL const&) = default;
    ImageGL& operator=(ImageGL const&) = default;
    ~ImageGL() override;

    /// Gives the handle the texture of `rect()`, or none with null. On an exception everything stays as it
    /// was.
    /// @throws ParameterException "invalid pixel format" if the texture's format is none of the image
    /// formats.
    /// @throws InternalException if the current context shares with none of the library's.
    void setPixelStorage(OGL::Texture2D* pTexture);

    /// The texture, or null.
    OGL::Texture2D* getPixelStorage();
    OGL::Texture2D const* getPixelStorage() const;

    /// Makes a texture that is larger than the rectangle transparent black, the rectangle included; a texture
    /// of just that size stays as it is, and so does the framebuffer binding. Does nothing without storage.
    /// @throws ExceptionOGL if the texture cannot be drawn to.
    void clear() override;
};

} // namespace ORVO::FilterGraph
