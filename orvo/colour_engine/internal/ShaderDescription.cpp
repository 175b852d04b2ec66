#include "orvo/colour_engine/internal/ShaderDescription.h"

#include "orvo/colour_engine/internal/ResolvedTransform.h"
#include "orvo/colour_engine/internal/ShaderCurve.h"
#include "orvo/colour_engine/internal/ShaderNumber.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <optional>
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
/// read one by one: the texel n lies at (n + 0.5) / 4096, and beyond the last one the last is read. x is from
/// 0 to 1 before; a driver that knows it from the clamp here reads the texels faster.
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

/// The curves of one side of the matrix as GLSL expressions: those that can be computed as functions, each
/// different one once, and the others as tables.
class CurveExpressions {
public:
    explicit CurveExpressions(ShaderParameters& aParameters) : aParameters_(aParameters) {}

    /// What gives the curve at sArgument. The table is over sArgument itself, or over its square root.
    std::string input(std::optional<ShaderCurve> const& computed, ChannelCurve const& curve, std::size_t i,
                      std::string const& sArgument) {
        if (computed.has_value()) {
            return call(*computed, "orvoInputCurve" + std::to_string(i), sArgument);
        }
        return lookUp("orvoInput" + std::to_string(i), curve.sample(nCurveEntries), sArgument);
    }
    std::string output(std::optional<ShaderCurve> const& computed, ChannelCurve const& curve, std::size_t i,
                       std::string const& sArgument) {
        if (computed.has_value()) {
            return call(*computed, "orvoOutputCurve" + std::to_string(i), sArgument);
        }
        // The output curves are steep near black: by the square root of the light, the entries are close
        // there.
        return lookUp("orvoOutput" + std::to_string(i), curve.sampleOverRoot(nCurveEntries),
                      "sqrt(" + sArgument + ")");
    }

    /// The functions that the expressions call.
    std::string functions() const {
        std::string sText = bTables_ ? pCurveFunction : "";
        for (auto const& [sBody, sName] : aFunctions_) {
            sText.append("float ").append(sName).append("(float x) {\n").append(sBody).append("}\n");
        }
        return sText;
    }

private:
    std::string call(ShaderCurve const& curve, std::string const& sName, std::string const& sArgument) {
        if (curve.isIdentity()) {
            return sArgument;
        }
        std::string const sBody = curve.body();
        auto iSame = std::find_if(aFunctions_.begin(), aFunctions_.end(),
                                  [&](auto const& function) { return function.first == sBody; });
        if (iSame == aFunctions_.end()) {
            iSame = aFunctions_.emplace(iSame, sBody, sName);
        }
        return iSame->second + "(" + sArgument + ")";
    }
    std::string lookUp(std::string const& sName, std::vector<float> aTable, std::string const& sArgument) {
        bTables_ = true;
        return "orvoCurve(" + addCurve(aParameters_, sName, std::move(aTable)) + ", " + sArgument + ")";
    }

    ShaderParameters& aParameters_;
    std::vector<std::pair<std::string, std::string>> aFunctions_; ///< body and name
    bool bTables_ = false;
};

/// The matrix as GLSL has it, by columns.
std::string matrixText(std::array<double, 9> const& aMatrix) {
    // What rounding has left of a zero is no work for the shader.
    constexpr double dRounding = 1e-12;
    std::string sText;
    for (std::size_t column = 0; column < 3; ++column) {
        for (std::size_t row = 0; row < 3; ++row) {
            double const element = aMatrix[3 * row + column];
            sText += (sText.empty() ? "mat3(" : ", ") +
                     shaderNumber(std::abs(element) < dRounding ? 0.0 : element);
        }
    }
    return sText + ")";
}

std::string describeShaper(MatrixShaper const& shaper, ShaderParameters& aParameters) {
    constexpr std::array<char const*, 3> aChannels{"r", "g", "b"};
    std::array<std::optional<ShaderCurve>, 3> aInputs;
    std::array<std::optional<ShaderCurve>, 3> aOutputs;
    bool bTables = false;
    bool bComputedResults = false;
    for (std::size_t i = 0; i < 3; ++i) {
        aInputs[i] = ShaderCurve::ofInput(shaper.aInputCurves_[i]);
        aOutputs[i] = ShaderCurve::ofOutput(shaper.aOutputCurves_[i]);
        bTables = bTables || !aInputs[i].has_value() || !aOutputs[i].has_value();
        bComputedResults = bComputedResults || (aOutputs[i].has_value() && !aOutputs[i]->isIdentity());
    }
    CurveExpressions expressions(aParameters);
    std::string sInputs;
    for (std::size_t i = 0; i < 3; ++i) {
        sInputs += (i > 0 ? ", " : "") + expressions.input(aInputs[i], shaper.aInputCurves_[i], i,
                                                           std::string("code.") + aChannels[i]);
    }
    // A uniform is read again for each group of pixels, by drivers that compute on the processor: nine
    // numbers cost as much as three curves there. Where textures have to be bound anyway, the matrix goes
    // with them.
    std::string const sMatrix =
        bTables ? addMatrix(aParameters, shaper.aMatrix_) : matrixText(shaper.aMatrix_);
    std::string sOutputs;
    for (std::size_t i = 0; i < 3; ++i) {
        sOutputs += (i > 0 ? ", " : "") + expressions.output(aOutputs[i], shaper.aOutputCurves_[i], i,
                                                             std::string("light.") + aChannels[i]);
    }
    sOutputs = "vec3(" + sOutputs + ")";
    return declarationsOf(aParameters) + expressions.functions() +
           entryFunction("    vec3 code = clamp(color.rgb, 0.0, 1.0);\n"
                         "    vec3 light = clamp(" +
                         sMatrix + " * vec3(" + sInputs +
                         "), 0.0, 1.0);\n"
                         "    color.rgb = " +
                         (bComputedResults ? "clamp(" + sOutputs + ", 0.0, 1.0)" : sOutputs) + ";\n");
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
