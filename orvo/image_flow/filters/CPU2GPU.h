#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/image_runtime/images/TextureUpload.h"

namespace ORVO {

/// Uploads an image in host memory into a texture: input "InputImage", output "OutputImage". A new texture
/// has exactly the input's size and holds all of it, in the format of `MapImageCPUToGPU`; channels of BGR
/// order come out in RGB order, and 16-bit integers of four channels go up as the bits of 16-bit floats.
/// Where the output is bound, the compute region is uploaded into the bound texture at its place, as far as
/// the input covers it, and the rest of that texture stays untouched; OpenGL converts to its format.
///
/// Throws `InternalException` with the texts of `ImageFilter` and of `MapImageCPUToGPU`, and
/// `OGL::ExceptionOGL` where OpenGL refuses; nothing is handed on then.
///
/// Threads: as `ImageFilter`; a run needs a current context that shares with one of the image runtime's.
class ORVO_API CPU2GPU : public ImageFilter {
public:
    CPU2GPU();
    ~CPU2GPU() override;

protected:
    void internalProcess() override;

private:
    void upload(ImageGPU& image, PositionExtentInPixelSpace const& region);

    DataFlow::ConstInput<ImageCPU> o_InputImage;
    DataFlow::ConstOutput<ImageGPU> o_OutputImage;
    TextureUpload oUpload_;
};

} // namespace ORVO
