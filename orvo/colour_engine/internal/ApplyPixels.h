#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

namespace ORVO {
struct _t_Vantle_PackingSpec;
}

namespace ORVO::ColourEngine::Internal {

/// A checked packing record, by colour channels: a grey source gives its one plane to all three, a grey
/// destination takes the green one alone.
struct ApplyPixels {
    struct Plane {
        unsigned char* pFirst_;
        std::ptrdiff_t nRowBytes_;
        std::ptrdiff_t nColumnBytes_;

        unsigned char* at(std::size_t row, std::size_t column) const {
            return pFirst_ + static_cast<std::ptrdiff_t>(row) * nRowBytes_ +
                   static_cast<std::ptrdiff_t>(column) * nColumnBytes_;
        }
    };

    /// By channel; a channel outside [iFirst_, iEnd_) has no plane of its own.
    std::array<Plane, 3> aPlanes_;
    std::size_t iFirst_; ///< the first channel to be written
    std::size_t iEnd_;   ///< the channel after the last one to be written
    bool bWords_;        ///< samples of 16 bits, white 32768; else of 8 bits, white 255

    /// False, with the pixels as they were, for a record whose space, channels or bytes are none of the
    /// stated ones, whose channels do not fit its space, or one of whose planes has no memory.
    bool describe(_t_Vantle_PackingSpec const& record);
};

} // namespace ORVO::ColourEngine::Internal
