#include "orvo/image_runtime/images/ImageBase.h"

#include "orvo/core/Check.h"

#include <cstdint>
#include <ostream>

namespace ORVO {

ImageBase::ImageBase() : oPixelExtent_(1.0f, 1.0f), eTargetPlatform_(ORVO_TARGET_UNSET) {}

ImageBase::ImageBase(PositionExtentInPixelSpace const& positionExtent,
                     PixelExtentInWorldSpace const& pixelExtent)
    : oPositionExtent_(positionExtent), oPixelExtent_(pixelExtent), eTargetPlatform_(ORVO_TARGET_UNSET) {
    // One text stands for both axes.
    ORVO_CHECK(pixelExtent.width() > 0 && pixelExtent.height() > 0,
               "pixelExtent.pixelExtent().extentAsFloat2().x > 0");
}

ImageBase::~ImageBase() = default;

void ImageBase::doWrite(std::ostream& stream) const {
    stream << "Image address : " << static_cast<void const*>(this) << "\n";
    stream << "Image extent : " << extent() << "\n";
    stream << "Image position : " << position() << "\n";
    stream << "Image # pixels : " << numberOfPixels() << "\n";
    stream << "Image capacity : " << capacityExtent() << "\n";
    stream << "Image pixel extent : " << pixelExtent() << "\n";
}

ExtentInPixelSpace const& ImageBase::extent() const { return oPositionExtent_.extent(); }

PositionInPixelSpace const& ImageBase::position() const { return oPositionExtent_.position(); }

PositionExtentInPixelSpace const& ImageBase::positionExtent() const { return oPositionExtent_; }

PixelExtentInWorldSpace ImageBase::pixelExtent() const { return oPixelExtent_; }

void ImageBase::setPixelExtent(PixelExtentInWorldSpace const& pixelExtent) { oPixelExtent_ = pixelExtent; }

std::size_t ImageBase::numberOfPixels() const {
    return static_cast<std::uint32_t>(extent().width()) * static_cast<std::uint32_t>(extent().height());
}

TargetPlatform ImageBase::targetPlatform() const { return eTargetPlatform_; }

} // namespace ORVO
