#include "orvo/image_flow/filters/CPU2GPU.h"

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/image_flow/filters/FormatEnumConversionUtil.h"
#include "orvo/image_flow/sources/PixelArea.h"
#include "orvo/ogl/Texture2D.h"

#include <cstddef>
#include <memory>

namespace ORVO {

CPU2GPU::CPU2GPU()
    : ImageFilter("CPU2GPU", OUTPUT_PRECISION_DEFAULT),
      o_InputImage("InputImage", this),
      o_OutputImage("OutputImage", this) {
    inputTarget_ = ORVO_TARGET_CPU;
    outputTarget_ = ORVO_TARGET_GL;
    addImageInput(&o_InputImage);
    setImageOutput(&o_OutputImage);
}

CPU2GPU::~CPU2GPU() = default;

void CPU2GPU::internalProcess() {
    allocateOutputImage();
    bPreparedForRender_ = false;
    if (ImageGPU* const pBoundImage = boundOutputImageGPU()) {
        upload(*pBoundImage, oOutputRegionInPixels_);
        return;
    }
    ImageCPU const& input = *o_InputImage;
    ImageGPU::tePixelFormat formatGPU{};
    OGL::Texture::Format format{};
    OGL::Texture::Type type{};
    MapImageCPUToGPU(input.pixelFormat(), formatGPU, format, type);
    std::unique_ptr<ImageGPU, ORVODeleter<ImageGPU>> upImage(
        ORVO_NEW ImageGPU(input.positionExtent(), formatGPU, input.pixelExtent(), true));
    upload(*upImage, input.positionExtent());
    o_OutputImage.setData(upImage.release());
}

void CPU2GPU::upload(ImageGPU& image, PositionExtentInPixelSpace const& region) {
    ImageCPU const& input = *o_InputImage;
    ImageGPU::tePixelFormat formatGPU{};
    OGL::Texture::Format format{};
    OGL::Texture::Type type{};
    MapImageCPUToGPU(input.pixelFormat(), formatGPU, format, type);
    PixelArea area(region);
    area.clipTo(input);
    area.clipTo(image);
    if (area.isEmpty()) {
        return;
    }
    auto const pitch = static_cast<std::size_t>(input.capacityExtent().width());
    PositionInPixelSpace const from = area.placeIn(input);
    std::size_t const nFirst =
        static_cast<std::size_t>(from.y()) * pitch + static_cast<std::size_t>(from.x());
    bool const bTight = input.capacityExtent().width() == area.extent().width();
    oUpload_.asyncUpload(image.texture(), 0, {area.placeIn(image), area.extent()}, format, type,
                         input.pixels() + nFirst * pixelSizeBytes(input.pixelFormat()),
                         bTight ? 0 : static_cast<unsigned>(pitch));
}

} // namespace ORVO
