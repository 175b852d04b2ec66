#include "orvo/image_flow/filters/bilateral/BandRunner.h"

namespace ORVO::ImageFlow::bilateral {

BandRunner::~BandRunner() = default;

SerialBandRunner::~SerialBandRunner() = default;

void SerialBandRunner::run(std::size_t nBands, std::size_t /*nUnits*/, Body const& body) {
    if (nBands > 0) {
        body(0, nBands);
    }
}

} // namespace ORVO::ImageFlow::bilateral
