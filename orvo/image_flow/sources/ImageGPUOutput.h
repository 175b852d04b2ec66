#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/images/ImageGPU.h"

namespace ORVO {

/// The sink that takes the result of a graph out as an image in a texture. The image stays here after the
/// frame, also through a flush of the graph, until it is released or replaced by the next frame's.
///
/// The sink takes the image alone: where another node or a source goes on holding it, the frame fails with
/// `InternalException` "Not implemented: no copying of ImageGPU allowed".
///
/// Threads: the client's thread, between frames. The death of an image needs a current context that shares
/// with one of the image runtime's.
class ORVO_API ImageGPUOutput : public ImageFilter {
public:
    /// Node name "ImageGPUOutput", input name "InputImage".
    ImageGPUOutput();
    ImageGPUOutput(char const* nodeName, char const* inputName);
    ~ImageGPUOutput() override;

    /// True.
    bool willRunInHardware() override;

    /// Hands the result to the caller, who owns it then; null if there is none.
    virtual ImageGPU* releaseImageGPU();
    /// The result of the last frame, which the sink goes on owning; null if there is none.
    virtual ImageGPU const* getImageGPU() const;

protected:
    /// Takes the image out of the input. Throws "Enforce deleter != NULL" for an image that is not the
    /// graph's to give away.
    void internalProcess() override;

private:
    DataFlow::Input<ImageGPU> oInputImage_;
    DataFlow::ConstDataPointer<ImageGPU> imageDataPtr_;
};

} // namespace ORVO
