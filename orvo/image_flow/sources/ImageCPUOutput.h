#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO {

/// The sink that takes the result of a graph out as an image in host memory. The image stays in its input
/// after the frame, where `getImageCPU` reads it, until it is released, replaced by the next frame or
/// flushed.
///
/// Threads: the client's thread, between frames.
class ORVO_API ImageCPUOutput : public ImageFilter {
public:
    /// Node name "ImageCPUOutput", input name "InputImage".
    ImageCPUOutput();
    /// The same under other names.
    ImageCPUOutput(char const* nodeName, char const* inputName);
    ~ImageCPUOutput() override;

    /// The result of the last frame, which the sink goes on owning; null if there is none.
    virtual ImageCPU const* getImageCPU() const;
    /// Hands the result to the caller, who owns it then; null if there is none. Throws `InternalException`
    /// "Enforce deleter != NULL" for an image that is not the graph's to give away; the sink keeps it then.
    virtual ImageCPU* releaseImageCPU();

protected:
    /// Nothing: the image stays in the input.
    void internalProcess() override;
    /// Nothing: the image stays in the input.
    void postProcess() override;

private:
    DataFlow::Input<ImageCPU> oInputImage_;
};

} // namespace ORVO
