#pragma once

#include <cstddef>
#include <cstdint>

namespace ORVO {

struct VantleString;

/// One table or matrix of a transform's shader, filled in by the engine's `Parameter`. The layout is binding
/// for every engine. Formats, types, filters, wrap modes and targets are OpenGL's own numbers.
struct _t_Vantle_ShaderParameterData {
    /// Values of `kind`: four characters as a big-endian number.
    static constexpr std::uint32_t KIND_TEXTURE_1D = 0x73743164; ///< "st1d"
    static constexpr std::uint32_t KIND_TEXTURE_2D = 0x73743264; ///< "st2d"
    static constexpr std::uint32_t KIND_TEXTURE_3D = 0x73743364; ///< "st3d"
    static constexpr std::uint32_t KIND_TEXTURE_4D = 0x73743464; ///< "st4d"
    static constexpr std::uint32_t KIND_MATRIX_3X3 = 0x736d3333; ///< "sm33"
    static constexpr std::uint32_t KIND_MATRIX_4X4 = 0x736d3434; ///< "sm44"

    std::uint32_t kind;
    VantleString* name; ///< the uniform's name; the receiver drops the reference
    std::uint32_t target;
    std::int32_t level;
    std::uint32_t internalFormat;
    std::uint32_t width;
    std::uint32_t height;
    std::uint32_t depth;
    std::int32_t border;
    std::uint32_t format;
    std::uint32_t type;
    std::uint32_t minFilter;
    std::uint32_t magFilter;
    std::uint32_t wrapR;
    std::uint32_t wrapS;
    std::uint32_t wrapT;
    void const* data; ///< the texels, owned by the shader; null for a matrix
};

static_assert(offsetof(_t_Vantle_ShaderParameterData, kind) == 0);
static_assert(offsetof(_t_Vantle_ShaderParameterData, name) == 8);
static_assert(offsetof(_t_Vantle_ShaderParameterData, target) == 16);
static_assert(offsetof(_t_Vantle_ShaderParameterData, level) == 20);
static_assert(offsetof(_t_Vantle_ShaderParameterData, internalFormat) == 24);
static_assert(offsetof(_t_Vantle_ShaderParameterData, width) == 28);
static_assert(offsetof(_t_Vantle_ShaderParameterData, height) == 32);
static_assert(offsetof(_t_Vantle_ShaderParameterData, depth) == 36);
static_assert(offsetof(_t_Vantle_ShaderParameterData, border) == 40);
static_assert(offsetof(_t_Vantle_ShaderParameterData, format) == 44);
static_assert(offsetof(_t_Vantle_ShaderParameterData, type) == 48);
static_assert(offsetof(_t_Vantle_ShaderParameterData, minFilter) == 52);
static_assert(offsetof(_t_Vantle_ShaderParameterData, magFilter) == 56);
static_assert(offsetof(_t_Vantle_ShaderParameterData, wrapR) == 60);
static_assert(offsetof(_t_Vantle_ShaderParameterData, wrapS) == 64);
static_assert(offsetof(_t_Vantle_ShaderParameterData, wrapT) == 68);
static_assert(offsetof(_t_Vantle_ShaderParameterData, data) == 72);

} // namespace ORVO
