#include "orvo/image_flow/filters/ConstTeeJointGPU.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/sources/TextureRegionCopy.h"

namespace ORVO {

ConstTeeJointGPU::ConstTeeJointGPU()
    : ImageFilter("TeeJointGPU", OUTPUT_PRECISION_DEFAULT),
      oInputImage_("InputImage", this),
      oOutputImageA_("OutputImageA", this),
      pOutputImageB_(nullptr) {
    inputTarget_ = ORVO_TARGET_GL;
    outputTarget_ = ORVO_TARGET_GL;
    addImageInput(&oInputImage_);
    setImageOutput(&oOutputImageA_);
    pOutputImageB_ = cloneImageOutput();
    ORVO_ENFORCE(pOutputImageB_);
}

ConstTeeJointGPU::~ConstTeeJointGPU() = default;

bool ConstTeeJointGPU::willRunInHardware() { return true; }

PositionExtentInWorldSpace ConstTeeJointGPU::needed(PositionExtentInWorldSpace const& outputRegion,
                                                    std::string /*inputName*/,
                                                    RegionMap const& /*inputDODs*/) {
    return outputRegion;
}

PositionExtentInWorldSpace ConstTeeJointGPU::changed(PositionExtentInWorldSpace const& inputRegion,
                                                     std::string /*inputName*/,
                                                     RegionMap const& /*inputDODs*/) {
    return inputRegion;
}

void ConstTeeJointGPU::internalProcess() {
    bPreparedForRender_ = false;
    ImageGPU const* const pImage = oInputImage_.get();
    ORVO_ENFORCE(pImage);
    if (oOutputImageA_.bound()) {
        // The one image that is bound to both.
        allocateOutputImage();
        copyTextureRegion(*pImage, *boundOutputImageGPU(), oOutputRegionInPixels_);
        return;
    }
    oOutputImageA_ = oInputImage_;
    static_cast<DataFlow::ConstOutput<ImageGPU>&>(*pOutputImageB_).cloneDataFrom(oOutputImageA_);
}

} // namespace ORVO
