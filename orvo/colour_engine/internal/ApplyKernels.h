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

/// A table of three axes.
struct GridShape {
    float aLast_[3];          ///< the last node along each axis
    std::int32_t aStride_[3]; ///< from a node to the next one along each axis, in nodes
};

/// Where colours lie in a table. In a tetrahedron of a cell the corners follow from the lower one of the cell
/// along the axes in the order of their fractions, largest first.
struct GridPlaces {
    alignas(64) std::int32_t aNode_[nBlockPixels];   ///< node of the cell's lower corner
    alignas(64) std::int32_t aSecond_[nBlockPixels]; ///< from there to the second corner, in nodes
    alignas(64) std::int32_t aThird_[nBlockPixels];  ///< from there to the third corner, in nodes
    /// In a tetrahedron: sorted, largest first. Between all corners of a cell: along its axes.
    alignas(64) float aFractions_[3][nBlockPixels];
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
    /// One plane as a step of ByteScale, and as a step of WordScale with a fraction.
    void (*stepToBytes)(std::int32_t* pStep, float const* pLight, std::size_t n);
    void (*stepToWords)(std::int32_t* pStep, float* pFraction, float const* pLight, std::size_t n);
    /// In place: row by row three factors and what is added.
    void (*mix)(float* const* pPlanes, float const* pFactors, std::size_t n);
    /// In place, as `ConnectionStage`.
    void (*fromLab)(float* const* pPlanes, std::size_t n);
    void (*toLab)(float* const* pPlanes, std::size_t n);
    /// Values are clamped to 0..1 along each axis. Those for words round as `GridStage` says.
    void (*placeInTetrahedra)(GridPlaces* pPlaces, float const* const* pColour, GridShape const& shape,
                              std::size_t n);
    void (*placeWordsInTetrahedra)(GridPlaces* pPlaces, float const* const* pColour, GridShape const& shape,
                                   std::size_t n);
    void (*placeInCells)(GridPlaces* pPlaces, float const* const* pColour, GridShape const& shape,
                         std::size_t n);
    void (*placeWordsInCells)(GridPlaces* pPlaces, float const* const* pColour, GridShape const& shape,
                              std::size_t n);
};

/// The kernels of a set that the processor supports; those of SSE2 for PLAIN.
ORVO_API ApplyKernels const& applyKernels(Core::InstructionSet eInstructionSet);

// One table a translation unit, each built with the flags of its instruction set. To be asked only where the
// processor has the instructions.
ApplyKernels const& applyKernelsSSE2();
ApplyKernels const& applyKernelsAVX2();
ApplyKernels const& applyKernelsAVX512();

} // namespace ORVO::ColourEngine::Internal
