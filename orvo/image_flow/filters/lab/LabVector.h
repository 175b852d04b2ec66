#pragma once

// To be included after VectorMath.h; internal linkage for the same reason. The steps are those of
// LabTransform, where the formulas are.
namespace {

/// The Lab transform of vectors of pixels, three channels each.
struct LabVector {
    using Floats = Vector::Floats;

    static Floats combine(Floats x, float a, Floats y, float b, Floats z, float c) {
        return Vector::mulAdd(z, Vector::set(c),
                              Vector::mulAdd(y, Vector::set(b), Vector::mul(x, Vector::set(a))));
    }

    /// A zero that is negative counts as positive.
    static Floats withSignOf(Floats magnitude, Floats original) {
        return Vector::negateWhere(Vector::less(original, Vector::zero()), magnitude);
    }

    static Floats linearFromEncoded(Floats value) {
        Floats const c = Vector::abs(value);
        Floats const base = Vector::mul(Vector::add(c, Vector::set(0.055F)), Vector::set(1.0F / 1.055F));
        Floats const curve = VectorMath::power(base, 2.375F, 0.0250000953674F);
        Floats const line = Vector::mul(c, Vector::set(1.0F / 12.92F));
        return withSignOf(Vector::select(Vector::less(Vector::set(0.04045F), c), curve, line), value);
    }

    static Floats encodedFromLinear(Floats value) {
        Floats const c = Vector::abs(value);
        Floats const power = VectorMath::power(c, 0.40625F, 0.0104199945927F);
        Floats const curve = Vector::mulAdd(power, Vector::set(1.055F), Vector::set(-0.055F));
        Floats const line = Vector::mul(c, Vector::set(12.92F));
        return withSignOf(Vector::select(Vector::less(Vector::set(0.0031308F), c), curve, line), value);
    }

    static Floats lightnessCurve(Floats value, float white) {
        Floats const t = Vector::mul(Vector::abs(value), Vector::set(1.0F / white));
        Floats const curve = VectorMath::power(t, 0.328125F, 0.00520837306976F);
        Floats const line = Vector::mulAdd(t, Vector::set(7.787F), Vector::set(0.13793103F));
        return withSignOf(Vector::select(Vector::less(Vector::set(0.008856F), t), curve, line), value);
    }

    static Floats inverseLightnessCurve(Floats value, float white) {
        Floats const f = Vector::abs(value);
        Floats const cube = Vector::mul(Vector::mul(f, f), f);
        Floats const line = Vector::mul(Vector::sub(f, Vector::set(0.13793103F)), Vector::set(1.0F / 7.787F));
        // 0.008856F is above 0.008856: less than the float is at most the double. NaN takes the cube.
        Floats const inverse = Vector::select(Vector::less(cube, Vector::set(0.008856F)), line, cube);
        return Vector::mul(withSignOf(inverse, value), Vector::set(white));
    }

    /// sRGB to L, a, b in place.
    static void toLab(Floats& c0, Floats& c1, Floats& c2) {
        Floats const r = linearFromEncoded(c0);
        Floats const g = linearFromEncoded(c1);
        Floats const b = linearFromEncoded(c2);
        Floats const x = combine(r, 0.4124F, g, 0.3576F, b, 0.1805F);
        Floats const y = combine(r, 0.2126F, g, 0.7152F, b, 0.0722F);
        Floats const z = combine(r, 0.0193F, g, 0.1192F, b, 0.9505F);
        Floats const fx = lightnessCurve(x, 0.95047F);
        Floats const fy = lightnessCurve(y, 1.0F);
        Floats const fz = lightnessCurve(z, 1.08883F);
        Floats const k =
            Vector::select(Vector::less(y, Vector::zero()), Vector::set(0.16F), Vector::set(-0.16F));
        c0 = Vector::add(Vector::mul(fy, Vector::set(1.16F)), k);
        c1 = Vector::mul(Vector::sub(fx, fy), Vector::set(5.0F));
        c2 = Vector::mul(Vector::sub(fy, fz), Vector::set(2.0F));
    }

    /// L, a, b to sRGB in place.
    static void toRGB(Floats& c0, Floats& c1, Floats& c2) {
        Floats const k =
            Vector::select(Vector::less(Vector::zero(), c0), Vector::set(0.16F), Vector::set(-0.16F));
        Floats const fy = Vector::mul(Vector::add(c0, k), Vector::set(1.0F / 1.16F));
        Floats const fx = Vector::add(Vector::mul(c1, Vector::set(0.2F)), fy);
        Floats const fz = Vector::sub(fy, Vector::mul(c2, Vector::set(0.5F)));
        Floats const x = inverseLightnessCurve(fx, 0.95047F);
        Floats const y = inverseLightnessCurve(fy, 1.0F);
        Floats const z = inverseLightnessCurve(fz, 1.08883F);
        c0 = encodedFromLinear(combine(x, 3.2406F, y, -1.5372F, z, -0.4986F));
        c1 = encodedFromLinear(combine(x, -0.9689F, y, 1.8758F, z, 0.0415F));
        c2 = encodedFromLinear(combine(x, 0.0557F, y, -0.204F, z, 1.057F));
    }
};

} // namespace
