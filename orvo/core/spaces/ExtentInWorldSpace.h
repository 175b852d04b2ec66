#pragma once

#include <iosfwd>

#include "orvo/core/Export.h"
#include "orvo/core/math/Float.h"

namespace ORVO {

/// A width and a height in world space, or undefined: no region yet.
///
/// An extent is infinite if its width or its height is IEEE infinity; an undefined one is not.
///
/// Threads: a plain value.
class ORVO_API ExtentInWorldSpace {
public:
    /// Undefined.
    ExtentInWorldSpace() noexcept = default;
    /// Defined, whatever the numbers.
    ExtentInWorldSpace(float width, float height) noexcept : oExtent_(width, height), bDefined_(true) {}
    explicit ExtentInWorldSpace(float2 const& extent) noexcept : oExtent_(extent), bDefined_(true) {}

    /// An extent that is infinite in both directions.
    static ExtentInWorldSpace infinite() noexcept;

    /// 0 while undefined.
    float width() const noexcept { return oExtent_.x; }
    float height() const noexcept { return oExtent_.y; }
    float2 const& extentAsFloat2() const noexcept { return oExtent_; }

    bool isDefined() const noexcept { return bDefined_; }
    bool isInfinite() const noexcept;

private:
    float2 oExtent_;
    bool bDefined_ = false;
};

/// Equal if both are undefined, or both are defined and have equal numbers.
ORVO_API bool operator==(ExtentInWorldSpace const& a, ExtentInWorldSpace const& b) noexcept;
ORVO_API bool operator!=(ExtentInWorldSpace const& a, ExtentInWorldSpace const& b) noexcept;
/// Writes "(width, height)" or "undefined".
ORVO_API std::ostream& operator<<(std::ostream& stream, ExtentInWorldSpace const& extent);

} // namespace ORVO
