#include "orvo/image_flow/filters/bilateral/SimpleKernels.h"

#include "tests/image_flow/support/BilateralReference.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <vector>

namespace {

using namespace ORVO::ImageFlow::bilateral;
using ORVO::ImageRuntime::InstructionSet;
using ORVO::Test::instructionSets;
using ORVO::Test::Numbers;

float const kNaN = std::numeric_limits<float>::quiet_NaN();
float const kInfinity = std::numeric_limits<float>::infinity();
constexpr float kGuard = 77.0F;

/// The rows of a window and what a kernel makes of them.
class Window {
public:
    Window(std::size_t nPixels, int nHalf)
        : nPixels_(nPixels), nHalf_(nHalf), nPitch_(nPixels + side() + 15) {
        aRows_.assign(side(), std::vector<float>(4 * nPitch_, 0.0F));
        aWeights_.assign((std::size_t(nHalf) + 1) * (std::size_t(nHalf) + 1), 1.0F);
    }

    std::size_t side() const { return 2 * std::size_t(nHalf_) + 1; }

    void fillFrom(Numbers& numbers) {
        for (std::size_t row = 0; row < side(); ++row) {
            for (std::size_t column = 0; column < nPixels_ + side() - 1; ++column) {
                setPixel(row, column, {numbers.next(), numbers.next(), numbers.next()});
            }
        }
        for (float& weight : aWeights_) {
            weight = numbers.next();
        }
    }

    /// Columns are counted from the first neighbour of the first pixel.
    void setPixel(std::size_t row, std::size_t column, std::array<float, 3> const& rgb) {
        float* const p = aRows_.at(row).data() + column;
        for (std::size_t c = 0; c < 3; ++c) {
            p[c * nPitch_] = rgb[c];
        }
        p[3 * nPitch_] = 0.39F * rgb[0] + 0.5F * rgb[1] + 0.11F * rgb[2];
    }

    std::vector<float> result(InstructionSet set, float rangeSigma, bool bColorize) const {
        std::vector<float const*> apRows;
        for (auto const& row : aRows_) {
            apRows.push_back(row.data());
        }
        std::vector<float> aResult(4 * nPixels_ + 64, kGuard);
        SimpleJob job = {};
        job.apRows = apRows.data();
        job.pCentres = aRows_[std::size_t(nHalf_)].data();
        job.nPitch = nPitch_;
        job.nPixels = nPixels_;
        job.nHalf = nHalf_;
        job.bColorize = bColorize;
        job.fRangeDivisor = rangeSigma * 2.0F * rangeSigma;
        job.pSpatialWeights = aWeights_.data();
        job.pRGBA = aResult.data();
        simpleKernel(set)(job);
        EXPECT_TRUE(std::all_of(aResult.end() - 64, aResult.end(), [](float v) { return v == kGuard; }));
        aResult.resize(4 * nPixels_);
        return aResult;
    }

private:
    std::size_t nPixels_;
    int nHalf_;
    std::size_t nPitch_;
    std::vector<std::vector<float>> aRows_;
    std::vector<float> aWeights_;
};

/// Compares each kernel with the plain one; NaN equals NaN.
void expectAlike(Window const& window, float rangeSigma, float tolerance) {
    for (bool bColorize : {false, true}) {
        std::vector<float> const expected = window.result(InstructionSet::PLAIN, rangeSigma, bColorize);
        for (InstructionSet const set : instructionSets()) {
            std::vector<float> const actual = window.result(set, rangeSigma, bColorize);
            for (std::size_t i = 0; i < expected.size(); ++i) {
                ASSERT_EQ(std::isnan(expected[i]), std::isnan(actual[i])) << set << ": " << i;
                if (!std::isnan(expected[i])) {
                    ASSERT_TRUE(expected[i] == actual[i] || std::abs(expected[i] - actual[i]) <= tolerance)
                        << set << ": " << i << ": " << actual[i] << " for " << expected[i];
                }
            }
        }
    }
}

TEST(SimpleKernels, UnknownSetsAreRefused) {
    ORVO_EXPECT_PARAMETER(simpleKernel(static_cast<InstructionSet>(99)), "isSupported(eInstructionSet)");
}

TEST(SimpleKernels, AllAgreeWithThePlainOne) {
    Numbers numbers(3);
    for (int nHalf : {0, 1, 3}) {
        for (std::size_t nPixels = 1; nPixels <= 37; ++nPixels) {
            Window window(nPixels, nHalf);
            window.fillFrom(numbers);
            for (float rangeSigma : {0.03F, 0.1F, 1.0F}) {
                expectAlike(window, rangeSigma, 1e-6F);
            }
        }
    }
}

TEST(SimpleKernels, EqualPixelsGiveTheSameBitForBit) {
    // exp(0) is 1 in all of them, and products and sums are those of the plain one.
    for (float v : {0.2F, 100.0F / 255.0F, 0.7F}) {
        Window window(21, 2);
        for (std::size_t row = 0; row < 5; ++row) {
            for (std::size_t column = 0; column < 25; ++column) {
                window.setPixel(row, column, {v, v, v});
            }
        }
        expectAlike(window, 0.1F, 0.0F);
    }
}

TEST(SimpleKernels, SpecialValuesAreTreatedAlike) {
    Numbers numbers(4);
    for (float special : {kNaN, kInfinity, -kInfinity, 1e38F, 1e-40F}) {
        Window window(33, 2);
        window.fillFrom(numbers);
        window.setPixel(2, 9, {special, 0.5F, 0.5F});
        window.setPixel(4, 30, {0.5F, 0.5F, special});
        expectAlike(window, 0.1F, 1e-6F);
    }
}

TEST(SimpleKernels, SenselessRangeSigmasAreTreatedAlike) {
    Numbers numbers(5);
    Window window(19, 1);
    window.fillFrom(numbers);
    // The square of 1e-20 is no normal number, that of 1e30 is infinite.
    for (float rangeSigma : {0.0F, 1e-20F, 1e-30F, 1e30F, -0.1F, kNaN, kInfinity}) {
        expectAlike(window, rangeSigma, 1e-6F);
    }
}

TEST(SimpleKernels, WeightsTooSmallForNormalNumbersCount) {
    // The centre is 1 away from all its neighbours and is none of them: its window is moved aside. All
    // weights are exp(-95), and cancel.
    for (InstructionSet const set : instructionSets()) {
        std::vector<float> aRow(4 * 64, 0.75F);
        std::vector<float> aCentres(4 * 64, -0.25F);
        float const* const pRow = aRow.data();
        float const weight = 1.0F;
        std::vector<float> aResult(4 * 20);
        SimpleJob job = {&pRow, aCentres.data(), 64, 20, 0, false, 1.0F / 95.0F, &weight, aResult.data()};
        simpleKernel(set)(job);
        for (std::size_t i = 0; i < aResult.size(); i += 4) {
            EXPECT_NEAR(0.75F, aResult[i], 1e-4F) << set;
        }
        // At exp(-200) nothing is left: 0 / 0.
        job.fRangeDivisor = 1.0F / 200.0F;
        simpleKernel(set)(job);
        EXPECT_TRUE(std::isnan(aResult[0])) << set;
    }
}

} // namespace
