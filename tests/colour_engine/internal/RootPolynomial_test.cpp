#include "orvo/colour_engine/internal/RootPolynomial.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>
#include <tuple>

namespace ORVO::ColourEngine::Internal {
namespace {

double thousandth(double) { return 1e-3; }

TEST(RootPolynomial, FindsWhatIsOne) {
    // t^1.5 = t * (0 + 1 * sqrt(t)).
    auto const power = RootPolynomial::fit({1, 0}, 2, 1.5, 0.0, 1.0, thousandth);
    ASSERT_TRUE(power.has_value());
    for (float const t : {0.0F, 0.25F, 0.64F, 1.0F})
        EXPECT_NEAR(std::pow(double(t), 1.5), (*power)(t), 1e-6) << t;
    // t^0.75 = t^(1/4) * (t^(1/8))^4: five terms, of which the last is 1.
    auto const quarters = RootPolynomial::fit({3, 2}, 5, 0.75, 0.0, 1.0, thousandth);
    ASSERT_TRUE(quarters.has_value());
    for (float const t : {0.0F, 0.0625F, 0.4F, 1.0F})
        EXPECT_NEAR(std::pow(double(t), 0.75), (*quarters)(t), 2e-6) << t;
}

TEST(RootPolynomial, KeepsTheToleranceOverItsInterval) {
    for (double const from : {0.0, 0.1}) {
        auto const power = RootPolynomial::fit({2, 0}, 6, 2.2, from, 1.5, [](double) { return 1e-4; });
        ASSERT_TRUE(power.has_value()) << from;
        for (int i = 0; i <= 1000; ++i) {
            double const t = from + (1.5 - from) * i / 1000.0;
            EXPECT_NEAR(std::pow(t, 2.2), (*power)(static_cast<float>(t)), 1.5e-4) << t;
        }
        // The end is pinned.
        EXPECT_NEAR(std::pow(1.5, 2.2), (*power)(1.5F), 3e-6);
    }
}

TEST(RootPolynomial, IsNotThereWhereItMissesTheTolerance) {
    EXPECT_FALSE(RootPolynomial::fit({1, 0}, 2, 2.2, 0.0, 1.0, thousandth).has_value());
    EXPECT_FALSE(RootPolynomial::fit({1, 0}, 5, 0.3, 0.0, 1.0, thousandth).has_value());
    double const nan = std::numeric_limits<double>::quiet_NaN();
    for (auto const& [exponent, from, to] : {std::tuple(nan, 0.0, 1.0),
                                             {2.0, nan, 1.0},
                                             {2.0, 0.0, nan},
                                             {2.0, -0.5, 1.0},
                                             {std::numeric_limits<double>::infinity(), 0.0, 2.0}})
        EXPECT_FALSE(RootPolynomial::fit({1, 0}, 3, exponent, from, to, thousandth).has_value())
            << exponent << " " << from << " " << to;
}

TEST(RootPolynomial, StatesItsRootsAndItsPairsOfTerms) {
    auto const power = RootPolynomial::fit({2, 1}, 3, 1.0, 0.0, 1.0, thousandth);
    ASSERT_TRUE(power.has_value());
    std::string const sText = power->statements();
    EXPECT_EQ(0U, sText.find("    float root1 = sqrt(t);\n"
                             "    float root2 = sqrt(root1);\n"
                             "    float power = root1 * (("))
        << sText;
    EXPECT_NE(std::string::npos, sText.find(" * root2) + root1 * (")) << sText;
    EXPECT_EQ("));\n", sText.substr(sText.size() - 4)) << sText;
    // One root: its square is t itself. An even number of terms: the last pair is whole.
    std::string const sOne = RootPolynomial::fit({1, 0}, 4, 2.0, 0.0, 1.0, thousandth)->statements();
    EXPECT_EQ(0U, sOne.find("    float root1 = sqrt(t);\n    float power = t * ((")) << sOne;
    EXPECT_NE(std::string::npos, sOne.find(" * root1) + t * (")) << sOne;
    EXPECT_NE(std::string::npos, sOne.find(" * root1));\n")) << sOne;
}

} // namespace
} // namespace ORVO::ColourEngine::Internal
