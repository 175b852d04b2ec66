#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/images/ImageGPU.h"

namespace ORVO {

/// What BufferCPU and BufferGPU have in common: a node that keeps the last image that it passed, and can emit
/// it again without its input running. Input "InputImage", output "OutputImage".
///
/// A run passes the input's image on and keeps it. A run after `emit` gives the image that is kept, whatever
/// region it covers (`bufferDOD`), and takes nothing from the input; the run after that passes again. To be
/// emitted again an image must have been passed: a buffer that is told to emit and keeps none is not ready,
/// also in later frames, until it is run directly. So ask `hasData` first.
///
/// The image is shared with the consumer, and survives a flush. One that a source only refers to must live
/// for as long as the buffer may give it. Where the output is bound, the compute region is copied into the
/// bound image, as far as the image covers it.
///
/// Throws `InternalException` "Enforce pImage != NULL" for a run without an input image.
///
/// Threads: as ImageFilter; `hasData` and `bufferDOD` between frames.
template <class Image>
class ImageBuffer : public ImageFilter {
public:
    ~ImageBuffer() override;

    /// Lets the next run give the image that is kept.
    void emit() override;
    /// True.
    bool canEmit() const override;
    /// Before a run that passes as `Node::isReady`; before one that emits: whether there is an image, and no
    /// output that is not bound still holds data.
    bool isReady() const override;

    /// Whether an image is kept.
    bool hasData() const;
    /// The pixels that the image which is kept covers; a default rectangle if there is none.
    virtual PositionExtentInPixelSpace bufferDOD() const;

protected:
    /// `target` is that of input and output.
    ImageBuffer(char const* name, TargetPlatform target);

    void internalProcess() override;
    /// Copies the compute region of `image` into the image that the output is bound to.
    virtual void copyToBoundOutput(Image const& image) = 0;

private:
    void passOn();
    void handOut();

    bool bPassThrough_;
    DataFlow::ConstDataPointer<Image> oBuffered_;
    DataFlow::ConstInput<Image> oInputImage_;
    DataFlow::ConstOutput<Image> oOutputImage_;
};

extern template class ORVO_API ImageBuffer<ImageCPU>;
extern template class ORVO_API ImageBuffer<ImageGPU>;

} // namespace ORVO
