#include "orvo/image_flow/filters/bilateral/GPUPrograms.h"

namespace ORVO::ImageFlow::bilateral {

namespace {

/// Cells around the image's own that stay empty, so that no tap of a blur reaches into a neighbour's.
constexpr char const* pPadding = R"(
const vec2 paddingXY = vec2(4.0, 4.0);
const float paddingZ = 4.0;
)";

/// sRGB to Lab, L from 0 to 1. A vector from the left makes the columns of a matrix its rows.
constexpr char const* pToLab = R"(
vec3 rgbToXYZ(vec3 c) {
    vec3 bent = sign(c) * pow((abs(c) + 0.055) / 1.055, vec3(2.4));
    vec3 rgbOut = mix(bent, c / 12.92, step(c, vec3(0.04045)));
    mat3 mat = mat3(0.4124, 0.3576, 0.1805,
                    0.2126, 0.7152, 0.0722,
                    0.0193, 0.1192, 0.9505);
    return rgbOut * mat;
}

vec3 xyzToLAB(vec3 xyz) {
    vec3 t = xyz / vec3(0.95047, 1.0, 1.08883);
    vec3 root = pow(abs(t), vec3(1.0 / 3.0));
    vec3 line = 7.787 * t + 16.0 / 116.0;
    vec3 f = mix(root, line, step(t, vec3(216.0 / 24389.0)));
    return vec3(1.16 * f.y - 0.16, (f.x - f.y) * 5.0, (f.y - f.z) * 2.0);
}
)";

/// Back. The offset 0.1379 and the last white value are rounded otherwise than on the way there.
constexpr char const* pFromLab = R"(
vec3 labToXYZ(vec3 lab) {
    vec3 f;
    f.y = (lab.x + 0.16) / 1.16;
    f.x = lab.y / 5.0 + f.y;
    f.z = f.y - lab.z * 0.5;
    vec3 cube = f * f * f;
    vec3 line = (f - 0.1379) / 7.787;
    vec3 small = vec3(lessThan(cube, vec3(0.008856)));
    return mix(cube, line, small) * vec3(0.95047, 1.0, 1.0883);
}

vec3 xyzToRGB(vec3 xyz) {
    mat3 mat = mat3(3.2406, -1.5372, -0.4986,
                    -0.9689, 1.8758, 0.0415,
                    0.0557, -0.2040, 1.0570);
    vec3 c = xyz * mat;
    vec3 bent = 1.055 * pow(abs(c), vec3(1.0 / 2.4)) - 0.055;
    return sign(c) * mix(bent, 12.92 * abs(c), step(c, vec3(0.0031308)));
}
)";

constexpr char const* pLuminanceOfColour = R"(
float luminanceOf(vec3 c) {
    return dot(c, vec3(0.39, 0.50, 0.11));
}
)";

constexpr char const* pBlur = R"(
uniform sampler2D input_texture;
uniform vec2 delta;
uniform vec2 twoDelta;

vec4 blurred(vec2 xy) {
    vec4 d0 = texture2D(input_texture, xy - twoDelta - delta);
    vec4 d1 = texture2D(input_texture, xy - twoDelta);
    vec4 d2 = texture2D(input_texture, xy - delta);
    vec4 d3 = texture2D(input_texture, xy);
    vec4 d4 = texture2D(input_texture, xy + delta);
    vec4 d5 = texture2D(input_texture, xy + twoDelta);
    vec4 d6 = texture2D(input_texture, xy + twoDelta + delta);
    return 0.0111 * (d0 + d6) + 0.13533528323661 * (d1 + d5) + 0.60653065971263 * (d2 + d4) + d3;
}
)";

/// A cell's value at a place between cells, in cells from the texture's corner to the place in the middle of
/// a texel.
constexpr char const* pReadFiltered = R"(
vec4 readGrid(vec2 p) {
    return texture2D(quotient_grid_texture, p / vec2(gridSizes.x * gridSizes.z, gridSizes.y));
}
)";

constexpr char const* pReadAndMix = R"(
vec4 readGrid(vec2 p) {
    p -= 0.5;
    vec4 t = floor(p).xyxy + vec4(0.5, 0.5, 1.5, 1.5);
    t /= vec2(gridSizes.x * gridSizes.z, gridSizes.y).xyxy;
    vec2 alpha = fract(p);
    vec4 lower = mix(texture2D(quotient_grid_texture, t.xy), texture2D(quotient_grid_texture, t.zy), alpha.x);
    vec4 upper = mix(texture2D(quotient_grid_texture, t.xw), texture2D(quotient_grid_texture, t.zw), alpha.x);
    return mix(lower, upper, alpha.y);
}
)";

} // namespace

std::string passThroughVertexProgram() {
    return R"(
void main() {
    gl_TexCoord[0] = gl_MultiTexCoord0;
    gl_Position = ftransform();
}
)";
}

std::string scatterVertexProgram(bool bLab) {
    std::string sSource = "uniform vec3 sigmaValues;\nuniform vec3 gridSizes;\n";
    sSource += pPadding;
    sSource += bLab ? pToLab : pLuminanceOfColour;
    sSource += bLab ? R"(
vec4 valueOf(vec3 c) {
    vec3 lab = xyzToLAB(rgbToXYZ(c));
    return vec4(lab.x, (lab.y + 1.0) * 0.5, (lab.z + 1.0) * 0.5, 0.0);
}
)"
                    : R"(
vec4 valueOf(vec3 c) {
    return vec4(luminanceOf(c));
}
)";
    return sSource + R"(
void main() {
    vec4 value = valueOf(gl_Color.rgb);
    vec2 gridXY = floor(gl_Vertex.xy * sigmaValues.xy + 0.5) + paddingXY;
    float gridZ = floor(value.x * sigmaValues.z + 0.5) + paddingZ;
    vec2 cell = gridXY + vec2(gridSizes.x * gridZ, 0.0) + vec2(0.5, 0.5);
    gl_Position = gl_ModelViewProjectionMatrix * vec4(cell, 0.5, 1.0);
    gl_TexCoord[0] = value;
}
)";
}

std::string scatterFragmentProgram() {
    return R"(
void main() {
    vec4 texCoord = gl_TexCoord[0];
    gl_FragColor = vec4(texCoord.x / 1000.0, texCoord.y / 1000.0, texCoord.z / 1000.0, 0.001);
}
)";
}

std::string blurFragmentProgram() {
    return std::string(pBlur) + R"(
void main() {
    gl_FragColor = blurred(gl_TexCoord[0].xy);
}
)";
}

std::string blurAndDivideFragmentProgram() {
    return std::string(pBlur) + R"(
void main() {
    vec4 sum = blurred(gl_TexCoord[0].xy);
    vec3 quotient = vec3(0.0);
    if (sum.w != 0.0)
        quotient = (sum.xyz * 1000.0) / (sum.w * 1000.0);
    gl_FragColor = vec4(quotient, 0.0);
}
)";
}

std::string sliceFragmentProgram(bool bLab, bool bHardwareFilters) {
    std::string sSource = R"(
uniform vec3 sigmaValues;
uniform vec3 gridSizes;
uniform vec2 inputSize;
uniform vec2 inputOffset;
uniform sampler2D input_texture;
uniform sampler2D quotient_grid_texture;
)";
    sSource += pPadding;
    sSource += bHardwareFilters ? pReadFiltered : pReadAndMix;
    if (bLab) {
        sSource += pToLab;
        sSource += pFromLab;
    } else {
        sSource += pLuminanceOfColour;
    }
    sSource += bLab ? R"(
float intensityOf(vec3 c) {
    return xyzToLAB(rgbToXYZ(c)).x;
}
vec3 colourOf(vec3 value) {
    return xyzToRGB(labToXYZ(vec3(value.x, value.yz * 2.0 - 1.0)));
}
)"
                    : R"(
float intensityOf(vec3 c) {
    return luminanceOf(c);
}
vec3 colourOf(vec3 value) {
    return vec3(value.x);
}
)";
    return sSource + R"(
void main() {
    vec2 xy = gl_TexCoord[0].xy;
    vec4 pixel = texture2D(input_texture, xy);
    xy -= inputOffset;
    xy *= inputSize;
    vec3 gridXYZ = vec3(floor(xy) * sigmaValues.xy + paddingXY,
                        intensityOf(pixel.rgb) * sigmaValues.z + paddingZ);
    float z0 = floor(gridXYZ.z);
    float alphaZ = fract(gridXYZ.z);
    vec2 gridXYZ0 = gridXYZ.xy + vec2(gridSizes.x * z0, 0.0) + vec2(0.5, 0.5);
    vec2 gridXYZ1 = gridXYZ0 + vec2(gridSizes.x, 0.0);
    vec4 value = mix(readGrid(gridXYZ0), readGrid(gridXYZ1), alphaZ);
    gl_FragColor = vec4(colourOf(value.xyz), pixel.a);
}
)";
}

} // namespace ORVO::ImageFlow::bilateral
