#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_flow/sources/PixelLayout.h"

namespace ORVO {

class ImageRegionCopy;

/// The source that puts an image in host memory into a graph. It runs once for each `emit`, when its output
/// "OutputImage" is empty or bound, and shares its image with the consumer: it copies nothing unless its
/// output is bound. Then it writes its compute region into the bound image, as far as its own image covers
/// it, converting the channel type and the order of the channels. The image survives a flush of the graph.
///
/// Failures are `InternalException`s with the stated texts. A run with a bound output throws also "No
/// ImageCPU set yet.", and `ParameterException` "Source and bound output image differ in their channels"
/// where the two have another number of channels; the bound image is untouched then.
///
/// Threads: setters and loaders by the client's thread, between frames.
class ORVO_API ImageCPUInput : public ImageFilter {
public:
    /// A source without an image that has nothing to emit.
    ImageCPUInput();
    ~ImageCPUInput() override;

    /// Lets the source run once more.
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
    /// Computes the output region in pixels and takes a bound output; allocates nothing.
    void allocateOutputImage() override;

    /// \name The client's image
    /// Each setter throws "ImageCPU already set on input" where an image set by `setImageCPU` has not been
    /// released or cleared; the image given stays the caller's then. Where memory runs out
    /// (`std::bad_alloc`), the image before stays, and an image that was to be owned is destroyed. Null takes
    /// the image away.
    /// @{

    /// The source owns the image and destroys it when it is replaced.
    virtual void setImageCPUWithRegularOwnership(ImageCPU* image);
    /// The image stays the caller's and must outlive the frames.
    virtual void setImageCPUWithNoOwnership(ImageCPU* image);
    /// The source owns the image until `releaseImageCPU` gives it back.
    virtual void setImageCPU(ImageCPU* image);
    /// Hands the image of `setImageCPU` back to the caller, who owns it then; null if there is none. Throws
    /// "wasReleased" while an output or a consumer still shares it, and "Enforce deleter != NULL" for an
    /// image set with another ownership; the source keeps it then.
    virtual ImageCPU* releaseImageCPU();
    /// The image, which stays where it is; null if there is none.
    virtual ImageCPU* getImageCPU();
    virtual ImageCPU const* getImageCPU() const;
    virtual ImageCPU const* operator->() const;
    /// Lets go of the image; an image that the source owns dies with its last holder.
    void clear();
    /// @}

    /// \name Geometry of the client's image, in pixels
    /// Each throws "No ImageCPU set yet." without an image.
    /// @{
    /// Columns.
    int width() const;
    /// Rows.
    int height() const;
    /// The first column.
    int offsetX() const;
    /// The first row.
    int offsetY() const;
    /// The first column and row.
    PositionInPixelSpace offset() const;
    /// Columns and rows.
    ExtentInPixelSpace size() const;
    /// @}

    /// \name Raw pixels
    /// Each wraps the caller's memory, without copying or owning it, in an image of the source's own:
    /// `region` in pixels, `pixelExtent` in world units a pixel, `rowLength` the pitch in pixels (0: the
    /// region's width). It goes in with regular ownership.
    ///
    /// Throws `ParameterException` for a null `pixels` with a region that has pixels, a negative extent, and
    /// a pitch that is shorter than a row or passes 2^31 - 1; otherwise as the setters. The source is then as
    /// it was.
    /// @{

    /// Layout 0 gives BGRA8, 1 RGBA8, 3 LUMINANCE_ALPHA8 (two channels), any other BGRA8. 0..255 for 0.0
    /// to 1.0.
    void load8BitUnsignedImageData(unsigned char const* pixels, PositionExtentInPixelSpace const& region,
                                   PixelExtentInWorldSpace const& pixelExtent, tePixelFormat layout,
                                   unsigned int rowLength);
    /// Layout 3 gives LUMINANCE16, any other RGBA16. 0..32768 for 0.0 to 1.0.
    void load16BitUnsignedImageData(unsigned short const* pixels, PositionExtentInPixelSpace const& region,
                                    PixelExtentInWorldSpace const& pixelExtent, tePixelFormat layout,
                                    unsigned int rowLength);
    /// Always throws "load16BitFloatImageData not supported for the CPU input connector".
    void load16BitFloatImageData(unsigned short const* pixels, PositionExtentInPixelSpace const& region,
                                 PixelExtentInWorldSpace const& pixelExtent, tePixelFormat layout,
                                 unsigned int rowLength);
    /// Layout 3 gives LUMINANCE32F, any other RGBA32F.
    void load32BitFloatImageData(float const* pixels, PositionExtentInPixelSpace const& region,
                                 PixelExtentInWorldSpace const& pixelExtent, tePixelFormat layout,
                                 unsigned int rowLength);
    /// @}

protected:
    /// The channels of the image's format. Throws "No ImageCPU set yet." without an image.
    std::size_t getNumChannelsOutput() override;
    /// Shares the image with the output, or copies it into the bound image; emitted then.
    void internalProcess() override;
    /// Copies the rows `begin` to `end` (exclusive) of the output region into the bound image. Any thread of
    /// the frame, each its own rows.
    void processSlice(std::size_t begin, std::size_t end) override;

private:
    void checkReleasable() const;
    ImageCPU const& image() const;
    void wrapPixels(ImageCPU::tePixelFormat format, void const* pixels,
                    PositionExtentInPixelSpace const& region, PixelExtentInWorldSpace const& pixelExtent,
                    unsigned int rowLength);

    DataFlow::ConstDataPointer<ImageCPU> imageDataPtr_;
    bool bReleasable_;
    bool bEmitted_;
    bool bBufferChanged_;
    bool bGeneratedFromImage_;
    /// The copy into the bound image while it is under way.
    ImageRegionCopy const* pCopy_;
    DataFlow::ConstOutput<ImageCPU> oOutputImage_;
};

} // namespace ORVO
