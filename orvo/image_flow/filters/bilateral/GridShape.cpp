#include "orvo/image_flow/filters/bilateral/GridShape.h"

#include "orvo/core/utility/SaturatingCast.h"

#include <algorithm>
#include <cmath>

namespace ORVO::ImageFlow::bilateral {

namespace {

constexpr std::size_t kMaximalGridSide = 8192;

// Far beyond any grid that serves, and small enough that adding the padding does not wrap.
constexpr std::size_t kAnyLargeNumberOfCells = std::size_t(1) << 40U;

std::size_t cellsFrom(float inner, float padding, float offset) {
    std::size_t const nInner = std::min(saturatingCast<std::size_t>(inner), kAnyLargeNumberOfCells);
    return nInner + saturatingCast<std::size_t>(2.0F * padding + offset);
}

// pixel / sigma in whole cells and a rest in pixels, both exact: a quotient rounded to float would lose more
// of its fraction the farther the pixel is from the edge.
struct ExactCells {
    double fWhole;
    double fRest;
};

ExactCells exactCells(std::size_t pixel, float sigma) {
    auto const fPixel = static_cast<double>(pixel);
    double const fRest = std::fmod(fPixel, static_cast<double>(sigma));
    return {(fPixel - fRest) / static_cast<double>(sigma), fRest};
}

} // namespace

ValueRange valueRange(float lowest, float highest) {
    if (lowest >= 0.0F && highest <= 1.0F) {
        return {0.0F, 1.0F};
    }
    return {lowest, highest - lowest};
}

std::size_t cellsAlong(int size, float sigma, float padding, float offset) {
    return cellsFrom(static_cast<float>(size - 1) / sigma, padding, offset);
}

std::size_t cellsInDepth(float rangeSigma, float valueExtent, float padding, float offset) {
    return cellsFrom(1.0F / (rangeSigma / valueExtent), padding, offset);
}

bool gridServesFor(std::size_t width, std::size_t height, std::size_t depth, float rangeSigma, float sigmaX,
                   float sigmaY) {
    return depth <= kMaximalGridSide / width && height <= kMaximalGridSide && rangeSigma > 0.05F &&
           sigmaX > 0.05F && sigmaY > 0.05F;
}

std::size_t clampedCell(float cell, std::size_t count) {
    return std::min(saturatingCast<std::size_t>(cell), count - 1);
}

std::size_t cellAlong(std::size_t pixel, float sigma, float padding, float offset, std::size_t count) {
    ExactCells const cells = exactCells(pixel, sigma);
    bool const isNearerToNext = 2.0 * cells.fRest >= static_cast<double>(sigma);
    double const nearest = cells.fWhole + (isNearerToNext ? 1.0 : 0.0);
    return clampedCell(static_cast<float>(nearest) + offset + padding, count);
}

GridPlace placeAlong(std::size_t pixel, float sigma, float padding, float offset) {
    ExactCells const cells = exactCells(pixel, sigma);
    double const shift = static_cast<double>(offset + padding);
    double const fraction = cells.fRest / static_cast<double>(sigma) + (shift - std::floor(shift));
    double const carry = std::floor(fraction);
    return {static_cast<float>(cells.fWhole + std::floor(shift) + carry),
            static_cast<float>(fraction - carry)};
}

int radiusOf(float sigma) {
    return std::clamp(saturatingCast<int>(std::ceil(sigma * 2.146F)), 0, kMaximalRadius);
}

bool directFilterIsIdentity(float rangeSigma, float sigmaX, float sigmaY) {
    return !(rangeSigma > 0.05F) || radiusOf(sigmaX) <= 1 || radiusOf(sigmaY) <= 1;
}

} // namespace ORVO::ImageFlow::bilateral
