#include "orvo/image_flow/sources/DeformationSource.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SaturatingCast.h"
#include "orvo/image_flow/sources/TextureRegionCopy.h"
#include "orvo/image_runtime/GLStateUtils.h"
#include "orvo/ogl/internal/GL.h"

namespace ORVO {

DeformationSource::DeformationSource(char const* name, DeformationMap* map)
    : ImageFilter(name, OUTPUT_PRECISION_DEFAULT), bEmitted_(false), oOutputImage_("OutputImage", this) {
    inputTarget_ = ORVO_TARGET_GL;
    outputTarget_ = ORVO_TARGET_GL;
    nForcedChannels_ = 2;
    setImageOutput(&oOutputImage_);
    setDeformationMap(map);
}

DeformationSource::~DeformationSource() = default;

void DeformationSource::setDeformationMap(DeformationMap* map) {
    DeformationMap const given = map != nullptr ? *map : DeformationMap();
    PositionExtentInPixelSpace const rectangle(
        PositionInPixelSpace(0, 0),
        ExtentInPixelSpace(saturatingCast<int>(given.width), saturatingCast<int>(given.height)));
    PixelExtentInWorldSpace const pixelExtent(1.0F, 1.0F);
    DataFlow::ConstDataPointer<ImageGPU> oImage(
        ORVO_NEW ImageGPU(rectangle, ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, pixelExtent, true));
    if (given.data != nullptr) {
        oImage->copyImageData(reinterpret_cast<unsigned char const*>(given.data), rectangle, pixelExtent,
                              GL_LUMINANCE_ALPHA, GL_FLOAT, 0);
    }
    ScopedActiveTextureUnitRestore const restore;
    oImage->bind(0);
    oImage->setWrap(GL_CLAMP_TO_EDGE, GL_CLAMP_TO_EDGE);
    oImage->bindDefault();
    oImage_ = oImage;
}

ExtentInPixelSpace DeformationSource::size() const {
    return oImage_.get() == nullptr ? ExtentInPixelSpace(0, 0) : oImage_->extent();
}

int DeformationSource::width() const { return size().width(); }

int DeformationSource::height() const { return size().height(); }

bool DeformationSource::canEmit() const { return true; }

void DeformationSource::emit() { bEmitted_ = false; }

PositionExtentInWorldSpace DeformationSource::generated(RegionMap const& /*inputDODs*/) {
    return pixelToWorldSpace(PositionExtentInPixelSpace(PositionInPixelSpace(0, 0), size()),
                             PixelExtentInWorldSpace(1.0F, 1.0F));
}

bool DeformationSource::isReady() const {
    return ImageFilter::isReady() && oImage_.get() != nullptr && !bEmitted_;
}

void DeformationSource::internalProcess() {
    ORVO_ENFORCE(oImage_.get());
    if (oOutputImage_.bound()) {
        allocateOutputImage();
        copyTextureRegion(*oImage_, *boundOutputImageGPU(), oOutputRegionInPixels_);
    } else {
        oOutputImage_ = oImage_;
    }
    bPreparedForRender_ = false;
    bEmitted_ = true;
}

} // namespace ORVO
