#pragma once

#include "orvo/colour_engine/internal/ApplyKernels.h"
#include "orvo/colour_engine/internal/ApplyPixels.h"
#include "orvo/colour_engine/internal/ChannelCurve.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <mutex>
#include <vector>

namespace ORVO::ColourEngine::Internal {

/// A table for each channel, made at the first asking; equal ones are kept once: one table for all channels
/// stays in the caches where three would not.
///
/// Threads: any, at once.
template <typename Entry>
class ChannelTables {
public:
    /// `make` makes the table of a channel.
    template <typename Make>
    std::array<Entry const*, 3> const& get(Make const& make) const {
        std::call_once(oOnce_, [&] {
            for (std::size_t i = 0; i < aTables_.size(); ++i) {
                aStorage_[i] = make(i);
                aTables_[i] = aStorage_[i].data();
                for (std::size_t j = 0; j < i; ++j) {
                    if (aStorage_[j] == aStorage_[i]) {
                        std::vector<Entry>().swap(aStorage_[i]);
                        aTables_[i] = aTables_[j];
                        break;
                    }
                }
            }
        });
        return aTables_;
    }

private:
    mutable std::once_flag oOnce_;
    mutable std::array<std::vector<Entry>, 3> aStorage_;
    mutable std::array<Entry const*, 3> aTables_{};
};

/// Curves from samples to numbers, one entry for each value that a sample can have.
///
/// Threads: any, at once.
class InputTables {
public:
    explicit InputTables(std::array<ChannelCurve, 3> aCurves);

    /// For samples of 16 bits or of 8. Samples above white are white's.
    std::array<float const*, 3> const& get(bool bWords) const;

    /// Looks `n` samples of a plane up.
    static void read(float* pValues, ApplyPixels::Plane const& plane, bool bWords, std::size_t row,
                     std::size_t column, float const* pTable, std::size_t n);

private:
    std::array<ChannelCurve, 3> aCurves_;
    ChannelTables<float> oBytes_;
    ChannelTables<float> oWords_;
};

/// Steps of a scale of light, with fractions between them.
struct StepBlock {
    alignas(64) std::int32_t aSteps_[nBlockPixels];
    alignas(64) float aFractions_[nBlockPixels];
};

/// Curves from numbers to samples: tables over the bits of the numbers (`LightScale`).
///
/// Threads: any, at once.
class OutputTables {
public:
    explicit OutputTables(std::array<ChannelCurve, 3> aCurves);

    /// Over ByteScale, samples.
    std::array<std::uint8_t const*, 3> const& bytes() const;
    /// Over WordScale, results times 32768, with one entry more than there are steps.
    std::array<float const*, 3> const& words() const;

    /// Writes `n` samples of 8 bits into a plane.
    static void write(ApplyPixels::Plane const& plane, std::size_t row, std::size_t column,
                      StepBlock const& block, std::uint8_t const* pTable, std::size_t n);
    /// Writes `n` samples of 16 bits into a plane. The block is filled up to a multiple of four.
    static void write(ApplyPixels::Plane const& plane, std::size_t row, std::size_t column,
                      StepBlock const& block, float const* pTable, std::size_t n);

private:
    std::array<ChannelCurve, 3> aCurves_;
    ChannelTables<std::uint8_t> oBytes_;
    ChannelTables<float> oWords_;
};

/// A curve over WordScale, times `white`, as OutputTables has them for samples of 16 bits.
std::vector<float> tableOverWordScale(ChannelCurve const& curve, double white);

/// What such a table says for the block, whose length is rounded up to a multiple of four.
void interpolate(float* pValues, StepBlock const& block, float const* pTable, std::size_t n);

/// Writes values in 0..1 as samples of 8 or 16 bits; what lies outside is clamped. `n` as above.
void writeSamples(ApplyPixels::Plane const& plane, bool bWords, std::size_t row, std::size_t column,
                  float const* pValues, std::size_t n);

} // namespace ORVO::ColourEngine::Internal
