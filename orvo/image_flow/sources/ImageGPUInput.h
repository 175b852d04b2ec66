#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_flow/sources/PixelLayout.h"
#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/image_runtime/images/TextureUpload.h"

namespace ORVO {

/// The source that puts an image in a texture into a graph. It runs once for each `emit`, when its output
/// "OutputImage" is empty or bound, and shares its image with the consumer: it copies nothing unless its
/// output is bound. Then it copies its compute region into the bound texture, as far as its own image covers
/// it, converting the channel type. The image survives a flush of the graph.
///
/// Throws `InternalException` with the stated texts, `ParameterException` where a bound output has other
/// channels than the image, and `OGL::ExceptionOGL` where OpenGL refuses.
///
/// Threads: setters and loaders by the client's thread, between frames. Loaders, the copy and the death of
/// images need a current context that shares with one of the image runtime's.
class ORVO_API ImageGPUInput : public ImageFilter {
public:
    ImageGPUInput();
    ~ImageGPUInput() override;

    void emit() override;
    /// True.
    bool canEmit() const override;
    /// Whether an image was set since the last call.
    bool hasBufferChanged() override;
    /// `Node::isReady`, and emitted since the last run.
    bool isReady() const override;

    /// Until `setGeneratedRegion` is called: the image's rectangle in world space, undefined without an
    /// image. After that: the region set.
    PositionExtentInWorldSpace generated(RegionMap const& inputDODs) override;
    void setGeneratedRegion(PositionExtentInWorldSpace const& region) override;

    /// \name The client's image
    /// Each setter throws "ImageGPU already set on input" where an image that can be released has not been
    /// released or cleared; the image given stays the caller's then. Null takes the image away.
    /// @{

    /// The source owns the image until `releaseImageGPU` gives it back.
    virtual void setImageGPU(ImageGPU* image);
    /// The image stays the caller's and must outlive the frames.
    virtual void setImageGPUWithNoOwnership(ImageGPU* image);
    virtual ImageGPU const* getImageGPU() const;
    /// Hands an image that the source owns to the caller; null if there is none. Throws "wasReleased" while
    /// an output or a consumer still shares it, and "Enforce deleter != NULL" for an image set without
    /// ownership; the source keeps it then.
    virtual ImageGPU* releaseImageGPU();
    /// Lets go of the image; an image that the source owns dies with its last holder.
    void clear();
    /// @}

    /// \name Geometry of the client's image, in pixels
    /// Each throws "No ImageGPU set yet." without an image.
    /// @{
    int width() const;
    int height() const;
    int offsetX() const;
    int offsetY() const;
    PositionInPixelSpace offset() const;
    ExtentInPixelSpace size() const;
    /// @}

    /// \name Raw pixels
    /// Each makes a texture of four channels that covers `region` (pixels; `pixelExtent` in world units a
    /// pixel), uploads the pixels, whose rows are `rowLength` pixels apart (0: the region's width), and sets
    /// the image with releasable ownership: the one before must have been released or cleared. The upload
    /// takes the pixels before the loader returns; the texture may be filled later, before it is next used.
    ///
    /// `layout` tells the channels of the pixels in memory: BGRA, RGBA, RGB or luminance. The texture's
    /// precision is that of "OutputPrecisionHint", 8-bit integer or 16-bit float, or, for the default hint,
    /// the one stated for the loader.
    ///
    /// Throws `ParameterException` "Invalid pixel format." for another layout, "Invalid output precision
    /// hint." for another hint, and as `ImageCPUInput` for a null `pixels`, a negative extent and a pitch
    /// that does not fit; otherwise as the setters. The source is then as it was.
    /// @{

    /// 0..255 for 0.0 to 1.0; 8-bit integer by default.
    void load8BitUnsignedImageData(unsigned char const* pixels, PositionExtentInPixelSpace const& region,
                                   PixelExtentInWorldSpace const& pixelExtent, tePixelFormat layout,
                                   unsigned int rowLength);
    /// 0..65535 for 0.0 to 1.0; 16-bit float by default.
    void load16BitUnsignedImageData(unsigned short const* pixels, PositionExtentInPixelSpace const& region,
                                    PixelExtentInWorldSpace const& pixelExtent, tePixelFormat layout,
                                    unsigned int rowLength);
    /// Bits of 16-bit floats; 16-bit float by default. Throws "load16BitFloatImageData not supported for this
    /// graphic card" where the driver takes no 16-bit floats or has no float textures.
    void load16BitFloatImageData(unsigned short const* pixels, PositionExtentInPixelSpace const& region,
                                 PixelExtentInWorldSpace const& pixelExtent, tePixelFormat layout,
                                 unsigned int rowLength);
    /// 32-bit float by default.
    void load32BitFloatImageData(float const* pixels, PositionExtentInPixelSpace const& region,
                                 PixelExtentInWorldSpace const& pixelExtent, tePixelFormat layout,
                                 unsigned int rowLength);
    /// @}

    /// \name The same with one direct copy in place of the upload through buffers
    /// @{
    void load8BitUnsignedImageData_DEPRECATED_2_0(unsigned char const* pixels,
                                                  PositionExtentInPixelSpace const& region,
                                                  PixelExtentInWorldSpace const& pixelExtent,
                                                  tePixelFormat layout, unsigned int rowLength);
    void load16BitUnsignedImageData_DEPRECATED_2_0(unsigned short const* pixels,
                                                   PositionExtentInPixelSpace const& region,
                                                   PixelExtentInWorldSpace const& pixelExtent,
                                                   tePixelFormat layout, unsigned int rowLength);
    void load16BitFloatImageData_DEPRECATED_2_0(unsigned short const* pixels,
                                                PositionExtentInPixelSpace const& region,
                                                PixelExtentInWorldSpace const& pixelExtent,
                                                tePixelFormat layout, unsigned int rowLength);
    void load32BitFloatImageData_DEPRECATED_2_0(float const* pixels, PositionExtentInPixelSpace const& region,
                                                PixelExtentInWorldSpace const& pixelExtent,
                                                tePixelFormat layout, unsigned int rowLength);
    /// @}

protected:
    /// The channels of the image's format, where `nChannels` serves it; otherwise the base's answer.
    std::size_t getNumChannelsOutput() override;
    void internalProcess() override;

    /// The OpenGL token of a layout: GL_BGRA, GL_RGBA, GL_RGB or GL_LUMINANCE. Throws `ParameterException`
    /// "Invalid pixel format.".
    static unsigned ConvertToPixelFormatGL(tePixelFormat layout);
    /// The texture format for "OutputPrecisionHint": RGBA8 for 8-bit integer, RGBA16F for 16-bit float,
    /// `fallback` for the default. Throws `ParameterException` "Invalid output precision hint.".
    ImageGPU::tePixelFormat recommendedImageGPUPixelFormat(ImageGPU::tePixelFormat fallback);

private:
    struct RawPixels;

    void checkReleasable() const;
    ImageGPU const& image() const;
    void copyIntoBoundImage();
    void load(RawPixels const& raw, bool bAsync);

    DataFlow::ConstDataPointer<ImageGPU> imageDataPtr_;
    bool bReleasable_;
    bool bEmitted_;
    bool bBufferChanged_;
    bool bGeneratedFromImage_;
    DataFlow::ConstOutput<ImageGPU> oOutputImage_;
    TextureUpload oUpload_;
};

} // namespace ORVO
