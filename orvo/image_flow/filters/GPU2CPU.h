#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/images/ImageGPU.h"

namespace ORVO {

/// Reads an image in a texture back into host memory: input "InputImage", output "OutputImage". A new image
/// has the input's rectangle, the texture's size as its storage, and the CPU format of the input format's
/// name; only the compute region of it is read. Where the output is bound, the compute region is read into
/// the bound image, and the rest of that image stays untouched; OpenGL converts to its format: numbers
/// outside 0..1 are clamped in an 8-bit image, and one channel is read from the red one.
///
/// Throws `InternalException` with the texts of `ImageFilter` and "Not implemented: pixelFormat in
/// GPU2CPU::internalProcess()" for textures of 16-bit integers, "!\"PIXEL_FORMAT_UNDEFINED\"", "Not
/// implemented: pixelFormat in GPU2CPU::convert()" for a bound image of BGR order or of 16-bit integers,
/// "resultCPU_->pixelExtent() == o_InputImage->pixelExtent()",
/// "resultCPU_->position().x() <= computeRegion.position().x()" and the same for y, and
/// "resultCPU_->extent().width() >= computeRegion.extent().width()" and the same for the height. Textures of
/// 16-bit floats with one or two channels can be read into a bound image alone, since there are no host
/// images of these formats. Throws `OGL::ExceptionOGL` where OpenGL refuses. Nothing is handed on after a
/// failure.
///
/// Threads: as `ImageFilter`; a run needs a current context that shares with one of the image runtime's.
class ORVO_API GPU2CPU : public ImageFilter {
public:
    GPU2CPU();
    ~GPU2CPU() override;

    /// Computes the output region in pixels and checks a bound output; allocates nothing, since the format is
    /// that of an input which is not there yet.
    void allocateOutputImage() override;

protected:
    void internalProcess() override;

private:
    void allocateOutputImageCPU();
    void convert();

    DataFlow::ConstInput<ImageGPU> o_InputImage;
    DataFlow::ConstOutput<ImageCPU> o_OutputImage;
    DataFlow::ConstDataPointer<ImageCPU> resultCPU_;
};

} // namespace ORVO
