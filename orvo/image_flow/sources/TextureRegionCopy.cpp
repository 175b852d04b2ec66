#include "orvo/image_flow/sources/TextureRegionCopy.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/sources/PixelArea.h"
#include "orvo/image_flow/sources/ScopedReadFramebuffer.h"
#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/ogl/Texture2D.h"

namespace ORVO {

namespace {

/// The kind of channels of a format: the formats run through the four precisions for each.
int kindOfChannels(ImageGPU::tePixelFormat format) { return format / 4; }

} // namespace

void copyTextureRegion(ImageGPU const& source, ImageGPU& target, PositionExtentInPixelSpace const& region) {
    ORVO_CHECK_PARAMETER(kindOfChannels(source.pixelFormat()) == kindOfChannels(target.pixelFormat()),
                         "Source and bound output image differ in their channels");
    PixelArea area(region);
    area.clipTo(source);
    area.clipTo(target);
    // The client may have bound the image that is also the source: a texture is not copied onto itself.
    if (area.isEmpty() || source.texture() == target.texture()) {
        return;
    }
    // A framebuffer that is read from leaves the texture as it is.
    ScopedReadFramebuffer const framebuffer(const_cast<OGL::Texture2D&>(*source.texture()));
    target.copyFrameBufferData(area.placeIn(target), area.placeIn(source), area.extent());
}

} // namespace ORVO
