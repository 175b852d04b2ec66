#pragma once

#include "orvo/core/Export.h"

#include <array>
#include <cstddef>
#include <memory>

namespace ORVO {
class ImageCPU;
}

namespace ORVO::ImageFlow::bilateral {

/// The picture that the fast bilateral filter works on, as planes of floats: the channels to smooth
/// (luminance, or L, a and b) and, last, alpha. Rows follow each other without padding: the direct filter
/// asks for that.
///
/// Threads: disjoint rows may be written by several threads at once.
class ORVO_API WorkingImage {
public:
    /// @param nChannels 1 or 3, alpha not counted. The planes are not cleared. @throws std::bad_alloc.
    WorkingImage(std::size_t nWidth, std::size_t nHeight, std::size_t nChannels);

    std::size_t width() const { return nWidth_; }
    std::size_t height() const { return nHeight_; }
    std::size_t channels() const { return nChannels_; }

    /// The first float of a row; `channel` channels() is alpha.
    float* row(std::size_t channel, std::size_t row) { return apPlanes_[channel] + row * nWidth_; }
    float const* row(std::size_t channel, std::size_t row) const {
        return apPlanes_[channel] + row * nWidth_;
    }

    /// Exchanges a plane with that of another image of the same size.
    void swapPlane(WorkingImage& other, std::size_t channel);

private:
    std::size_t nWidth_;
    std::size_t nHeight_;
    std::size_t nChannels_;
    std::array<std::shared_ptr<ImageCPU>, 4> aspPlanes_;
    std::array<float*, 4> apPlanes_;
};

/// A block of rows of floats with the store of images behind it, freed with its last holder. The floats are
/// not cleared.
/// @param pFirst receives the address of the first float. @throws std::bad_alloc, ParameterException for 4
/// GiB and more.
ORVO_API std::shared_ptr<ImageCPU> makeFloats(std::size_t nFloats, std::size_t nRows, float*& pFirst);

} // namespace ORVO::ImageFlow::bilateral
