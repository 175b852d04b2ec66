#pragma once

#include "orvo/image_runtime/images/ImageBase.h"

#include <algorithm>
#include <cstdint>

namespace ORVO {

/// A stretch of pixels along one axis, its end exclusive. Sums of pixel positions and lengths, which may pass
/// the numbers of int, are right.
///
/// Threads: a plain value.
class PixelStretch {
public:
    PixelStretch(int begin, int length) : nBegin_(begin), nEnd_(std::int64_t(begin) + std::max(length, 0)) {}

    void intersect(PixelStretch const& other) {
        nBegin_ = std::max(nBegin_, other.nBegin_);
        nEnd_ = std::max(nBegin_, std::min(nEnd_, other.nEnd_));
    }

    int length() const { return static_cast<int>(nEnd_ - nBegin_); }
    /// The begin, as a distance from a pixel that is no further away than int reaches.
    int from(int origin) const { return static_cast<int>(nBegin_ - origin); }

private:
    std::int64_t nBegin_;
    std::int64_t nEnd_;
};

/// The pixels of a region that images hold and have storage for.
///
/// Threads: a plain value.
class PixelArea {
public:
    explicit PixelArea(PositionExtentInPixelSpace const& region)
        : oX_(region.position().x(), region.extent().width()),
          oY_(region.position().y(), region.extent().height()) {}

    /// Leaves what the image holds.
    void clipTo(ImageBase const& image) {
        ExtentInPixelSpace const capacity = image.capacityExtent();
        oX_.intersect({image.position().x(), std::min(image.extent().width(), capacity.width())});
        oY_.intersect({image.position().y(), std::min(image.extent().height(), capacity.height())});
    }

    bool isEmpty() const { return oX_.length() == 0 || oY_.length() == 0; }
    ExtentInPixelSpace extent() const { return {oX_.length(), oY_.length()}; }
    /// Where the area begins in the storage of an image that it was clipped to.
    PositionInPixelSpace placeIn(ImageBase const& image) const {
        return {oX_.from(image.position().x()), oY_.from(image.position().y())};
    }

private:
    PixelStretch oX_;
    PixelStretch oY_;
};

} // namespace ORVO
