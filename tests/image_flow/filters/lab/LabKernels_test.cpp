#include "orvo/image_flow/filters/lab/LabKernels.h"

#include "orvo/image_flow/filters/lab/LabTransform.h"
#include "tests/image_flow/support/BilateralReference.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <vector>

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using namespace ORVO::ImageFlow::lab;
using ImageRuntime::InstructionSet;
using Row = std::vector<float>;
using Kernel = void (*)(float*, float const*, std::size_t);
using Transform = float4 (*)(float4 const&);

class LabKernelsOf : public testing::TestWithParam<InstructionSet> {
protected:
    LabKernels const& kernels() const { return labKernels(GetParam()); }
};

/// The difference that the kernels promise for ordinary colours and for others, times max(1, magnitude).
constexpr float kOrdinary = 1e-5F;
constexpr float kAny = 1e-4F;

void expectRow(Row const& input, Row const& output, Transform transform, float tolerance = kOrdinary) {
    for (std::size_t i = 0; i < input.size(); i += 4) {
        float4 const expected = transform(float4(input[i], input[i + 1], input[i + 2], input[i + 3]));
        for (std::size_t c = 0; c < 4; ++c) {
            float const actual = output[i + c];
            if (std::isnan(expected[c]) || std::isinf(expected[c])) {
                ASSERT_TRUE(std::isnan(expected[c]) ? std::isnan(actual) : actual == expected[c])
                    << "pixel " << i / 4 << " channel " << c << ": " << actual << " instead of "
                    << expected[c];
            } else {
                ASSERT_NEAR(expected[c], actual, tolerance * std::max(1.0F, std::abs(expected[c])))
                    << "pixel " << i / 4 << " channel " << c << " of (" << input[i] << ", " << input[i + 1]
                    << ", " << input[i + 2] << ")";
            }
        }
    }
}

void expectKernel(Kernel kernel, Row const& input, Transform transform, float tolerance = kOrdinary) {
    Row output(input.size(), -1.0F);
    kernel(output.data(), input.data(), input.size() / 4);
    expectRow(input, output, transform, tolerance);
}

TEST_P(LabKernelsOf, RGBUpToFourAgreesWithThePlainSteps) {
    Numbers numbers(3);
    Row input(4 * 60000);
    std::generate(input.begin(), input.end(), [&] { return numbers.next() * 8.0F - 4.0F; });
    expectKernel(kernels().labFromRGB, input, sRGBToLab, kAny);
}

TEST_P(LabKernelsOf, RGBInTheUnitRangeAgreesWithThePlainSteps) {
    Numbers numbers(4);
    Row input(4 * 60000);
    std::generate(input.begin(), input.end(), [&] { return numbers.next(); });
    expectKernel(kernels().labFromRGB, input, sRGBToLab);
}

TEST_P(LabKernelsOf, LabUpToTwoAgreesWithThePlainSteps) {
    Numbers numbers(9);
    Row input(4 * 60000);
    std::generate(input.begin(), input.end(), [&] { return numbers.next() * 4.0F - 2.0F; });
    expectKernel(kernels().rgbFromLab, input, LabTosRGB, kAny);
}

TEST_P(LabKernelsOf, LabOfColoursAgreesWithThePlainSteps) {
    Numbers numbers(10);
    Row input(4 * 60000);
    std::generate(input.begin(), input.end(), [&] { return numbers.next(); });
    Row lab(input.size());
    labKernels(InstructionSet::PLAIN).labFromRGB(lab.data(), input.data(), input.size() / 4);
    expectKernel(kernels().rgbFromLab, lab, LabTosRGB);
}

TEST_P(LabKernelsOf, ThresholdsAgreeWithThePlainSteps) {
    Row input;
    for (float threshold : {0.04045F, 0.0031308F, 0.008856F, 0.2068965F, 0.13793103F, 0.0F}) {
        for (float sign : {1.0F, -1.0F}) {
            float const v = threshold * sign;
            for (float n : {v, std::nextafter(v, 10.0F), std::nextafter(v, -10.0F)}) {
                input.insert(input.end(), {n, n, n, n, n, 0.5F, 0.1F, 1.0F});
            }
        }
    }
    expectKernel(kernels().labFromRGB, input, sRGBToLab, kAny);
    expectKernel(kernels().rgbFromLab, input, LabTosRGB, kAny);
}

TEST_P(LabKernelsOf, NaNAndInfinityAreTreatedAsByThePlainSteps) {
    float const nan = std::numeric_limits<float>::quiet_NaN();
    float const inf = std::numeric_limits<float>::infinity();
    Row input;
    for (float special : {nan, inf, -inf, -0.0F}) {
        input.insert(input.end(), {special, 0.5F, 0.5F, 1.0F});
        input.insert(input.end(), {0.5F, special, 0.5F, 1.0F});
        input.insert(input.end(), {0.5F, 0.5F, special, special});
        input.insert(input.end(), {special, special, special, special});
    }
    expectKernel(kernels().labFromRGB, input, sRGBToLab, kAny);
    expectKernel(kernels().rgbFromLab, input, LabTosRGB, kAny);
}

TEST_P(LabKernelsOf, HugeValuesStayWithinTheRelativeError) {
    Row input;
    for (float v = 4.0F; v < 1e15F; v *= 3.7F) {
        input.insert(input.end(), {v, 0.0F, 0.0F, 1.0F, 0.0F, v, 0.0F, 1.0F});
    }
    expectKernel(kernels().labFromRGB, input, sRGBToLab);
}

TEST_P(LabKernelsOf, EveryLengthIsServedAndNothingBeyondIsTouched) {
    for (std::size_t n = 0; n <= 35; ++n) {
        Row input(4 * n);
        Numbers numbers(static_cast<std::uint32_t>(n));
        std::generate(input.begin(), input.end(), [&] { return numbers.next(); });
        // One float off, so that nothing is aligned, and a guard on both sides.
        Row output(4 * n + 9, 77.0F);
        kernels().labFromRGB(output.data() + 1, input.data(), n);
        EXPECT_EQ(77.0F, output.front());
        EXPECT_TRUE(std::all_of(output.end() - 8, output.end(), [](float v) { return v == 77.0F; })) << n;
        expectRow(input, Row(output.begin() + 1, output.begin() + 1 + static_cast<std::ptrdiff_t>(4 * n)),
                  sRGBToLab);
    }
}

TEST_P(LabKernelsOf, InputAndOutputMayBeTheSameRow) {
    Row row(4 * 37);
    Numbers numbers(8);
    std::generate(row.begin(), row.end(), [&] { return numbers.next(); });
    Row const before = row;
    kernels().rgbFromLab(row.data(), row.data(), row.size() / 4);
    expectRow(before, row, LabTosRGB);
}

INSTANTIATE_TEST_SUITE_P(All, LabKernelsOf, testing::ValuesIn(instructionSets()));

TEST(LabKernels, TheActiveSetIsUsed) {
    for (InstructionSet set : instructionSets()) {
        ScopedInstructionSet const active(set);
        EXPECT_EQ(&labKernels(set), &labKernels());
    }
}

TEST(LabKernels, AnUnknownSetIsRefused) {
    ORVO_EXPECT_PARAMETER(labKernels(static_cast<InstructionSet>(99)), "isSupported(eInstructionSet)");
}

} // namespace
