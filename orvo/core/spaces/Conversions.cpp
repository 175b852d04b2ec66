#include "orvo/core/spaces/Conversions.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include "orvo/core/spaces/PixelExtentInWorldSpace.h"
#include "orvo/core/spaces/PositionExtentInPixelSpace.h"
#include "orvo/core/spaces/PositionExtentInWorldSpace.h"
#include "orvo/core/utility/SaturatingCast.h"

namespace ORVO {

namespace {

/// One direction of a pixel rectangle.
struct PixelSpan {
    int iPosition_;
    int nExtent_;
};

double snap(double value, double noise) {
    double const nearest = std::nearbyint(value);
    return std::abs(value - nearest) <= noise ? nearest : value;
}

PixelSpan pixelSpanOf(float position, float extent, bool bDefined, float pixelExtent) {
    double const begin = double(position) / double(pixelExtent);
    double const size = double(extent) / double(pixelExtent);
    // Each of the two floats is off by half a unit in its last place, 2^-24 of it, if it was computed in one
    // step; the factor of two leaves room for the steps of a region's journey. The bound keeps real fractions
    // from being lost.
    constexpr double unit = 1.0 / (1 << 23);
    double const noise = std::min((std::abs(begin) + std::abs(size) + 1.0) * unit, 0.25);

    double const first = std::floor(snap(begin, noise));
    int const iPosition = saturatingCast<int>(first);
    if (!bDefined || !(size > 0.0))
        return {iPosition, 0};
    if (size == std::numeric_limits<double>::infinity())
        return {iPosition, std::numeric_limits<int>::max()};
    double const last = std::ceil(snap(begin + size, noise));
    return {iPosition, saturatingCast<int>(last - first)};
}

} // namespace

PositionInWorldSpace pixelToWorldSpace(PositionInPixelSpace const& position,
                                       PixelExtentInWorldSpace const& pixelExtent) noexcept {
    return PositionInWorldSpace(static_cast<float>(double(position.x()) * double(pixelExtent.width())),
                                static_cast<float>(double(position.y()) * double(pixelExtent.height())));
}

ExtentInWorldSpace pixelToWorldSpace(ExtentInPixelSpace const& extent,
                                     PixelExtentInWorldSpace const& pixelExtent) noexcept {
    if (!extent.isDefined())
        return ExtentInWorldSpace();
    return ExtentInWorldSpace(static_cast<float>(double(extent.width()) * double(pixelExtent.width())),
                              static_cast<float>(double(extent.height()) * double(pixelExtent.height())));
}

PositionExtentInWorldSpace pixelToWorldSpace(PositionExtentInPixelSpace const& rectangle,
                                             PixelExtentInWorldSpace const& pixelExtent) noexcept {
    return PositionExtentInWorldSpace(pixelToWorldSpace(rectangle.position(), pixelExtent),
                                      pixelToWorldSpace(rectangle.extent(), pixelExtent));
}

PositionExtentInPixelSpace worldToPixelSpace(PositionExtentInWorldSpace const& rectangle,
                                             PixelExtentInWorldSpace const& pixelExtent) noexcept {
    bool const bDefined = rectangle.extent().isDefined();
    PixelSpan const x =
        pixelSpanOf(rectangle.position().x(), rectangle.extent().width(), bDefined, pixelExtent.width());
    PixelSpan const y =
        pixelSpanOf(rectangle.position().y(), rectangle.extent().height(), bDefined, pixelExtent.height());
    return PositionExtentInPixelSpace(PositionInPixelSpace(x.iPosition_, y.iPosition_),
                                      bDefined ? ExtentInPixelSpace(x.nExtent_, y.nExtent_)
                                               : ExtentInPixelSpace());
}

} // namespace ORVO
