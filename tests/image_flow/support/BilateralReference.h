/// Images for tests of the bilateral and Lab filters, and the filters once more in double precision, written
/// down from their formulas without a look at the library's code.
#pragma once

#include "orvo/core/math/Float.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageReadAccessor.h"
#include "orvo/image_runtime/images/ImageWriteAccessor.h"
#include "orvo/image_runtime/kernels/InstructionSet.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <ostream>
#include <vector>

namespace ORVO::Test {

/// The instruction sets that this machine runs, PLAIN first.
inline std::vector<ImageRuntime::InstructionSet> instructionSets() {
    std::vector<ImageRuntime::InstructionSet> sets;
    for (auto set : {ImageRuntime::InstructionSet::PLAIN, ImageRuntime::InstructionSet::SSE2,
                     ImageRuntime::InstructionSet::AVX2, ImageRuntime::InstructionSet::AVX512}) {
        if (ImageRuntime::isSupported(set)) {
            sets.push_back(set);
        }
    }
    return sets;
}

/// Makes an instruction set the active one for a scope.
class ScopedInstructionSet {
public:
    explicit ScopedInstructionSet(ImageRuntime::InstructionSet set)
        : oBefore_(ImageRuntime::activeInstructionSet()) {
        ImageRuntime::setActiveInstructionSet(set);
    }
    ~ScopedInstructionSet() { ImageRuntime::setActiveInstructionSet(oBefore_); }
    ScopedInstructionSet(ScopedInstructionSet const&) = delete;
    ScopedInstructionSet& operator=(ScopedInstructionSet const&) = delete;

private:
    ImageRuntime::InstructionSet oBefore_;
};

/// A pixel in double precision: r, g, b or L, a, b, and alpha.
using DoublePixel = std::array<double, 4>;

/// A picture of RGBA pixels in memory of the test, at a position.
struct Picture {
    int x;
    int y;
    int width;
    int height;
    std::vector<float4> pixels;

    Picture(int left, int top, int columns, int rows, float4 fill = float4(0.0F))
        : x(left),
          y(top),
          width(columns),
          height(rows),
          pixels(static_cast<std::size_t>(columns) * static_cast<std::size_t>(rows), fill) {}

    float4& at(int column, int row) {
        return pixels.at(static_cast<std::size_t>(row) * static_cast<std::size_t>(width) +
                         static_cast<std::size_t>(column));
    }
    float4 const& at(int column, int row) const { return const_cast<Picture*>(this)->at(column, row); }
    PositionExtentInPixelSpace rectangle() const {
        return {PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height)};
    }
};

/// Reads a picture: an accessor that the library does not know.
class PictureReader : public ImageReadAccessor {
public:
    explicit PictureReader(Picture const& picture) : oPicture_(picture) {}
    PositionExtentInPixelSpace positionExtent() const override { return oPicture_.rectangle(); }
    PositionInPixelSpace position() const override { return oPicture_.rectangle().position(); }
    ExtentInPixelSpace extent() const override { return oPicture_.rectangle().extent(); }
    int physicalWidth() const override { return oPicture_.width; }
    float4 getRGBAFloat4PixelAt(int x, int y) const override {
        return oPicture_.at(x - oPicture_.x, y - oPicture_.y);
    }

private:
    Picture const& oPicture_;
};

/// Writes a picture as it is told, without clamping.
class PictureWriter : public ImageWriteAccessor {
public:
    explicit PictureWriter(Picture& picture) : oPicture_(picture) {}
    PositionExtentInPixelSpace positionExtent() const override { return oPicture_.rectangle(); }
    PositionInPixelSpace position() const override { return oPicture_.rectangle().position(); }
    ExtentInPixelSpace extent() const override { return oPicture_.rectangle().extent(); }
    int physicalWidth() const override { return oPicture_.width; }
    void writeRGBAFloatPixel4At(float4 pixel, int x, int y) override {
        oPicture_.at(x - oPicture_.x, y - oPicture_.y) = pixel;
        ++nWritten_;
    }
    std::size_t written() const { return nWritten_; }

private:
    Picture& oPicture_;
    std::size_t nWritten_ = 0;
};

/// Numbers that look random and are the same in every run, in 0..1.
class Numbers {
public:
    explicit Numbers(std::uint32_t seed) : iState_(seed * 2654435761U + 1U) {}
    float next() {
        iState_ = iState_ * 1664525U + 1013904223U;
        return static_cast<float>(iState_ >> 8U) / 16777216.0F;
    }

private:
    std::uint32_t iState_;
};

/// Smooth patches with edges and noise: every cell of the grid gets something, none everything.
inline Picture randomPicture(int x, int y, int width, int height, std::uint32_t seed, float low = 0.0F,
                             float high = 1.0F, bool opaque = false) {
    Picture picture(x, y, width, height);
    Numbers numbers(seed);
    for (int row = 0; row < height; ++row) {
        for (int column = 0; column < width; ++column) {
            float const patch = (column / 13 + row / 9) % 2 != 0 ? 0.7F : 0.2F;
            auto const channel = [&] {
                return low + (high - low) * (0.75F * patch + 0.25F * numbers.next());
            };
            float const r = channel();
            float const g = channel();
            float const b = channel();
            picture.at(column, row) = float4(r, g, b, opaque ? 1.0F : 0.25F + 0.75F * numbers.next());
        }
    }
    return picture;
}

namespace reference {

inline double signedPart(double magnitude, double original) { return original < 0 ? -magnitude : magnitude; }

inline DoublePixel labFromRGB(DoublePixel const& p) {
    std::array<double, 3> linear = {};
    for (std::size_t i = 0; i < 3; ++i) {
        double const c = std::abs(p[i]);
        linear[i] = signedPart(c > 0.04045 ? std::pow((c + 0.055) / 1.055, 2.4) : c / 12.92, p[i]);
    }
    double const xyz[3] = {0.4124 * linear[0] + 0.3576 * linear[1] + 0.1805 * linear[2],
                           0.2126 * linear[0] + 0.7152 * linear[1] + 0.0722 * linear[2],
                           0.0193 * linear[0] + 0.1192 * linear[1] + 0.9505 * linear[2]};
    double const white[3] = {0.95047, 1.0, 1.08883};
    double f[3];
    for (int i = 0; i < 3; ++i) {
        double const t = std::abs(xyz[i]) / white[i];
        f[i] = signedPart(t > 0.008856 ? std::pow(t, 0.33333337) : 7.787 * t + 0.13793103, xyz[i]);
    }
    return {1.16 * f[1] + (xyz[1] < 0 ? 0.16 : -0.16), (f[0] - f[1]) * 5, (f[1] - f[2]) * 2, p[3]};
}

inline DoublePixel rgbFromLab(DoublePixel const& p) {
    double const fy = (p[0] + (p[0] > 0 ? 0.16 : -0.16)) / 1.16;
    double const f[3] = {p[1] / 5 + fy, fy, fy - p[2] * 0.5};
    double const white[3] = {0.95047, 1.0, 1.08883};
    double xyz[3];
    for (int i = 0; i < 3; ++i) {
        double const m = std::abs(f[i]);
        double const cube = m * m * m;
        xyz[i] = signedPart(cube <= 0.008856 ? (m - 0.13793103) / 7.787 : cube, f[i]) * white[i];
    }
    double const linear[3] = {3.2406 * xyz[0] - 1.5372 * xyz[1] - 0.4986 * xyz[2],
                              -0.9689 * xyz[0] + 1.8758 * xyz[1] + 0.0415 * xyz[2],
                              0.0557 * xyz[0] - 0.204 * xyz[1] + 1.057 * xyz[2]};
    DoublePixel result = {0, 0, 0, p[3]};
    for (std::size_t i = 0; i < 3; ++i) {
        double const c = std::abs(linear[i]);
        result[i] = signedPart(c > 0.0031308 ? std::pow(c, 0.41667) * 1.055 - 0.055 : c * 12.92, linear[i]);
    }
    return result;
}

/// What the bilateral filters are told.
struct Settings {
    double rangeSigma;
    double sigmaX;
    double sigmaY;
    bool colorize;
};

/// The picture that the bilateral filters work on: (luminance, 0, 0, alpha) or (L, a, b, alpha) of what lies
/// at the places of the destination.
inline std::vector<DoublePixel> workingPicture(Picture const& source, Picture const& destination,
                                               bool colorize) {
    std::vector<DoublePixel> working;
    for (int row = 0; row < destination.height; ++row) {
        for (int column = 0; column < destination.width; ++column) {
            int const x = destination.x + column - source.x;
            int const y = destination.y + row - source.y;
            DoublePixel p = {0, 0, 0, 0};
            if (x >= 0 && x < source.width && y >= 0 && y < source.height) {
                float4 const& s = source.at(x, y);
                p = {double(s.x) * s.w, double(s.y) * s.w, double(s.z) * s.w, s.w};
            }
            working.push_back(colorize ? labFromRGB(p)
                                       : DoublePixel{0.39 * p[0] + 0.5 * p[1] + 0.11 * p[2], 0, 0, p[3]});
        }
    }
    return working;
}

inline void writeBack(std::vector<DoublePixel> const& working, bool colorize, Picture& destination) {
    for (std::size_t i = 0; i < working.size(); ++i) {
        DoublePixel p = working[i];
        p = colorize ? rgbFromLab(p) : DoublePixel{p[0], p[0], p[0], p[3]};
        for (std::size_t c = 0; c < 3 && p[3] != 0; ++c) {
            p[c] /= p[3];
        }
        destination.pixels[i] = float4(float(p[0]), float(p[1]), float(p[2]), float(p[3]));
    }
}

/// The intensity axis: lowest value and length.
inline std::array<double, 2> axisOf(std::vector<DoublePixel> const& working) {
    double low = std::numeric_limits<double>::infinity();
    double high = -low;
    for (DoublePixel const& p : working) {
        low = std::min(low, p[0]);
        high = std::max(high, p[0]);
    }
    if (low >= 0 && high <= 1) {
        return {0.0, 1.0};
    }
    return {low, high - low};
}

/// The grid, with the blur as one weighted sum over the 7 x 7 x 7 cells around.
class Grid {
public:
    Grid(std::vector<DoublePixel> const& working, int width, int height, Settings const& settings)
        : oSettings_(settings),
          aAxis_(axisOf(working)),
          nWidth_(int(std::trunc((width - 1) / settings.sigmaX)) + 8),
          nHeight_(int(std::trunc((height - 1) / settings.sigmaY)) + 8),
          nDepth_(int(std::trunc(1 / (settings.rangeSigma / aAxis_[1]))) + 8) {
        std::size_t const n = std::size_t(nWidth_) * std::size_t(nHeight_) * std::size_t(nDepth_);
        aCells_.assign(n, DoublePixel{0, 0, 0, 0});
        for (int i = 0; i < width * height; ++i) {
            DoublePixel const& p = working[std::size_t(i)];
            DoublePixel& cell = at(aCells_, int(std::floor(i % width / settings.sigmaX + 0.5)) + 4,
                                   int(std::floor(i / width / settings.sigmaY + 0.5)) + 4,
                                   int(std::floor(level(p[0]) + 0.5)) + 4);
            cell = {cell[0] + p[0], cell[1] + p[1], cell[2] + p[2], cell[3] + 1};
        }
        aBlurred_ = blurredAlong(blurredAlong(blurredAlong(aCells_, 0), 1), 2);
    }

    DoublePixel valueAt(int px, int py, double intensity) const {
        double const place[3] = {px / oSettings_.sigmaX + 4, py / oSettings_.sigmaY + 4,
                                 level(intensity) + 4};
        DoublePixel sum = {0, 0, 0, 0};
        for (int corner = 0; corner < 8; ++corner) {
            double weight = 1;
            int cell[3];
            for (int axis = 0; axis < 3; ++axis) {
                bool const next = (corner >> axis & 1) != 0;
                double const fraction = place[axis] - std::floor(place[axis]);
                weight *= next ? fraction : 1 - fraction;
                cell[axis] = int(std::floor(place[axis])) + (next ? 1 : 0);
            }
            if (weight == 0) {
                continue;
            }
            DoublePixel const& c =
                at(const_cast<std::vector<DoublePixel>&>(aBlurred_), cell[0], cell[1], cell[2]);
            for (std::size_t k = 0; k < 3 && c[3] != 0; ++k) {
                sum[k] += weight * c[k] / c[3];
            }
        }
        return sum;
    }

private:
    double level(double value) const {
        return (value - aAxis_[0]) / aAxis_[1] / (oSettings_.rangeSigma / aAxis_[1]);
    }

    DoublePixel& at(std::vector<DoublePixel>& cells, int x, int y, int z) const {
        EXPECT_TRUE(x >= 0 && x < nWidth_ && y >= 0 && y < nHeight_ && z >= 0 && z < nDepth_);
        return cells.at((std::size_t(y) * std::size_t(nDepth_) + std::size_t(z)) * std::size_t(nWidth_) +
                        std::size_t(x));
    }

    std::vector<DoublePixel> blurredAlong(std::vector<DoublePixel> cells, int axis) const {
        std::vector<DoublePixel> result(cells.size(), DoublePixel{0, 0, 0, 0});
        int const size[3] = {nWidth_, nHeight_, nDepth_};
        for (int y = 0; y < nHeight_; ++y) {
            for (int z = 0; z < nDepth_; ++z) {
                for (int x = 0; x < nWidth_; ++x) {
                    for (int d = -3; d <= 3; ++d) {
                        int place[3] = {x, y, z};
                        place[axis] += d;
                        if (place[axis] < 0 || place[axis] >= size[axis]) {
                            continue;
                        }
                        static double const weights[4] = {1, 0.60653067, 0.13533528, 0.011108996};
                        DoublePixel const& tap = at(cells, place[0], place[1], place[2]);
                        for (std::size_t k = 0; k < 4; ++k) {
                            at(result, x, y, z)[k] += weights[std::abs(d)] * tap[k];
                        }
                    }
                }
            }
        }
        return result;
    }

    Settings oSettings_;
    std::array<double, 2> aAxis_;
    int nWidth_;
    int nHeight_;
    int nDepth_;
    std::vector<DoublePixel> aCells_;
    std::vector<DoublePixel> aBlurred_;
};

/// The fast filter on its grid road.
inline Picture gridFilter(Picture const& source, Picture destination, Settings const& settings) {
    std::vector<DoublePixel> working = workingPicture(source, destination, settings.colorize);
    Grid const grid(working, destination.width, destination.height, settings);
    for (int i = 0; i < destination.width * destination.height; ++i) {
        DoublePixel& p = working[std::size_t(i)];
        DoublePixel const v = grid.valueAt(i % destination.width, i / destination.width, p[0]);
        p = {v[0], v[1], v[2], p[3]};
    }
    writeBack(working, settings.colorize, destination);
    return destination;
}

/// The fast filter on its direct road, with sigmas that it does not refuse.
inline Picture directFilter(Picture const& source, Picture destination, Settings const& settings) {
    std::vector<DoublePixel> const working = workingPicture(source, destination, settings.colorize);
    std::vector<DoublePixel> result = working;
    int const count = destination.width * destination.height;
    int const radiusX = int(std::ceil(settings.sigmaX * 2.146));
    int const radiusY = int(std::ceil(settings.sigmaY * 2.146));
    for (int i = 0; i < count; ++i) {
        DoublePixel sum = {0, 0, 0, 0};
        for (int dy = -radiusY; dy <= radiusY; ++dy) {
            for (int dx = -radiusX; dx <= radiusX; ++dx) {
                int const tap = i + dy * destination.width + dx;
                if (tap < 0 || tap >= count) {
                    continue;
                }
                DoublePixel const& v = working[std::size_t(tap)];
                double const distance = working[std::size_t(i)][0] - v[0];
                double const w =
                    std::exp(-(dx * dx + dy * dy) / (2 * settings.sigmaX * settings.sigmaY)) *
                    std::exp(-distance * distance / (2 * settings.rangeSigma * settings.rangeSigma));
                sum = {sum[0] + w * v[0], sum[1] + w * v[1], sum[2] + w * v[2], sum[3] + w};
            }
        }
        result[std::size_t(i)] = {sum[0] / sum[3], sum[1] / sum[3], sum[2] / sum[3],
                                  working[std::size_t(i)][3]};
    }
    writeBack(result, settings.colorize, destination);
    return destination;
}

/// The picture as it passes where nothing is smoothed.
inline Picture unsmoothed(Picture const& source, Picture destination, bool colorize) {
    writeBack(workingPicture(source, destination, colorize), colorize, destination);
    return destination;
}

} // namespace reference

inline float clampedToUnit(float v) { return v > 1.0F ? 1.0F : v < 0.0F ? 0.0F : v; }

/// A picture as a writer of the library would keep it.
inline Picture clamped(Picture picture) {
    for (float4& p : picture.pixels) {
        p = float4(clampedToUnit(p.x), clampedToUnit(p.y), clampedToUnit(p.z), clampedToUnit(p.w));
    }
    return picture;
}

/// Compares all channels; the first few differences are named.
inline void expectNear(Picture const& actual, Picture const& expected, float tolerance) {
    ASSERT_EQ(expected.width, actual.width);
    ASSERT_EQ(expected.height, actual.height);
    int nReported = 0;
    for (int row = 0; row < expected.height && nReported < 5; ++row) {
        for (int column = 0; column < expected.width && nReported < 5; ++column) {
            float4 const a = actual.at(column, row);
            float4 const e = expected.at(column, row);
            for (std::size_t c = 0; c < 4; ++c) {
                bool const same = std::isnan(e[c]) ? std::isnan(a[c]) : std::abs(a[c] - e[c]) <= tolerance;
                if (!same) {
                    ADD_FAILURE() << "pixel (" << column << ", " << row << ") channel " << c << ": " << a[c]
                                  << " instead of " << e[c];
                    ++nReported;
                }
            }
        }
    }
}

/// Whether all channels are the same, bit for bit.
inline bool areIdentical(Picture const& a, Picture const& b) {
    return a.pixels.size() == b.pixels.size() &&
           std::equal(a.pixels.begin(), a.pixels.end(), b.pixels.begin(),
                      [](float4 const& p, float4 const& q) {
                          return std::equal(p.begin(), p.end(), q.begin(), [](float s, float t) {
                              return s == t || (std::isnan(s) && std::isnan(t));
                          });
                      });
}

} // namespace ORVO::Test
