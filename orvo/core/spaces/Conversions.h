/// Conversions between pixel space and world space.
///
/// Threads: any.
#pragma once

#include "orvo/core/Export.h"

namespace ORVO {

class ExtentInPixelSpace;
class ExtentInWorldSpace;
class PixelExtentInWorldSpace;
class PositionExtentInPixelSpace;
class PositionExtentInWorldSpace;
class PositionInPixelSpace;
class PositionInWorldSpace;

/// Position times pixel extent, component by component.
ORVO_API PositionInWorldSpace pixelToWorldSpace(PositionInPixelSpace const& position,
                                                PixelExtentInWorldSpace const& pixelExtent) noexcept;
/// Extent times pixel extent, component by component; undefined stays undefined.
ORVO_API ExtentInWorldSpace pixelToWorldSpace(ExtentInPixelSpace const& extent,
                                              PixelExtentInWorldSpace const& pixelExtent) noexcept;
/// Both of the above.
ORVO_API PositionExtentInWorldSpace pixelToWorldSpace(PositionExtentInPixelSpace const& rectangle,
                                                      PixelExtentInWorldSpace const& pixelExtent) noexcept;

/// The world rectangle divided by the pixel extent, as the smallest pixel rectangle that covers it: the
/// top-left is floored, the bottom-right ceiled, after edges within float noise of a whole number (2^-23 of
/// the magnitudes in play, at most a quarter of a pixel) have been snapped to it. So
/// worldToPixelSpace(pixelToWorldSpace(r, e), e) == r for every rectangle with coordinates up to 2^20 and
/// every pixel extent from 1e-3 to 1e3.
///
/// An undefined extent stays undefined, and an extent of 0 or less gives 0. Numbers beyond the integer range,
/// infinite ones included, give its bounds; NaN gives 0.
ORVO_API PositionExtentInPixelSpace worldToPixelSpace(PositionExtentInWorldSpace const& rectangle,
                                                      PixelExtentInWorldSpace const& pixelExtent) noexcept;

} // namespace ORVO
