#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/utility/InstructionSet.h"

#include <cstddef>
#include <cstdint>

namespace ORVO::ColourEngine::Internal {

/// Pixels that the appliers work on at a time, one array a channel: as many as stay in the first cache.
constexpr std::size_t nBlockPixels = 128;

/// How an output curve is tabulated: by the bits of the light as a 32-bit float, so that every octave has the
/// same number of entries and the entries are closest where curves are steepest. Light is clamped to
/// 2^-nOctaves..1; the step of light l is the whole part of (bits(l) - bits(2^-nOctaves)) / 2^nDroppedBits.
template <std::int32_t nOctaves, std::int32_t nEntriesBits>
struct LightScale {
    static constexpr std::int32_t nOctaves_ = nOctaves;
    static constexpr std::int32_t nEntriesBits_ = nEntriesBits;
    /// Bits of the mantissa that choose no entry.
    static constexpr std::int32_t nDroppedBits_ = 23 - nEntriesBits;
    static constexpr std::int32_t nBias_ = (127 - nOctaves) << 23;
    /// The step of light 1; there is one entry more.
    static constexpr std::int32_t nLast_ = nOctaves << nEntriesBits;
};

/// For results of 8 bits, read at the nearest entry. 24 octaves below white lies 1/255 under a gamma of 3.
using ByteScale = LightScale<24, 10>;
/// For results of 16 bits, interpolated between entries. 48 octaves below white lies 2/32768 under a gamma
/// of 3.
using WordScale = LightScale<48, 7>;

/// Where colours lie in a cube of 33 nodes an edge, for interpolation within one of the six tetrahedra of a
/// cell: along the axes in the order of their fractions, largest first.
struct CubePlaces {
    alignas(64) std::int32_t aNode_[nBlockPixels];   ///< node of the cell's lower corner
    alignas(64) std::int32_t aSecond_[nBlockPixels]; ///< from there to the second corner, in nodes
    alignas(64) std::int32_t aThird_[nBlockPixels];  ///< from there to the third corner, in nodes
    alignas(64) float aWeights_[4][nBlockPixels];    ///< of the corners; the last one is the upper corner
};

/// The arithmetic between the tables, for n <= nBlockPixels pixels in planes. Made for one instruction set by
/// one text: results are the same, bit for bit, for all of them.
///
/// Threads: free of state; any thread.
struct ApplyKernels {
    /// The sum of the three planes, each times its factor, as a step of ByteScale.
    void (*mixToBytes)(std::int32_t* pStep, float const* const* pLight, float const* pFactors, std::size_t n);
    /// The same as a step of WordScale and the fraction in 0..1 towards the next step.
    void (*mixToWords)(std::int32_t* pStep, float* pFraction, float const* const* pLight,
                       float const* pFactors, std::size_t n);
    /// Colours 0..32 along each edge of the cube. The weights add up to `white`.
    void (*placeInCube)(CubePlaces* pPlaces, float const* const* pColour, float white, std::size_t n);
};

/// The kernels of a set that the processor supports; those of SSE2 for PLAIN.
ORVO_API ApplyKernels const& applyKernels(Core::InstructionSet eInstructionSet);

// One table a translation unit, each built with the flags of its instruction set. To be asked only where the
// processor has the instructions.
ApplyKernels const& applyKernelsSSE2();
ApplyKernels const& applyKernelsAVX2();
ApplyKernels const& applyKernelsAVX512();

} // namespace ORVO::ColourEngine::Internal
