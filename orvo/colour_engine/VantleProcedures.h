#pragma once

#include "orvo/colour_engine/VantleHandles.h"

#include <cstddef>
#include <cstdint>

namespace ORVO {

struct _t_Vantle_PackingSpec;
struct _t_Vantle_ShaderParameterData;

/// The shapes of the procedures that a colour engine serves by name. None of them lets an exception out.
///
/// Threads: any procedure from any thread.

// "VantleInterface2"
using VantleProfileFromCodeProc = VantleResult (*)(VantleProfile** pOut, std::uint32_t code);
using VantleUnReferenceProfileProc = VantleResult (*)(VantleProfile* pProfile);
using VantleUnReferenceStringProc = VantleResult (*)(VantleString* pString);
/// Copies the text without an end mark, at most `capacity` bytes; `pSize` receives the text's length. With a
/// null buffer it only reports the length.
using VantleStringASCIIProc = VantleResult (*)(VantleString* pString, char* pBuffer, std::uint32_t* pSize,
                                               std::uint32_t capacity);
using VantleMakeColorTransformProc = VantleResult (*)(VantleTransform** pOut, VantleProfile* pSource,
                                                      VantleProfile* pDestination, std::uint32_t intent,
                                                      std::uint32_t options);
using VantleReferenceTransformProc = VantleResult (*)(VantleTransform* pTransform);
using VantleUnReferenceTransformProc = VantleResult (*)(VantleTransform* pTransform);
using VantleApplyGeneralProc = VantleResult (*)(VantleTransform* pTransform,
                                                _t_Vantle_PackingSpec const* pSource,
                                                _t_Vantle_PackingSpec const* pDestination, std::uint32_t rows,
                                                std::uint32_t columns, _t_Vantle_Options const* pOptions);
using VantleOptimizeTransformProc = VantleResult (*)(VantleTransform** pOut, VantleTransform* pTransform,
                                                     std::uint32_t options);

// "VantleShaderInterface". A shader is a container object: it is released through "QuorContainerInterface".
using VantleNewShaderProc = VantleResult (*)(std::uint32_t family, VantleTransform* pTransform,
                                             _t_Vantle_Options const* pOptions, VantleShader** pOut);
using VantleFamilyProc = VantleResult (*)(VantleShader* pShader, std::uint32_t* pFamily);
/// Both strings are new references, which the caller drops.
using VantleStringsProc = VantleResult (*)(VantleShader* pShader, VantleString** pEntryPoint,
                                           VantleString** pCode);
using VantleNumParametersProc = VantleResult (*)(VantleShader* pShader, std::uint32_t* pCount);
using VantleParameterProc = VantleResult (*)(VantleShader* pShader, std::uint32_t index,
                                             _t_Vantle_ShaderParameterData* pOut);
/// With a null target it reports the size in bytes; else it copies the data.
using VantleCopyDataProc = VantleResult (*)(VantleShader* pShader, std::uint32_t index, void* pTarget,
                                            std::uint32_t* pSize);

/// The family of shaders that the system asks for: "safs" as a big-endian number.
constexpr std::uint32_t VANTLE_SHADER_FAMILY = 0x73616673;

/// The intents of a transform, with ICC's numbers.
constexpr std::uint32_t VANTLE_INTENT_PERCEPTUAL = 0;
constexpr std::uint32_t VANTLE_INTENT_ABSOLUTE = 3;

} // namespace ORVO
