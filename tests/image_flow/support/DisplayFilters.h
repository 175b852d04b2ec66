/// The filters for previews, one after the other.
#pragma once

#include "tests/image_flow/support/ShaderRoad.h"

#include <memory>
#include <string>
#include <vector>

#include "orvo/image_flow/filters/MirelCheckerBoardGPU.h"
#include "orvo/image_flow/filters/MirelGamutTestCompositeGPU.h"
#include "orvo/image_flow/filters/MirelToneMappingGPU.h"

namespace ORVO::Test {

/// A way to make one of the filters, set up for one of its programs.
struct DisplayFilterRow {
    char const* pName_;
    std::unique_ptr<DisplayFilterGPU> (*pMake_)();
};

/// Every program of every filter.
inline DisplayFilterRow const aDisplayFilters[] = {
    {"CheckerBoard", [] { return std::unique_ptr<DisplayFilterGPU>(new MirelCheckerBoardGPU()); }},
    {"CheckerBoardWithGamma",
     [] {
         auto upFilter = std::make_unique<MirelCheckerBoardGPU>();
         upFilter->compositeGamma().setValue(2.25f);
         return std::unique_ptr<DisplayFilterGPU>(std::move(upFilter));
     }},
    {"ToneMapping", [] { return std::unique_ptr<DisplayFilterGPU>(new MirelToneMappingGPU()); }},
    {"GamutTestComposite",
     [] {
         auto upFilter = std::make_unique<MirelGamutTestCompositeGPU>();
         upFilter->color().setValue(float4(1.0f, 0.5f, 0.25f, 1.0f));
         upFilter->opacity().setValue(0.5f);
         return std::unique_ptr<DisplayFilterGPU>(std::move(upFilter));
     }},
};

/// One of the filters with pictures at its inputs, and with frames of its own.
class DisplayFilterRoad {
public:
    DisplayFilterRoad(OGL::Context const& context, DisplayFilterRow const& row)
        : upFilter_(row.pMake_()), upRoad_(std::make_unique<ShaderRoad>(context, *upFilter_)) {}

    /// Binds random pictures without negative colours.
    void setPictures(PositionExtentInPixelSpace const& region) {
        std::vector<ImageGPUPtr> aupImages;
        for (unsigned i = 0; i < upFilter_->numberOfImageInputs(); ++i) {
            Texels picture = randomTexels(region, 5 + i);
            for (int y = picture.top(); y < picture.top() + picture.height(); ++y)
                for (int x = picture.left(); x < picture.left() + picture.width(); ++x)
                    for (double& value : picture.at(x, y))
                        value = (value + 0.75) / 2.25;
            aupImages.push_back(textureOf(picture, ImageGPU::PIXEL_FORMAT_RGBA8));
            upRoad_->setInput(i, *aupImages.back());
        }
        aupImages_ = std::move(aupImages);
    }

    /// Runs a frame.
    Texels run(PositionExtentInPixelSpace const& region) {
        return Texels(*upRoad_->run(pixelToWorldSpace(region, PixelExtentInWorldSpace())));
    }

    DisplayFilterGPU& filter() { return *upFilter_; }
    ShaderRoad& road() { return *upRoad_; }
    ImageGPU const& image(std::size_t i) const { return *aupImages_[i]; }

private:
    std::unique_ptr<DisplayFilterGPU> upFilter_;
    std::vector<ImageGPUPtr> aupImages_;
    std::unique_ptr<ShaderRoad> upRoad_;
};

} // namespace ORVO::Test
