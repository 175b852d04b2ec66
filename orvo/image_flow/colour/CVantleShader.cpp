#include "orvo/image_flow/colour/CVantleShader.h"

#include "orvo/image_flow/colour/QuorInterfaces.h"
#include "orvo/image_flow/colour/VantleGuard.h"

namespace ORVO {

namespace {

enum VantleShaderSlot : std::size_t {
    VANTLE_SHADER_NEW_SHADER,
    VANTLE_SHADER_FAMILY_OF,
    VANTLE_SHADER_STRINGS,
    VANTLE_SHADER_NUM_PARAMETERS,
    VANTLE_SHADER_PARAMETER,
    VANTLE_SHADER_COPY_DATA
};

constexpr ImageFlow::QuorRow aShaderRows[] = {
    {VANTLE_SHADER_NEW_SHADER, "NewShader", "VantleNewShaderProc"},
    {VANTLE_SHADER_FAMILY_OF, "Family", "VantleFamilyProc"},
    {VANTLE_SHADER_STRINGS, "Strings", "VantleStringsProc"},
    {VANTLE_SHADER_NUM_PARAMETERS, "NumParameters", "VantleNumParametersProc"},
    {VANTLE_SHADER_PARAMETER, "Parameter", "VantleParameterProc"},
    {VANTLE_SHADER_COPY_DATA, "CopyData", "VantleCopyDataProc"},
};

std::atomic<void*> aShaderSlots[6];
constinit ImageFlow::QuorTable oShaderTable("VantleShaderInterface", aShaderRows, std::size(aShaderRows),
                                            aShaderSlots);
constinit ImageFlow::VantleGuard oVantleShader(oShaderTable);

} // namespace

ImageFlow::QuorTable const& CVantleShader::table() noexcept { return oShaderTable; }

VantleResult CVantleShader::NewShader(std::uint32_t family, VantleTransform* pTransform,
                                      _t_Vantle_Options const* pOptions, VantleShader** pOut) {
    return oVantleShader.procedure<VantleNewShaderProc>(VANTLE_SHADER_NEW_SHADER)(family, pTransform,
                                                                                  pOptions, pOut);
}

VantleResult CVantleShader::Family(VantleShader* pShader, std::uint32_t* pFamily) {
    return oVantleShader.procedure<VantleFamilyProc>(VANTLE_SHADER_FAMILY_OF)(pShader, pFamily);
}

VantleResult CVantleShader::Strings(VantleShader* pShader, VantleString** pEntryPoint, VantleString** pCode) {
    return oVantleShader.procedure<VantleStringsProc>(VANTLE_SHADER_STRINGS)(pShader, pEntryPoint, pCode);
}

VantleResult CVantleShader::NumParameters(VantleShader* pShader, std::uint32_t* pCount) {
    return oVantleShader.procedure<VantleNumParametersProc>(VANTLE_SHADER_NUM_PARAMETERS)(pShader, pCount);
}

VantleResult CVantleShader::Parameter(VantleShader* pShader, std::uint32_t index,
                                      _t_Vantle_ShaderParameterData* pOut) {
    return oVantleShader.procedure<VantleParameterProc>(VANTLE_SHADER_PARAMETER)(pShader, index, pOut);
}

VantleResult CVantleShader::CopyData(VantleShader* pShader, std::uint32_t index, void* pTarget,
                                     std::uint32_t* pSize) {
    return oVantleShader.procedure<VantleCopyDataProc>(VANTLE_SHADER_COPY_DATA)(pShader, index, pTarget,
                                                                                pSize);
}

void CVantleShader::release(VantleShader* pShader) noexcept {
    auto* const pRelease = ImageFlow::freshProcedure<QuorContainerReleaseProc>(
        ImageFlow::quorContainerInterface(), ImageFlow::QUOR_CONTAINER_RELEASE);
    if (pShader != nullptr && pRelease != nullptr) {
        pRelease(reinterpret_cast<QuorContainer*>(pShader));
    }
}

} // namespace ORVO
