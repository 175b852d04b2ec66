#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/images/ImageGPU.h"

namespace ORVO {

/// Keeps the last image in a texture that it passed, and can emit it again without its input running: as
/// BufferCPU in all that it does. Input "InputImage", output "OutputImage".
///
/// The image is shared with the consumer, so that one that wants an image of its own fails, as does an
/// ImageGPUOutput.
///
/// Throws `InternalException` "Enforce pImage != NULL" for a run without an input image, and on a bound
/// output as ImageGPUInput.
///
/// Threads: as ImageFilter; `hasData` and `bufferDOD` between frames. Runs into a bound output, and the death
/// of images, need a current context that shares with one of the image runtime's.
class ORVO_API BufferGPU : public ImageFilter {
public:
    /// Node name "BufferGPU".
    BufferGPU();
    ~BufferGPU() override;

    /// Lets the next run give the image that is kept.
    void emit() override;
    /// True.
    bool canEmit() const override;
    /// Before a run that passes as `Node::isReady`; before one that emits: whether there is an image, and no
    /// output that is not bound still holds data.
    bool isReady() const override;
    /// True.
    bool willRunInHardware() override;

    /// Whether an image is kept.
    bool hasData() const;
    /// The pixels that the image which is kept covers; a default rectangle if there is none.
    virtual PositionExtentInPixelSpace bufferDOD() const;

protected:
    void internalProcess() override;

private:
    void passOn();
    void handOut();

    bool bPassThrough_;
    DataFlow::ConstDataPointer<ImageGPU> oBuffered_;
    DataFlow::ConstInput<ImageGPU> oInputImage_;
    DataFlow::ConstOutput<ImageGPU> oOutputImage_;
};

} // namespace ORVO
