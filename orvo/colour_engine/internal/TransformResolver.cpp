#include "orvo/colour_engine/internal/TransformResolver.h"

#include "orvo/colour_engine/internal/LcmsHandles.h"
#include "orvo/colour_engine/internal/MatrixShaperExtraction.h"
#include "orvo/colour_engine/internal/Profile.h"
#include "orvo/colour_engine/internal/ResolvedTransform.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <mutex>
#include <optional>
#include <stdexcept>

namespace ORVO::ColourEngine::Internal {

namespace {

using Colour = std::array<double, 3>;

/// The colour library's own road in double precision, grey spaces as in MatrixShaper.
class ExactRoad {
public:
    ExactRoad(Profile const& source, Profile const& destination, std::uint32_t intent, std::uint32_t options)
        : bGrayIn_(source.isGray()), bGrayOut_(destination.isGray()) {
        cmsUInt32Number flags = cmsFLAGS_NOOPTIMIZE | cmsFLAGS_NOCACHE;
        if ((options & TRANSFORM_BLACK_POINT_COMPENSATION) != 0) {
            flags |= cmsFLAGS_BLACKPOINTCOMPENSATION;
        }
        transform_.reset(cmsCreateTransformTHR(lcmsContext(), source.handle(),
                                               bGrayIn_ ? TYPE_GRAY_DBL : TYPE_RGB_DBL, destination.handle(),
                                               bGrayOut_ ? TYPE_GRAY_DBL : TYPE_RGB_DBL, intent, flags));
        if (transform_ == nullptr) {
            throw std::runtime_error("no road between the profiles");
        }
    }

    Colour operator()(Colour const& colour) const {
        Colour const input = bGrayIn_ ? Colour{colour[1], 0.0, 0.0} : colour;
        Colour result{};
        cmsDoTransform(transform_.get(), input.data(), result.data(), 1);
        if (bGrayOut_) {
            result = {result[0], result[0], result[0]};
        }
        for (double& value : result) {
            value = value > 0.0 ? std::min(value, 1.0) : 0.0;
        }
        return result;
    }

private:
    TransformHandle transform_;
    bool bGrayIn_;
    bool bGrayOut_;
};

/// The library works in single precision inside: where an output curve is steep, at black, its noise grows.
bool isSameSample(double a, double b) {
    constexpr double nearBlack = 1.0 / 128.0;
    double const tolerance = std::min(a, b) < nearBlack ? 2e-3 : 1.0 / 32768.0;
    return std::abs(a - b) <= tolerance;
}

/// Whether curves and matrix say the same as the library on a lattice and along the greys. A profile may have
/// tables beside its curves, a black point to be moved or a white of its own: then they do not.
bool agrees(ResolvedTransform const& transform, ExactRoad const& road) {
    auto const same = [&](Colour const& colour) {
        Colour const ours = transform.evaluate(colour);
        Colour const theirs = road(colour);
        return std::equal(ours.begin(), ours.end(), theirs.begin(), isSameSample);
    };
    constexpr std::array aLevels = {0.0, 0.25, 0.5, 0.75, 1.0};
    for (double const red : aLevels) {
        for (double const green : aLevels) {
            for (double const blue : aLevels) {
                if (!same({red, green, blue})) {
                    return false;
                }
            }
        }
    }
    constexpr int nGreys = 64;
    for (int index = 0; index <= nGreys; ++index) {
        double const grey = static_cast<double>(index) / nGreys;
        if (!same({grey, grey, grey})) {
            return false;
        }
    }
    return true;
}

ColourCube fillCube(ExactRoad const& road) {
    constexpr std::size_t nEdge = ColourCube::nEdge_;
    constexpr double step = 1.0 / static_cast<double>(nEdge - 1);
    ColourCube cube;
    cube.aValues_.reserve(3 * nEdge * nEdge * nEdge);
    for (std::size_t b = 0; b < nEdge; ++b) {
        for (std::size_t g = 0; g < nEdge; ++g) {
            for (std::size_t r = 0; r < nEdge; ++r) {
                for (double const value : road({step * static_cast<double>(r), step * static_cast<double>(g),
                                                step * static_cast<double>(b)})) {
                    cube.aValues_.push_back(static_cast<float>(value));
                }
            }
        }
    }
    return cube;
}

} // namespace

std::shared_ptr<ResolvedTransform const> resolveTransform(Profile const& source, Profile const& destination,
                                                          std::uint32_t intent, std::uint32_t options) {
    // The colour library reads a profile's tags on demand and keeps them in it.
    static std::mutex oLock;
    std::lock_guard<std::mutex> const lock(oLock);
    ExactRoad const road(source, destination, intent, options);
    if (auto shaper = extractMatrixShaper(source, destination, intent); shaper.has_value()) {
        auto spTransform = std::make_shared<ResolvedTransform const>(*std::move(shaper));
        if (agrees(*spTransform, road)) {
            return spTransform;
        }
    }
    return std::make_shared<ResolvedTransform const>(fillCube(road));
}

} // namespace ORVO::ColourEngine::Internal
