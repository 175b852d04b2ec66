#include "orvo/colour_engine/internal/ShaderDescription.h"

#include "orvo/colour_engine/internal/ResolvedTransform.h"

#include <gtest/gtest.h>

#include <cmath>
#include <numeric>

namespace ORVO::ColourEngine::Internal {
namespace {

using Record = _t_Vantle_ShaderParameterData;

ChannelCurve power(double exponent) {
    return ChannelCurve([=](double x) { return std::pow(x, exponent); });
}

constexpr std::array<double, 9> aMatrix{0.5, 0.25, 0.125, -0.5, 1.5, 0.0625, 0.75, -0.25, 2.0};

/// The exponents of the input curves and of the output curves.
ResolvedTransform shaper(std::array<double, 3> const& in, std::array<double, 3> const& out) {
    return ResolvedTransform(MatrixShaper{
        {power(in[0]), power(in[1]), power(in[2])}, aMatrix, {power(out[0]), power(out[1]), power(out[2])}});
}

/// Tables as the engine's interface numbers them: 1D, luminance of 32-bit floats, nearest, clamped to edge.
void expectCurve(ShaderDescription::Parameter const& parameter, char const* pName) {
    EXPECT_EQ(pName, parameter.sName_);
    Record const& record = parameter.record_;
    EXPECT_EQ(Record::KIND_TEXTURE_1D, record.kind);
    EXPECT_EQ(0x0DE0U, record.target);
    EXPECT_EQ(0, record.level);
    EXPECT_EQ(0x8818U, record.internalFormat);
    EXPECT_EQ(4096U, record.width);
    EXPECT_EQ(1U, record.height);
    EXPECT_EQ(1U, record.depth);
    EXPECT_EQ(0, record.border);
    EXPECT_EQ(0x1909U, record.format);
    EXPECT_EQ(0x1406U, record.type);
    EXPECT_EQ(0x2600U, record.minFilter);
    EXPECT_EQ(0x2600U, record.magFilter);
    EXPECT_EQ(0x812FU, record.wrapS);
    EXPECT_EQ(4096U, parameter.aData_.size());
}

TEST(ShaderDescription, GivesEveryCurveATable) {
    ShaderDescription const description(shaper({1.5, 2.0, 2.5}, {0.5, 0.7, 1.15}));
    auto const& aParameters = description.parameters();
    ASSERT_EQ(7U, aParameters.size());
    for (std::size_t i : {0U, 1U, 2U}) {
        expectCurve(aParameters[i], std::array{"orvoInput0", "orvoInput1", "orvoInput2"}[i]);
        expectCurve(aParameters[4 + i], std::array{"orvoOutput0", "orvoOutput1", "orvoOutput2"}[i]);
    }
    // Inputs over the value, outputs over its square root; no two of the tables are equal.
    for (std::size_t n : {0U, 1U, 1000U, 4095U}) {
        double const x = double(n) / 4095.0;
        EXPECT_FLOAT_EQ(float(std::pow(x, 1.5)), aParameters[0].aData_[n]) << n;
        EXPECT_FLOAT_EQ(float(std::pow(x, 2.5)), aParameters[2].aData_[n]) << n;
        EXPECT_FLOAT_EQ(float(x), aParameters[4].aData_[n]) << n;
        EXPECT_FLOAT_EQ(float(std::pow(x, 2.3)), aParameters[6].aData_[n]) << n;
    }
}

TEST(ShaderDescription, UploadsTheMatrixByColumns) {
    ShaderDescription const description(shaper({2, 2, 2}, {0.5, 0.5, 0.5}));
    auto const& parameter = description.parameters().at(1);
    EXPECT_EQ("orvoMatrix", parameter.sName_);
    EXPECT_EQ(Record::KIND_MATRIX_3X3, parameter.record_.kind);
    EXPECT_EQ((std::vector<float>{0.5F, -0.5F, 0.75F, 0.25F, 1.5F, -0.25F, 0.125F, 0.0625F, 2.0F}),
              parameter.aData_);
}

TEST(ShaderDescription, SharesTablesBetweenEqualCurves) {
    ShaderDescription const one(shaper({2, 2, 2}, {0.5, 0.5, 0.5}));
    ASSERT_EQ(3U, one.parameters().size());
    EXPECT_EQ("orvoOutput0", one.parameters()[2].sName_);
    EXPECT_EQ(std::string::npos, one.code().find("orvoInput1"));
    ShaderDescription const two(shaper({2, 1.8, 2}, {0.5, 0.5, 0.4}));
    ASSERT_EQ(5U, two.parameters().size());
    EXPECT_NE(std::string::npos, two.code().find("orvoCurve(orvoInput0, code.r), orvoCurve(orvoInput1, "
                                                 "code.g), orvoCurve(orvoInput0, code.b)"));
    EXPECT_NE(std::string::npos, two.code().find("orvoCurve(orvoOutput0, sqrt(light.r)), "
                                                 "orvoCurve(orvoOutput0, sqrt(light.g)), "
                                                 "orvoCurve(orvoOutput2, sqrt(light.b))"));
}

/// The same curves, known to be powers.
ChannelCurve knownPower(double exponent) {
    return ChannelCurve([=](double x) { return std::pow(x, exponent); }, curveFormula(1, &exponent));
}

bool contains(ShaderDescription const& description, char const* pText) {
    return description.code().find(pText) != std::string::npos;
}

TEST(ShaderDescription, ComputesCurvesInClosedFormWithoutParameters) {
    ShaderDescription const description(
        ResolvedTransform(MatrixShaper{{knownPower(2.2), knownPower(1.8), knownPower(2.2)},
                                       aMatrix,
                                       {knownPower(0.5), knownPower(0.5), knownPower(1.0)}}));
    EXPECT_TRUE(description.parameters().empty());
    EXPECT_FALSE(contains(description, "uniform"));
    EXPECT_FALSE(contains(description, "texture1D"));
    // Each different curve once, none for the straight one, and the matrix by columns.
    for (char const* pText :
         {"float orvoInputCurve0(float x) {\n", "float orvoInputCurve1(float x) {\n",
          "float orvoOutputCurve0(float x) {\n",
          "vec3 code = clamp(color.rgb, 0.0, 1.0);\n"
          "    vec3 light = clamp(mat3(0.5, (-0.5), 0.75, 0.25, 1.5, (-0.25), 0.125, 0.0625, 2.0) * "
          "vec3(orvoInputCurve0(code.r), orvoInputCurve1(code.g), orvoInputCurve0(code.b)), 0.0, 1.0);\n"
          "    color.rgb = clamp(vec3(orvoOutputCurve0(light.r), orvoOutputCurve0(light.g), light.b), 0.0, "
          "1.0);\n"})
        EXPECT_TRUE(contains(description, pText)) << pText << "\nin\n" << description.code();
    EXPECT_FALSE(contains(description, "orvoInputCurve2"));
    EXPECT_FALSE(contains(description, "orvoOutputCurve1"));
    EXPECT_FALSE(contains(description, "orvoOutputCurve2"));
}

TEST(ShaderDescription, HasTheMatrixAloneBetweenStraightCurves) {
    auto const one = knownPower(1.0);
    // Noise of a computed zero is left out.
    ShaderDescription const description(ResolvedTransform(MatrixShaper{
        {one, one, one}, {1.0, 1e-17, 0.0, -1e-17, 0.5, 0.0, 0.0, 1e-6, 0.25}, {one, one, one}}));
    EXPECT_EQ("void orvoColourTransform(inout vec4 color) {\n"
              "    vec3 code = clamp(color.rgb, 0.0, 1.0);\n"
              "    vec3 light = clamp(mat3(1.0, 0.0, 0.0, 0.0, 0.5, 1e-06, 0.0, 0.0, 0.25) * vec3(code.r, "
              "code.g, code.b), 0.0, 1.0);\n"
              "    color.rgb = vec3(light.r, light.g, light.b);\n"
              "}\n",
              description.code());
}

TEST(ShaderDescription, MixesTablesAndComputedCurves) {
    // A table on one side alone, or for one channel alone.
    ShaderDescription const in(ResolvedTransform(MatrixShaper{
        {power(2.2), power(2.2), power(2.2)}, aMatrix, {knownPower(0.5), knownPower(0.5), knownPower(0.5)}}));
    ASSERT_EQ(2U, in.parameters().size());
    expectCurve(in.parameters()[0], "orvoInput0");
    EXPECT_EQ("orvoMatrix", in.parameters()[1].sName_);
    EXPECT_TRUE(contains(in, "clamp(orvoMatrix * vec3(orvoCurve(orvoInput0, code.r), "));
    EXPECT_TRUE(contains(in, "clamp(vec3(orvoOutputCurve0(light.r), "));
    ShaderDescription const out(
        ResolvedTransform(MatrixShaper{{knownPower(2.2), knownPower(2.2), knownPower(2.2)},
                                       aMatrix,
                                       {knownPower(0.5), power(0.7), knownPower(1.0)}}));
    ASSERT_EQ(2U, out.parameters().size());
    EXPECT_EQ("orvoMatrix", out.parameters()[0].sName_);
    expectCurve(out.parameters()[1], "orvoOutput1");
    EXPECT_TRUE(contains(out, "vec3(orvoInputCurve0(code.r), orvoInputCurve0(code.g), "));
    EXPECT_TRUE(contains(
        out, "clamp(vec3(orvoOutputCurve0(light.r), orvoCurve(orvoOutput1, sqrt(light.g)), light.b)"));
}

TEST(ShaderDescription, MakesACubeOfOneTexture) {
    ColourCube cube;
    cube.aValues_.resize(std::size_t(33) * 33 * 33 * 3);
    std::iota(cube.aValues_.begin(), cube.aValues_.end(), 0.0F);
    ShaderDescription const description{ResolvedTransform(cube)};
    ASSERT_EQ(1U, description.parameters().size());
    auto const& parameter = description.parameters().front();
    EXPECT_EQ("orvoCube", parameter.sName_);
    EXPECT_EQ(cube.aValues_, parameter.aData_);
    Record const& record = parameter.record_;
    EXPECT_EQ(Record::KIND_TEXTURE_3D, record.kind);
    EXPECT_EQ(0x806FU, record.target);
    EXPECT_EQ(0, record.level);
    EXPECT_EQ(0x8054U, record.internalFormat);
    EXPECT_EQ(33U, record.width);
    EXPECT_EQ(33U, record.height);
    EXPECT_EQ(33U, record.depth);
    EXPECT_EQ(0x1907U, record.format);
    EXPECT_EQ(0x1406U, record.type);
    EXPECT_EQ(0x2601U, record.minFilter);
    EXPECT_EQ(0x2601U, record.magFilter);
    for (std::uint32_t const wrap : {record.wrapR, record.wrapS, record.wrapT})
        EXPECT_EQ(0x812FU, wrap);
    EXPECT_NE(std::string::npos, description.code().find("color.rgb * (32.0 / 33.0) + 0.5 / 33.0"));
}

TEST(ShaderDescription, PutsCurvesBeforeAndBehindACube) {
    ColourCube cube;
    cube.aValues_.resize(std::size_t(33) * 33 * 33 * 3);
    cube.aValues_[0] = -0.5F;
    cube.aValues_[1] = 1.5F;
    cube.oSpacing_ = power(0.5);
    cube.oOutputCurves_ = {power(0.75), power(0.5), power(0.75)};
    ShaderDescription const description{ResolvedTransform(cube)};
    auto const& aParameters = description.parameters();
    ASSERT_EQ(4U, aParameters.size());
    EXPECT_EQ("orvoCube", aParameters[0].sName_);
    // -0.5..1.5 in a texture of 0..1
    EXPECT_FLOAT_EQ(0.0F, aParameters[0].aData_[0]);
    EXPECT_FLOAT_EQ(1.0F, aParameters[0].aData_[1]);
    EXPECT_FLOAT_EQ(0.25F, aParameters[0].aData_[2]);
    expectCurve(aParameters[1], "orvoSpacing");
    expectCurve(aParameters[2], "orvoOutput0");
    expectCurve(aParameters[3], "orvoOutput1");
    double const x = 1000.0 / 4095.0;
    EXPECT_FLOAT_EQ(float(std::sqrt(x)), aParameters[1].aData_[1000]);
    EXPECT_FLOAT_EQ(float(std::pow(x, 1.5)), aParameters[2].aData_[1000]);
    EXPECT_FLOAT_EQ(float(x), aParameters[3].aData_[1000]);
    for (char const* const pText : {"orvoCurve(orvoSpacing, code.b)", "color.rgb * 2.0 - 0.5",
                                    "vec3(orvoCurve(orvoOutput0, root.r), orvoCurve(orvoOutput1, root.g), "
                                    "orvoCurve(orvoOutput0, root.b))"})
        EXPECT_NE(std::string::npos, description.code().find(pText)) << pText;
    EXPECT_LT(description.code().size(), 8192U);
}

TEST(ShaderDescription, StaysWithinTheInterfacesLengths) {
    ColourCube cube;
    cube.aValues_.resize(std::size_t(33) * 33 * 33 * 3);
    for (ResolvedTransform const& transform :
         {ResolvedTransform(cube), shaper({1.5, 2.0, 2.5}, {0.5, 0.75, 1.25}),
          ResolvedTransform(MatrixShaper{{knownPower(1.8), knownPower(2.2), knownPower(2.4)},
                                         aMatrix,
                                         {knownPower(0.37), knownPower(0.45), knownPower(0.55)}})}) {
        ShaderDescription const description(transform);
        EXPECT_LT(description.code().size(), 8192U);
        EXPECT_LT(description.entryPoint().size(), 1024U);
        EXPECT_NE(std::string::npos,
                  description.code().find("void " + description.entryPoint() + "(inout vec4 color)"));
        for (auto const& parameter : description.parameters())
            EXPECT_NE(std::string::npos, description.code().find(" " + parameter.sName_ + ";\n"))
                << parameter.sName_;
    }
}

} // namespace
} // namespace ORVO::ColourEngine::Internal
