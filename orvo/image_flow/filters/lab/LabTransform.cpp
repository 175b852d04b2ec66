#include "orvo/image_flow/filters/lab/LabTransform.h"

#include <cmath>

namespace ORVO::ImageFlow::lab {

namespace {

constexpr float kWhiteX = 0.95047F;
constexpr float kWhiteZ = 1.08883F;

float withSignOf(float magnitude, float original) { return original < 0.0F ? -magnitude : magnitude; }

float linearFromEncoded(float value) {
    float const c = std::fabs(value);
    float const linear = c > 0.04045F ? std::pow((c + 0.055F) / 1.055F, 2.4F) : c / 12.92F;
    return withSignOf(linear, value);
}

// The exponent is the stated rounding of 1 / 2.4.
float encodedFromLinear(float value) {
    float const c = std::fabs(value);
    float const encoded = c > 0.0031308F ? std::pow(c, 0.41667F) * 1.055F - 0.055F : c * 12.92F;
    return withSignOf(encoded, value);
}

// The exponent is a float just above 1/3.
float lightnessCurve(float value, float white) {
    float const t = std::fabs(value) / white;
    float const f = t > 0.008856F ? std::pow(t, 0.33333337F) : 7.787F * t + 0.13793103F;
    return withSignOf(f, value);
}

// The threshold is compared in double precision.
float inverseLightnessCurve(float value, float white) {
    float const f = std::fabs(value);
    float cube = f * f * f;
    if (static_cast<double>(cube) <= 0.008856) {
        cube = (f - 0.13793103F) / 7.787F;
    }
    return withSignOf(cube, value) * white;
}

} // namespace

float4 sRGBToXYZ(float4 const& pixel) {
    float const r = linearFromEncoded(pixel.x);
    float const g = linearFromEncoded(pixel.y);
    float const b = linearFromEncoded(pixel.z);
    return float4(0.4124F * r + 0.3576F * g + 0.1805F * b, 0.2126F * r + 0.7152F * g + 0.0722F * b,
                  0.0193F * r + 0.1192F * g + 0.9505F * b, pixel.w);
}

float4 XYZToLab(float4 const& pixel) {
    float const fx = lightnessCurve(pixel.x, kWhiteX);
    float const fy = lightnessCurve(pixel.y, 1.0F);
    float const fz = lightnessCurve(pixel.z, kWhiteZ);
    float const k = pixel.y < 0.0F ? 0.16F : -0.16F;
    return float4(1.16F * fy + k, (fx - fy) * 5.0F, (fy - fz) * 2.0F, pixel.w);
}

float4 LabToXYZ(float4 const& pixel) {
    float const k = pixel.x > 0.0F ? 0.16F : -0.16F;
    float const fy = (pixel.x + k) / 1.16F;
    float const fx = pixel.y / 5.0F + fy;
    float const fz = fy - pixel.z * 0.5F;
    return float4(inverseLightnessCurve(fx, kWhiteX), inverseLightnessCurve(fy, 1.0F),
                  inverseLightnessCurve(fz, kWhiteZ), pixel.w);
}

float4 XYZTosRGB(float4 const& pixel) {
    float const r = 3.2406F * pixel.x - 1.5372F * pixel.y - 0.4986F * pixel.z;
    float const g = -0.9689F * pixel.x + 1.8758F * pixel.y + 0.0415F * pixel.z;
    float const b = 0.0557F * pixel.x - 0.204F * pixel.y + 1.057F * pixel.z;
    return float4(encodedFromLinear(r), encodedFromLinear(g), encodedFromLinear(b), pixel.w);
}

float4 sRGBToLab(float4 const& pixel) { return XYZToLab(sRGBToXYZ(pixel)); }

float4 LabTosRGB(float4 const& pixel) { return XYZTosRGB(LabToXYZ(pixel)); }

} // namespace ORVO::ImageFlow::lab
