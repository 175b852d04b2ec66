#include "orvo/image_flow/filters/bilateral/GridKernels.h"

#include "tests/image_flow/support/BilateralReference.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <cstring>
#include <limits>
#include <vector>

namespace {

using namespace ORVO::ImageFlow::bilateral;
using ORVO::ImageRuntime::InstructionSet;
using ORVO::Test::instructionSets;

float const kNaN = std::numeric_limits<float>::quiet_NaN();

/// A row of RGBA floats that begins at a multiple of 64 bytes, with a guard behind it.
struct AlignedRow {
    static constexpr std::size_t kCapacity = 4 * 64;
    alignas(64) float values[kCapacity];

    AlignedRow() { std::fill_n(values, kCapacity, 77.0F); }
    bool isUntouchedFrom(std::size_t first) const {
        return std::all_of(values + first, values + kCapacity, [](float v) { return v == 77.0F; });
    }
};

TEST(GridKernels, UnknownSetsAndThePlainOneAreRefused) {
    ORVO_EXPECT_PARAMETER(gridKernels(static_cast<InstructionSet>(99)), "isSupported(eInstructionSet)");
    ORVO_EXPECT_PARAMETER(gridKernels(InstructionSet::PLAIN), "eInstructionSet != InstructionSet::PLAIN");
}

TEST(GridKernels, GreyPixelsAreDividedByAlphaClampedAndStreamed) {
    for (InstructionSet const set : instructionSets()) {
        if (set == InstructionSet::PLAIN) {
            continue; // PlainBilateralFilter stands for it.
        }
        for (std::size_t n = 1; n <= 37; ++n) {
            // By turns: halved alpha doubles, alpha 0 leaves the value, values beyond 0..1, no number.
            float const luminances[5] = {0.25F, 0.375F, 3.0F, -1.0F, kNaN};
            float const alphas[5] = {0.5F, 0.0F, 1.0F, 1.0F, 1.0F};
            float const free[5] = {0.5F, 0.375F, 3.0F, -1.0F, kNaN};
            float const clamped[5] = {0.5F, 0.375F, 1.0F, 0.0F, kNaN};
            std::vector<float> aLuminances(n);
            std::vector<float> aAlphas(n);
            for (std::size_t i = 0; i < n; ++i) {
                aLuminances[i] = luminances[i % 5];
                aAlphas[i] = alphas[i % 5];
            }
            for (StoreStyle const style : {StoreStyle{false, false}, StoreStyle{false, true},
                                           StoreStyle{true, false}, StoreStyle{true, true}}) {
                AlignedRow row;
                gridKernels(set).greyFromLuminance(aLuminances.data(), aAlphas.data(), row.values, n, style);
                for (std::size_t i = 0; i < n; ++i) {
                    float const grey = style.bClamp ? clamped[i % 5] : free[i % 5];
                    float const expected[4] = {grey, grey, grey, alphas[i % 5]};
                    for (std::size_t c = 0; c < 4; ++c) {
                        float const actual = row.values[4 * i + c];
                        ASSERT_TRUE(std::isnan(expected[c]) ? std::isnan(actual) : actual == expected[c])
                            << "pixel " << i << " of " << n << " channel " << c << ": " << actual;
                    }
                }
                ASSERT_TRUE(row.isUntouchedFrom(4 * n)) << n;
            }
        }
    }
}

TEST(GridKernels, StreamedColoursAreThoseThatAreStored) {
    for (InstructionSet const set : instructionSets()) {
        if (set == InstructionSet::PLAIN) {
            continue; // PlainBilateralFilter stands for it.
        }
        std::size_t const n = 37;
        ORVO::Test::Numbers numbers(12);
        std::vector<float> aPlanes[4];
        float const* apPlanes[4];
        for (std::size_t c = 0; c < 4; ++c) {
            for (std::size_t i = 0; i < n; ++i) {
                aPlanes[c].push_back(numbers.next());
            }
            apPlanes[c] = aPlanes[c].data();
        }
        AlignedRow stored;
        AlignedRow streamed;
        gridKernels(set).rgbaFromLab(apPlanes, stored.values, n, {true, false});
        gridKernels(set).rgbaFromLab(apPlanes, streamed.values, n, {true, true});
        EXPECT_EQ(0, std::memcmp(stored.values, streamed.values, sizeof stored.values));
        for (std::size_t i = 0; i < n; ++i) {
            ORVO::Test::DoublePixel const exact = ORVO::Test::reference::rgbFromLab(
                {aPlanes[0][i], aPlanes[1][i], aPlanes[2][i], aPlanes[3][i]});
            for (std::size_t c = 0; c < 3; ++c) {
                double const expected = std::min(1.0, std::max(0.0, exact[c] / exact[3]));
                ASSERT_NEAR(expected, streamed.values[4 * i + c], 2e-5 / exact[3]) << i << " " << c;
            }
            ASSERT_EQ(aPlanes[3][i], streamed.values[4 * i + 3]);
        }
        EXPECT_TRUE(streamed.isUntouchedFrom(4 * n));
    }
}

} // namespace
