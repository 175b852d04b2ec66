#include "orvo/colour_engine/internal/TransformResolver.h"

#include "orvo/colour_engine/internal/CubeFitting.h"
#include "orvo/colour_engine/internal/LcmsHandles.h"
#include "orvo/colour_engine/internal/MatrixShaperExtraction.h"
#include "orvo/colour_engine/internal/Profile.h"
#include "orvo/colour_engine/internal/ResolvedTransform.h"
#include "orvo/colour_engine/internal/StageExtraction.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <functional>
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

/// How far two results of samples may be from each other, away from black and at it.
struct Tolerance {
    double dElsewhere;
    double dNearBlack;

    bool holds(double a, double b) const {
        constexpr double nearBlack = 1.0 / 128.0;
        return std::abs(a - b) <= (std::min(a, b) < nearBlack ? dNearBlack : dElsewhere);
    }
};

/// The library works in single precision inside: where an output curve is steep, at black, its noise grows.
constexpr Tolerance oOfShapers = {1.0 / 32768.0, 2e-3};
/// In tables it works with 16 bits, of which one is four times as much after the steepest usual curve.
constexpr Tolerance oOfTables = {8.0 / 32768.0, 8e-3};

/// Whether what the tags say is what the library does, on a lattice and along the greys. A profile may have
/// tables beside its curves, a black point to be moved or a white of its own.
bool agrees(ResolvedTransform const& transform, ExactRoad const& road, Tolerance const& tolerance) {
    auto const same = [&](Colour const& colour) {
        Colour const ours = transform.evaluate(colour);
        Colour const theirs = road(colour);
        return std::equal(ours.begin(), ours.end(), theirs.begin(),
                          [&](double a, double b) { return tolerance.holds(a, b); });
    };
    constexpr std::array aLevels = {0.0, 0.23, 0.5, 0.77, 1.0};
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

} // namespace

std::shared_ptr<ResolvedTransform const> resolveTransform(Profile const& source, Profile const& destination,
                                                          std::uint32_t intent, std::uint32_t options) {
    // The colour library reads a profile's tags on demand and keeps them in it.
    static std::mutex oLock;
    std::lock_guard<std::mutex> const lock(oLock);
    ExactRoad const road(source, destination, intent, options);
    if (auto shaper = extractMatrixShaper(source, destination, intent); shaper.has_value()) {
        auto spTransform = std::make_shared<ResolvedTransform const>(*std::move(shaper));
        if (agrees(*spTransform, road, oOfShapers)) {
            return spTransform;
        }
    }
    if (auto stages = extractStages(source, destination, intent, options); stages.has_value()) {
        auto spTransform = std::make_shared<ResolvedTransform const>(*std::move(stages));
        if (agrees(*spTransform, road, oOfTables)) {
            return spTransform;
        }
    }
    return std::make_shared<ResolvedTransform const>(fitCube(std::ref(road)));
}

} // namespace ORVO::ColourEngine::Internal
