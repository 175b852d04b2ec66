/// The bilateral grid of the GPU once more, in double precision, written down from its formulas without a
/// look at the library's programs.
#pragma once

#include "tests/image_flow/support/ShaderRoad.h"

#include <cmath>
#include <cstddef>
#include <functional>
#include <limits>
#include <vector>

namespace ORVO::Test::gpuBilateral {

struct Settings {
    double sigmaX = 5;
    double sigmaY = 5;
    float rangeSigma = 0.15F;
    bool colorize = false;
};

/// What a texture of the grid makes of a value that is written to it.
using Store = double (*)(double);

inline double exactly(double value) { return value; }

/// As a driver stores 16-bit floats that rounds toward zero: 11 significant bits, steps of 2^-24 near zero.
inline double halfTowardZero(double value) {
    if (value == 0 || !std::isfinite(value)) {
        return value;
    }
    int const exponent = std::max(std::ilogb(value), -14) - 10;
    return std::ldexp(std::trunc(std::ldexp(value, -exponent)), exponent);
}

inline double toLinear(double c) { return c <= 0.04045 ? c / 12.92 : std::pow((c + 0.055) / 1.055, 2.4); }

inline Pixel toLab(Pixel const& c) {
    double const r = toLinear(c[0]);
    double const g = toLinear(c[1]);
    double const b = toLinear(c[2]);
    auto const f = [](double t) { return t <= 216.0 / 24389.0 ? 7.787 * t + 16.0 / 116.0 : std::cbrt(t); };
    double const fx = f((0.4124 * r + 0.3576 * g + 0.1805 * b) / 0.95047);
    double const fy = f(0.2126 * r + 0.7152 * g + 0.0722 * b);
    double const fz = f((0.0193 * r + 0.1192 * g + 0.9505 * b) / 1.08883);
    return {1.16 * fy - 0.16, 5 * (fx - fy), 2 * (fy - fz), 0};
}

inline double toDisplay(double c) {
    double const m = std::abs(c);
    double const v = c <= 0.0031308 ? 12.92 * m : 1.055 * std::pow(m, 1 / 2.4) - 0.055;
    return c < 0 ? -v : v;
}

inline Pixel fromLab(double l, double a, double b) {
    double const fy = (l + 0.16) / 1.16;
    double const fx = a / 5 + fy;
    double const fz = fy - b * 0.5;
    auto const g = [](double f) { return f * f * f < 0.008856 ? (f - 0.1379) / 7.787 : f * f * f; };
    double const x = 0.95047 * g(fx);
    double const y = g(fy);
    double const z = 1.0883 * g(fz);
    return {toDisplay(3.2406 * x - 1.5372 * y - 0.4986 * z), toDisplay(-0.9689 * x + 1.8758 * y + 0.0415 * z),
            toDisplay(0.0557 * x - 0.2040 * y + 1.0570 * z), 0};
}

/// A grid: `depth` tiles of `width` by `height` cells, side by side; zeros outside.
class Grid {
public:
    Grid(int width, int height, int depth)
        : nWidth_(width),
          nHeight_(height),
          nDepth_(depth),
          aCells_(static_cast<std::size_t>(width) * static_cast<std::size_t>(depth) *
                  static_cast<std::size_t>(height)) {}
    int width() const { return nWidth_; }
    int height() const { return nHeight_; }
    int depth() const { return nDepth_; }
    bool contains(int x, int y) const { return x >= 0 && y >= 0 && x < nWidth_ * nDepth_ && y < nHeight_; }
    Pixel& at(int x, int y) {
        return aCells_[static_cast<std::size_t>(y) * static_cast<std::size_t>(nWidth_ * nDepth_) +
                       static_cast<std::size_t>(x)];
    }
    Pixel get(int x, int y) const { return contains(x, y) ? const_cast<Grid*>(this)->at(x, y) : Pixel{}; }

    /// Seven taps, a step apart.
    Grid blurred(int stepX, int stepY, Store store) const {
        static constexpr double aWeights[] = {1, 0.60653065971263, 0.13533528323661, 0.0111};
        Grid result(nWidth_, nHeight_, nDepth_);
        for (int y = 0; y < nHeight_; ++y) {
            for (int x = 0; x < nWidth_ * nDepth_; ++x) {
                for (int k = -3; k <= 3; ++k) {
                    Pixel const tap = get(x + k * stepX, y + k * stepY);
                    for (std::size_t c = 0; c < 4; ++c) {
                        result.at(x, y)[c] += aWeights[std::abs(k)] * tap[c];
                    }
                }
                for (double& value : result.at(x, y)) {
                    value = store(value);
                }
            }
        }
        return result;
    }

private:
    int nWidth_;
    int nHeight_;
    int nDepth_;
    std::vector<Pixel> aCells_;
};

/// What goes into the grid for a colour: its intensity comes first.
inline Pixel valueOf(Pixel const& c, bool bLab) {
    if (!bLab) {
        return Pixel{0.39 * c[0] + 0.50 * c[1] + 0.11 * c[2], 0, 0, 0};
    }
    Pixel const lab = toLab(c);
    return {lab[0], (lab[1] + 1) / 2, (lab[2] + 1) / 2, 0};
}

/// The number of cells along an axis.
inline int cells(double length) { return static_cast<int>(length) + 9; }

inline Grid scattered(Texels const& input, PositionExtentInPixelSpace const& region, Settings const& s,
                      Store store) {
    int const width = region.extent().width();
    int const height = region.extent().height();
    Grid grid(cells((width - 1) / s.sigmaX), cells((height - 1) / s.sigmaY), cells(1.0F / s.rangeSigma));
    auto const inverseX = float(1 / s.sigmaX);
    auto const inverseY = float(1 / s.sigmaY);
    for (int y = 0; y < height; ++y) {
        for (int x = 0; x < width; ++x) {
            Pixel const value =
                valueOf(input.at(region.position().x() + x, region.position().y() + y), s.colorize);
            // Which cell a value falls into that lies in the middle between two is a matter of float steps.
            int const gridX = int(std::floor(float(x) * inverseX + 0.5F)) + 4;
            int const gridY = int(std::floor(float(y) * inverseY + 0.5F)) + 4;
            int const gridZ = int(std::floor(float(value[0]) * (1.0F / s.rangeSigma) + 0.5F)) + 4;
            if (!grid.contains(gridX + grid.width() * gridZ, gridY)) {
                continue;
            }
            Pixel& cell = grid.at(gridX + grid.width() * gridZ, gridY);
            for (std::size_t c = 0; c < 3; ++c) {
                double const intensity = s.colorize ? value[c] : value[0];
                cell[c] = store(cell[c] + double(float(intensity / 1000)));
            }
            cell[3] = store(cell[3] + double(0.001F));
        }
    }
    return grid;
}

inline Grid divided(Grid grid, Store store) {
    for (int y = 0; y < grid.height(); ++y) {
        for (int x = 0; x < grid.width() * grid.depth(); ++x) {
            Pixel& cell = grid.at(x, y);
            for (std::size_t c = 0; c < 3; ++c) {
                cell[c] = cell[3] == 0 ? 0 : store(cell[c] / cell[3]);
            }
        }
    }
    return grid;
}

/// The filter over a region of an input that is transparent black outside.
inline Texels filtered(Texels const& input, PositionExtentInPixelSpace const& region, Settings const& s,
                       Store store = exactly) {
    Grid grid = scattered(input, region, s, store);
    // The sums of the last blur stay in the program, which divides them.
    grid = divided(grid.blurred(1, 0, store).blurred(0, 1, store).blurred(grid.width(), 0, exactly), store);
    Texels result(region, input.pixelExtent());
    result.fill([&](int px, int py) {
        Pixel const pixel = input.at(px, py);
        double const x = (px - region.position().x()) / s.sigmaX + 4;
        double const y = (py - region.position().y()) / s.sigmaY + 4;
        double const z = valueOf(pixel, s.colorize)[0] / double(s.rangeSigma) + 4;
        Pixel value{};
        for (int corner = 0; corner < 8; ++corner) {
            double weight = 1;
            int cell[3];
            double const at[3] = {x, y, z};
            for (int axis = 0; axis < 3; ++axis) {
                double const low = std::floor(at[axis]);
                bool const bUpper = (corner >> axis & 1) != 0;
                weight *= bUpper ? at[axis] - low : 1 - (at[axis] - low);
                cell[axis] = int(low) + (bUpper ? 1 : 0);
            }
            Pixel const sample = grid.get(cell[0] + grid.width() * cell[2], cell[1]);
            for (std::size_t c = 0; c < 3; ++c) {
                value[c] += weight * sample[c];
            }
        }
        Pixel colour = s.colorize ? fromLab(value[0], 2 * value[1] - 1, 2 * value[2] - 1)
                                  : Pixel{value[0], value[0], value[0], 0};
        colour[3] = pixel[3];
        return colour;
    });
    return result;
}

/// The largest difference of any channel, values of integer formats clamped to 0..1.
inline double largestDifference(Texels const& actual, Texels const& expected, bool bClamps) {
    if (actual.region() != expected.region()) {
        return std::numeric_limits<double>::infinity();
    }
    double dLargest = 0;
    for (int y = actual.top(); y < actual.top() + actual.height(); ++y) {
        for (int x = actual.left(); x < actual.left() + actual.width(); ++x) {
            for (std::size_t c = 0; c < 4; ++c) {
                double const wanted = expected.at(x, y)[c];
                double const clamped = bClamps ? std::min(std::max(wanted, 0.0), 1.0) : wanted;
                double const difference = std::abs(actual.at(x, y)[c] - clamped);
                // Not the maximum: that would lose what is no number.
                dLargest = difference <= dLargest ? dLargest : difference;
            }
        }
    }
    return dLargest;
}

/// A picture with edges, ramps and noise, of values from `low` to `high`; alpha from 0 to 1, or 1. `grey` is
/// how much the colours are mixed with grey.
inline Texels scene(PositionExtentInPixelSpace const& region, unsigned seed, double low = 0, double high = 1,
                    bool bOpaque = true, PixelExtentInWorldSpace const& pixelExtent = {}, double grey = 0.6) {
    std::mt19937 engine(seed);
    auto const noise = [&] { return static_cast<double>(engine()) / 4294967296.0; };
    return Texels(region, pixelExtent).fill([&](int x, int y) {
        double const ramp = (x - region.position().x() + 0.5) / region.extent().width();
        double const edge = (x + 2 * y) % 23 < 11 ? 0.25 : 0.7;
        double const middle = (edge + ramp + 1 - edge * ramp) / 3;
        auto const channel = [&](double base) {
            double const mixed = grey * middle + (1 - grey) * base;
            return low + (high - low) * (0.8 * mixed + 0.2 * noise());
        };
        Pixel pixel{channel(edge), channel(ramp), channel(1 - edge * ramp), 1};
        if (!bOpaque) {
            pixel[3] = (x + y) % 5 == 0 ? 0 : noise();
        }
        return pixel;
    });
}

inline Texels vividScene(PositionExtentInPixelSpace const& region, unsigned seed) {
    return scene(region, seed, 0, 1, true, {}, 0);
}

} // namespace ORVO::Test::gpuBilateral
