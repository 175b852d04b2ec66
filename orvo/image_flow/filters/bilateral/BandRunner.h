#pragma once

#include "orvo/core/Export.h"

#include <cstddef>
#include <functional>

namespace ORVO::ImageFlow::bilateral {

/// Runs the bands of one phase of a filter, each band once, in any order and possibly several at a time.
///
/// Threads: called on the thread of the filter's call; an implementation may run bands on any thread.
class ORVO_API BandRunner {
public:
    using Body = std::function<void(std::size_t first, std::size_t last)>;

    virtual ~BandRunner();

    /// Returns when all bands 0 .. nBands-1 have run, or when no further band will be run.
    /// @param nBands the number of bands. @param nUnits pixels in a band, to weigh the size of slices by.
    /// @param body runs the bands first .. last-1; it may throw.
    /// @throws what the body threw, possibly wrapped; other bands may have run or not.
    virtual void run(std::size_t nBands, std::size_t nUnits, Body const& body) = 0;
};

/// Runs all bands on the calling thread, in order.
class ORVO_API SerialBandRunner : public BandRunner {
public:
    ~SerialBandRunner() override;
    void run(std::size_t nBands, std::size_t nUnits, Body const& body) override;
};

} // namespace ORVO::ImageFlow::bilateral
