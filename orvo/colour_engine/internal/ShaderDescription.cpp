#include "orvo/colour_engine/internal/ShaderDescription.h"

#include "orvo/colour_engine/internal/ResolvedTransform.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <utility>

namespace ORVO::ColourEngine::Internal {

namespace {

using ShaderParameters = std::vector<ShaderDescription::Parameter>;

// OpenGL's numbers, which the records are written in.
constexpr std::uint32_t nTexture1D = 0x0DE0;
constexpr std::uint32_t nTexture3D = 0x806F;
constexpr std::uint32_t nLuminance = 0x1909;
constexpr std::uint32_t nLuminance32F = 0x8818;
constexpr std::uint32_t nRGB = 0x1907;
constexpr std::uint32_t nRGB16 = 0x8054;
constexpr std::uint32_t nFloat = 0x1406;
constexpr std::uint32_t nNearest = 0x2600;
constexpr std::uint32_t nLinear = 0x2601;
constexpr std::uint32_t nClampToEdge = 0x812F;

constexpr char const* pShaderEntryPoint = "orvoColourTransform";
constexpr std::size_t nCurveEntries = 4096;

/// The driver would interpolate a table of floats in half precision, if at all, so the two neighbours are
/// read one by one: the texel n lies at (n + 0.5) / 4096, and beyond the last one the last is read.
constexpr char const* pCurveFunction = "float orvoCurve(sampler1D table, float x) {\n"
                                       "    float position = clamp(x, 0.0, 1.0) * 4095.0;\n"
                                       "    float entry = floor(position);\n"
                                       "    float lower = texture1D(table, (entry + 0.5) / 4096.0).r;\n"
                                       "    float upper = texture1D(table, (entry + 1.5) / 4096.0).r;\n"
                                       "    return lower + (upper - lower) * (position - entry);\n"
                                       "}\n";

_t_Vantle_ShaderParameterData textureRecord(std::uint32_t kind, std::uint32_t target, std::uint32_t filter) {
    _t_Vantle_ShaderParameterData record{};
    record.kind = kind;
    record.target = target;
    record.height = 1;
    record.depth = 1;
    record.type = nFloat;
    record.minFilter = filter;
    record.magFilter = filter;
    record.wrapR = nClampToEdge;
    record.wrapS = nClampToEdge;
    record.wrapT = nClampToEdge;
    return record;
}

/// The uniform that holds the table: that of an equal table, if there is one, else a new one.
std::string addCurve(ShaderParameters& aParameters, std::string const& sName, std::vector<float> aTable) {
    auto const iSame = std::find_if(aParameters.begin(), aParameters.end(),
                                    [&](auto const& parameter) { return parameter.aData_ == aTable; });
    if (iSame != aParameters.end()) {
        return iSame->sName_;
    }
    auto record = textureRecord(_t_Vantle_ShaderParameterData::KIND_TEXTURE_1D, nTexture1D, nNearest);
    record.internalFormat = nLuminance32F;
    record.format = nLuminance;
    record.width = static_cast<std::uint32_t>(aTable.size());
    aParameters.push_back({sName, record, std::move(aTable)});
    return sName;
}

std::string addMatrix(ShaderParameters& aParameters, std::array<double, 9> const& aMatrix) {
    std::string sName = "orvoMatrix";
    _t_Vantle_ShaderParameterData record{};
    record.kind = _t_Vantle_ShaderParameterData::KIND_MATRIX_3X3;
    std::vector<float> aColumns;
    for (std::size_t column = 0; column < 3; ++column) {
        for (std::size_t row = 0; row < 3; ++row) {
            aColumns.push_back(static_cast<float>(aMatrix[3 * row + column]));
        }
    }
    aParameters.push_back({sName, record, std::move(aColumns)});
    return sName;
}

std::string declarationsOf(ShaderParameters const& aParameters) {
    std::string sCode;
    for (auto const& parameter : aParameters) {
        bool const bMatrix = parameter.record_.kind == _t_Vantle_ShaderParameterData::KIND_MATRIX_3X3;
        bool const b1D = parameter.record_.kind == _t_Vantle_ShaderParameterData::KIND_TEXTURE_1D;
        char const* const pType = bMatrix ? "mat3" : b1D ? "sampler1D" : "sampler3D";
        sCode += std::string("uniform ") + pType + " " + parameter.sName_ + ";\n";
    }
    return sCode;
}

std::string entryFunction(std::string const& sBody) {
    return std::string("void ") + pShaderEntryPoint + "(inout vec4 color) {\n" + sBody + "}\n";
}

std::string describeShaper(MatrixShaper const& shaper, ShaderParameters& aParameters) {
    constexpr std::array<char const*, 3> aChannels{"r", "g", "b"};
    std::string sInputs;
    std::string sOutputs;
    for (std::size_t i = 0; i < 3; ++i) {
        std::string const sTable = addCurve(aParameters, "orvoInput" + std::to_string(i),
                                            shaper.aInputCurves_[i].sample(nCurveEntries));
        sInputs += std::string(i > 0 ? ", " : "") + "orvoCurve(" + sTable + ", color." + aChannels[i] + ")";
    }
    std::string const sMatrix = addMatrix(aParameters, shaper.aMatrix_);
    for (std::size_t i = 0; i < 3; ++i) {
        std::string const sTable = addCurve(aParameters, "orvoOutput" + std::to_string(i),
                                            shaper.aOutputCurves_[i].sampleOverRoot(nCurveEntries));
        sOutputs += std::string(i > 0 ? ", " : "") + "orvoCurve(" + sTable + ", root." + aChannels[i] + ")";
    }
    // The output curves are steep near black: by the square root of the light, the entries are close there.
    return declarationsOf(aParameters) + pCurveFunction +
           entryFunction("    vec3 light = clamp(" + sMatrix + " * vec3(" + sInputs +
                         "), 0.0, 1.0);\n"
                         "    vec3 root = sqrt(light);\n"
                         "    color.rgb = vec3(" +
                         sOutputs + ");\n");
}

/// The texels between 0 and 1.
std::vector<float> texelsOf(ColourCube const& cube) {
    std::vector<float> aTexels = cube.aValues_;
    if (cube.oOutputCurves_.has_value()) {
        std::transform(aTexels.begin(), aTexels.end(), aTexels.begin(), [](float value) {
            return static_cast<float>((static_cast<double>(value) - ColourCube::dLowest_) /
                                      ColourCube::dSpan_);
        });
    }
    return aTexels;
}

std::string describeCube(ColourCube const& cube, ShaderParameters& aParameters) {
    constexpr auto nEdge = static_cast<std::uint32_t>(ColourCube::nEdge_);
    static_assert(nEdge == 33, "The text below has the number of entries in it");
    static_assert(ColourCube::dLowest_ == -0.5 && ColourCube::dSpan_ == 2.0, "These stand in the text below");
    auto record = textureRecord(_t_Vantle_ShaderParameterData::KIND_TEXTURE_3D, nTexture3D, nLinear);
    // Integers, which every driver interpolates; their steps are far below those of the cube.
    record.internalFormat = nRGB16;
    record.format = nRGB;
    record.width = nEdge;
    record.height = nEdge;
    record.depth = nEdge;
    aParameters.push_back({"orvoCube", record, texelsOf(cube)});
    std::string sBody;
    if (cube.oSpacing_.has_value()) {
        std::string const sTable =
            addCurve(aParameters, "orvoSpacing", cube.oSpacing_->sample(nCurveEntries));
        sBody += "    vec3 code = clamp(color.rgb, 0.0, 1.0);\n"
                 "    color.rgb = vec3(orvoCurve(" +
                 sTable + ", code.r), orvoCurve(" + sTable + ", code.g), orvoCurve(" + sTable +
                 ", code.b));\n";
    }
    // From the middle of the first texel to the middle of the last one.
    sBody += "    color.rgb = texture3D(orvoCube, color.rgb * (32.0 / 33.0) + 0.5 / 33.0).rgb;\n";
    if (cube.oOutputCurves_.has_value()) {
        std::array<std::string, 3> aTables;
        for (std::size_t i = 0; i < 3; ++i) {
            aTables[i] = addCurve(aParameters, "orvoOutput" + std::to_string(i),
                                  (*cube.oOutputCurves_)[i].sampleOverRoot(nCurveEntries));
        }
        sBody += "    vec3 root = sqrt(clamp(color.rgb * 2.0 - 0.5, 0.0, 1.0));\n"
                 "    color.rgb = vec3(orvoCurve(" +
                 aTables[0] + ", root.r), orvoCurve(" + aTables[1] + ", root.g), orvoCurve(" + aTables[2] +
                 ", root.b));\n";
    }
    bool const bCurves = cube.oSpacing_.has_value() || cube.oOutputCurves_.has_value();
    return declarationsOf(aParameters) + (bCurves ? pCurveFunction : "") + entryFunction(sBody);
}

} // namespace

ShaderDescription::ShaderDescription(ResolvedTransform const& transform) : sEntryPoint_(pShaderEntryPoint) {
    if (MatrixShaper const* const pShaper = transform.matrixShaper()) {
        sCode_ = describeShaper(*pShaper, aParameters_);
    } else {
        sCode_ = describeCube(*transform.colourCube(), aParameters_);
    }
}

} // namespace ORVO::ColourEngine::Internal
