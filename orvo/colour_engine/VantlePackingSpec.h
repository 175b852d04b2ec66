#pragma once

#include <cstddef>
#include <cstdint>

namespace ORVO {

/// How pixels lie in memory, for the engine's `ApplyGeneral`: channels of `bytesPerChannel` bytes in planes
/// with strides. The layout is binding for every engine.
///
/// 8-bit samples are on the scale 0..255, 16-bit samples on the scale 0..32768 of the CPU images.
struct _t_Vantle_PackingSpec {
    /// One channel. Row r, column c lies at `base + r * rowBytes + c * columnBytes`.
    struct Plane {
        void* base;               ///< first sample of the channel in the first row
        std::int32_t rowBytes;    ///< from one row to the next
        std::int32_t columnBytes; ///< from one pixel to the next
        std::int32_t planeBytes;  ///< 0
        std::int32_t unused;
    };

    /// Values of `space`: the four characters "RGB " and "GRAY" as a big-endian number.
    static constexpr std::uint32_t SPACE_RGB = 0x52474220;
    static constexpr std::uint32_t SPACE_GRAY = 0x47524159;

    std::uint32_t reserved0;       ///< 0
    std::uint32_t space;           ///< `SPACE_RGB` or `SPACE_GRAY`
    std::uint32_t channels;        ///< 3 or 1
    std::uint32_t bytesPerChannel; ///< 1 or 2
    std::uint32_t reserved1;       ///< 0
    std::uint32_t reserved2;       ///< 0
    std::uint64_t unused;
    Plane planes[4]; ///< the first `channels` of them count
};

static_assert(offsetof(_t_Vantle_PackingSpec, reserved0) == 0);
static_assert(offsetof(_t_Vantle_PackingSpec, space) == 4);
static_assert(offsetof(_t_Vantle_PackingSpec, channels) == 8);
static_assert(offsetof(_t_Vantle_PackingSpec, bytesPerChannel) == 12);
static_assert(offsetof(_t_Vantle_PackingSpec, reserved1) == 16);
static_assert(offsetof(_t_Vantle_PackingSpec, reserved2) == 20);
static_assert(offsetof(_t_Vantle_PackingSpec, planes) == 32);
static_assert(offsetof(_t_Vantle_PackingSpec::Plane, base) == 0);
static_assert(offsetof(_t_Vantle_PackingSpec::Plane, rowBytes) == 8);
static_assert(offsetof(_t_Vantle_PackingSpec::Plane, columnBytes) == 12);
static_assert(offsetof(_t_Vantle_PackingSpec::Plane, planeBytes) == 16);
static_assert(sizeof(_t_Vantle_PackingSpec::Plane) == 24);

} // namespace ORVO
