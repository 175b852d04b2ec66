#pragma once

#include "orvo/colour_engine/VantleProcedures.h"
#include "orvo/core/Export.h"
#include "orvo/image_flow/colour/QuorTable.h"

#include <cstdint>

namespace ORVO {

/// The client of "VantleShaderInterface": descriptions of transforms as shaders. The operations return the
/// engine's result, as those of `CVantle`, and throw `TrelException` "couldn't init CVantle" where no engine
/// can be reached.
///
/// Threads: any.
class ORVO_API CVantleShader {
public:
    CVantleShader() = delete;

    /// The table behind the operations, of 6 slots.
    static ImageFlow::QuorTable const& table() noexcept;

    /// `family` is VANTLE_SHADER_FAMILY. The caller drops the shader with `release`.
    static VantleResult NewShader(std::uint32_t family, VantleTransform* pTransform,
                                  _t_Vantle_Options const* pOptions, VantleShader** pOut);
    static VantleResult Family(VantleShader* pShader, std::uint32_t* pFamily);
    /// Both strings are the caller's to drop with `CVantle::UnReferenceString`.
    static VantleResult Strings(VantleShader* pShader, VantleString** pEntryPoint, VantleString** pCode);
    static VantleResult NumParameters(VantleShader* pShader, std::uint32_t* pCount);
    /// The record's name is the caller's to drop with `CVantle::UnReferenceString`.
    static VantleResult Parameter(VantleShader* pShader, std::uint32_t index,
                                  _t_Vantle_ShaderParameterData* pOut);
    /// With a null target it reports the size in bytes, else it copies the data.
    static VantleResult CopyData(VantleShader* pShader, std::uint32_t index, void* pTarget,
                                 std::uint32_t* pSize);

    /// Drops a reference on a shader, through the container interface. Never throws: a shader whose engine is
    /// gone is let go.
    static void release(VantleShader* pShader) noexcept;
};

} // namespace ORVO
