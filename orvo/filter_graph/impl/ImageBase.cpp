#include "orvo/filter_graph/impl/ImageBase.h"

#include "orvo/core/Check.h"
#include "orvo/core/spaces/Conversions.h"
#include "orvo/image_runtime/images/ImageBase.h"

#include <limits>
#include <utility>

namespace ORVO::FilterGraph {

namespace {

bool isFarCornerRepresentable(int position, int extent) {
    return position <= 0 || extent <= std::numeric_limits<int>::max() - position;
}

void checkRect(PositionExtentInPixelSpace const& rect) {
    ExtentInPixelSpace const extent = rect.extent();
    ORVO_CHECK_PARAMETER(extent.width() >= 0 && extent.height() >= 0, "Image extent must not be negative");
    ORVO_CHECK_PARAMETER(isFarCornerRepresentable(rect.position().x(), extent.width()) &&
                             isFarCornerRepresentable(rect.position().y(), extent.height()),
                         "Image rectangle exceeds the range of pixel positions");
}

} // namespace

ImageBase::ImageBase(ImageDescriptor const& descriptor) : oDescriptor_(descriptor) {}

ImageBase::ImageBase(ImageDescriptor const& descriptor, PositionExtentInPixelSpace const& rect)
    : oDescriptor_(descriptor) {
    setRect(rect);
}

ImageBase::~ImageBase() = default;

std::size_t ImageBase::width() const { return static_cast<std::size_t>(oRect_.extent().width()); }

std::size_t ImageBase::height() const { return static_cast<std::size_t>(oRect_.extent().height()); }

int2 ImageBase::offset() const { return oRect_.position().positionAsInt2(); }

void ImageBase::setRect(PositionExtentInPixelSpace const& rect) {
    checkRect(rect);
    oRect_ = rect;
    oRegion_ = PositionExtentInWorldSpace();
    oRegion_.include(pixelToWorldSpace(rect, oDescriptor_.pixelExtent()));
    nContentStamp_ = 0;
}

void ImageBase::setWrappedImage(std::shared_ptr<ORVO::ImageBase> pImage) {
    pImage_ = std::move(pImage);
    nContentStamp_ = 0;
}

} // namespace ORVO::FilterGraph
