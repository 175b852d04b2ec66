#pragma once

// To be included after the header of one instruction set, which defines Vector; internal linkage for the same
// reason.
namespace {

/// Powers and exponentials of vectors, by polynomials fitted to Chebyshev nodes.
struct VectorMath {
    using Floats = Vector::Floats;

    /// The sum of c[i] * x^i by Horner's scheme.
    template <int n>
    static Floats polynomial(Floats x, float const (&c)[n]) {
        Floats sum = Vector::set(c[n - 1]);
        for (int i = n - 2; i >= 0; --i) {
            sum = Vector::mulAdd(sum, x, Vector::set(c[i]));
        }
        return sum;
    }

    /// x * 2^n for whole n of magnitude below 252, in two steps, so that neither factor leaves the normal
    /// numbers.
    static Floats scaleByPowerOfTwo(Floats x, Floats n) {
        Vector::Ints const whole = Vector::toInts(n);
        Vector::Ints const half = Vector::shiftRightSigned<1>(whole);
        Vector::Ints const rest = Vector::subInt(whole, half);
        Vector::Ints const bias = Vector::setInt(127);
        Floats const first = Vector::fromBits(Vector::shiftLeft<23>(Vector::addInt(half, bias)));
        Floats const second = Vector::fromBits(Vector::shiftLeft<23>(Vector::addInt(rest, bias)));
        return Vector::mul(Vector::mul(x, first), second);
    }

    /// x ^ exponent for normal x > 0 and infinity; the relative error is at most 4e-7 (6e-7 without fused
    /// multiply-add) wherever the result is a normal number.
    ///
    /// exponent = coarse + fine, where coarse has so few bits that its product with the binary exponent of x
    /// is exact: the error does not grow with x. x = m * 2^e with m in [sqrt(1/2), sqrt(2)); log2(m) by a
    /// polynomial of degree 9 with an error of 1.5e-8, 2^r by one of degree 6 with 2e-9.
    static Floats power(Floats x, float coarse, float fine) {
        static constexpr float kLogarithm[] = {1.442695004F,   -0.7213474682F, 0.4809107535F,
                                               -0.3606932681F, 0.2879032609F,  -0.2391698814F,
                                               0.2160782255F,  -0.2058618805F, 0.1231096847F};
        static constexpr float kExponential[] = {1.0F,           0.6931472067F,   0.2402265092F,
                                                 0.05550327227F, 0.009618056679F, 0.001340042818F,
                                                 0.000154614447F};
        Vector::Ints const offset = Vector::subInt(Vector::bits(x), Vector::setInt(0x3f3504f3));
        Vector::Ints const exponent = Vector::shiftRightSigned<23>(offset);
        Floats const e = Vector::toFloats(exponent);
        Floats const m = Vector::fromBits(Vector::subInt(Vector::bits(x), Vector::shiftLeft<23>(exponent)));
        Floats const s = Vector::sub(m, Vector::set(1.0F));
        Floats const logarithm = Vector::mul(s, polynomial(s, kLogarithm));

        Floats const exact = Vector::mul(e, Vector::set(coarse));
        Floats const rest =
            Vector::mulAdd(e, Vector::set(fine), Vector::mul(logarithm, Vector::set(coarse + fine)));
        // Below -251 or above 250 the result is 0 or infinite in any case.
        Floats const whole = Vector::min(
            Vector::max(Vector::round(Vector::add(exact, rest)), Vector::set(-250.0F)), Vector::set(250.0F));
        Floats const r = Vector::add(Vector::sub(exact, whole), rest);
        Floats const result = scaleByPowerOfTwo(polynomial(r, kExponential), whole);
        Floats const infinite = Vector::set(__builtin_huge_valf());
        return Vector::select(Vector::equal(x, infinite), infinite, result);
    }

    /// e ^ x for x <= 0; the relative error is at most 3e-7 wherever the result is a normal number. NaN stays
    /// NaN.
    static Floats exponential(Floats x) {
        static constexpr float kExponential[] = {1.0F,           1.000000038F,  0.5000000047F,
                                                 0.1666641551F,  0.0416663529F, 0.008375126398F,
                                                 0.001394110843F};
        // NaN is taken by the second operand of max.
        Floats const bounded = Vector::max(Vector::set(-160.0F), x);
        Floats const whole = Vector::round(Vector::mul(bounded, Vector::set(1.442695041F)));
        // ln 2 in two parts, the first with so few bits that its product is exact.
        Floats r = Vector::mulAdd(whole, Vector::set(-0.693359375F), bounded);
        r = Vector::mulAdd(whole, Vector::set(2.12194440e-4F), r);
        return scaleByPowerOfTwo(polynomial(r, kExponential), whole);
    }
};

} // namespace
