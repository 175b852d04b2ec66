#include "orvo/colour_engine/internal/TableStages.h"

#include <algorithm>
#include <cmath>

namespace ORVO::ColourEngine::Internal {

namespace {

using Colour = std::array<double, 3>;

Colour applied(CurveStage const& stage, Colour const& colour) {
    Colour result{};
    for (std::size_t i = 0; i < 3; ++i) {
        result[i] = clampToUnit(stage.aCurves_[i](clampToUnit(colour[i])));
    }
    return result;
}

Colour applied(MatrixStage const& stage, Colour const& colour) {
    Colour result = stage.aOffset_;
    for (std::size_t i = 0; i < 3; ++i) {
        for (std::size_t j = 0; j < 3; ++j) {
            result[i] += stage.aMatrix_[3 * i + j] * colour[j];
        }
    }
    return result;
}

/// A colour's cell of a table and where it lies in it.
struct Place {
    std::array<std::size_t, 3> aCell_;
    Colour aFraction_;

    Place(GridStage const& grid, Colour const& colour) : aCell_(), aFraction_() {
        for (std::size_t i = 0; i < 3; ++i) {
            auto const last = static_cast<double>(grid.aEdges_[i] - 1);
            double position = clampToUnit(colour[i]) * last;
            if (grid.bWords_) {
                double const steps = std::floor(clampToUnit(colour[i]) * 65535.0 + 0.5) * last;
                position = (steps + std::floor(steps / 65535.0 + 0.5)) / 65536.0;
            }
            aCell_[i] = std::min(static_cast<std::size_t>(position), grid.aEdges_[i] - 2);
            aFraction_[i] = position - static_cast<double>(aCell_[i]);
        }
    }
};

Colour nodeOf(GridStage const& grid, std::array<std::size_t, 3> const& aNode) {
    std::size_t const index = (aNode[2] * grid.aEdges_[1] + aNode[1]) * grid.aEdges_[0] + aNode[0];
    double const unit = grid.bWords_ ? 65535.0 : 1.0;
    Colour node{};
    for (std::size_t i = 0; i < 3; ++i) {
        node[i] = unit * static_cast<double>(grid.aNodes_[3 * index + i]);
        node[i] = grid.bWords_ ? std::round(node[i]) : node[i];
    }
    return node;
}

Colour trilinear(GridStage const& grid, Place const& place) {
    std::array<Colour, 8> aCorners{};
    for (std::size_t corner = 0; corner < 8; ++corner) {
        aCorners[corner] =
            nodeOf(grid, {place.aCell_[0] + (corner & 1U), place.aCell_[1] + (corner >> 1U & 1U),
                          place.aCell_[2] + (corner >> 2U)});
    }
    // Along the first axis four pairs become four values, along the second two, along the third one.
    for (std::size_t axis = 0; axis < 3; ++axis) {
        for (std::size_t pair = 0; pair < 4U >> axis; ++pair) {
            for (std::size_t i = 0; i < 3; ++i) {
                double const lower = aCorners[2 * pair][i];
                double const rise = place.aFraction_[axis] * (aCorners[2 * pair + 1][i] - lower);
                aCorners[pair][i] = lower + (grid.bWords_ ? std::floor(rise + 0.5) : rise);
            }
        }
    }
    return aCorners[0];
}

/// From the lower corner along the axes, that of the largest fraction first.
Colour tetrahedral(GridStage const& grid, Place const& place) {
    std::array<std::size_t, 3> aAxes = {0, 1, 2};
    std::stable_sort(aAxes.begin(), aAxes.end(),
                     [&](std::size_t a, std::size_t b) { return place.aFraction_[a] > place.aFraction_[b]; });
    std::array<std::size_t, 3> aNode = place.aCell_;
    Colour const lower = nodeOf(grid, aNode);
    Colour before = lower;
    Colour rise{};
    for (std::size_t const axis : aAxes) {
        ++aNode[axis];
        Colour const next = nodeOf(grid, aNode);
        for (std::size_t i = 0; i < 3; ++i) {
            rise[i] += place.aFraction_[axis] * (next[i] - before[i]);
        }
        before = next;
    }
    Colour result{};
    for (std::size_t i = 0; i < 3; ++i) {
        result[i] = lower[i] + (grid.bWords_ ? std::floor(rise[i] * (65536.0 / 65535.0) + 0.5) : rise[i]);
    }
    return result;
}

Colour applied(GridStage const& stage, Colour const& colour) {
    Place const place(stage, colour);
    Colour result = stage.bTrilinear_ ? trilinear(stage, place) : tetrahedral(stage, place);
    for (double& value : result) {
        value /= stage.bWords_ ? 65535.0 : 1.0;
    }
    return result;
}

// CIE 15: lightness is a cube root above (24 / 116)^3 of white, and a line below.
double linearOf(double lightness) {
    constexpr double dLimit = 24.0 / 116.0;
    return lightness > dLimit ? lightness * lightness * lightness
                              : 108.0 / 841.0 * (lightness - 16.0 / 116.0);
}

double lightnessOf(double light) {
    constexpr double dLimit = 24.0 / 116.0 * (24.0 / 116.0) * (24.0 / 116.0);
    return light > dLimit ? std::cbrt(light) : 841.0 / 108.0 * light + 16.0 / 116.0;
}

Colour applied(ConnectionStage eStage, Colour const& colour) {
    auto const& white = CONNECTION_WHITE;
    if (eStage == ConnectionStage::LAB_TO_XYZ) {
        double const y = (100.0 * colour[0] + 16.0) / 116.0;
        double const x = y + (255.0 * colour[1] - 128.0) / 500.0;
        double const z = y - (255.0 * colour[2] - 128.0) / 200.0;
        return {white[0] * linearOf(x), white[1] * linearOf(y), white[2] * linearOf(z)};
    }
    double const x = lightnessOf(colour[0] / white[0]);
    double const y = lightnessOf(colour[1] / white[1]);
    double const z = lightnessOf(colour[2] / white[2]);
    return {(116.0 * y - 16.0) / 100.0, (500.0 * (x - y) + 128.0) / 255.0, (200.0 * (y - z) + 128.0) / 255.0};
}

} // namespace

std::array<double, 3> evaluateStages(TableStages const& aStages, std::size_t nStages,
                                     std::array<double, 3> const& colour) {
    Colour result = colour;
    for (std::size_t i = 0; i < nStages; ++i) {
        result = std::visit([&](auto const& stage) { return applied(stage, result); }, aStages[i]);
    }
    if (nStages == aStages.size()) {
        for (double& value : result) {
            value = clampToUnit(value);
        }
    }
    return result;
}

} // namespace ORVO::ColourEngine::Internal
