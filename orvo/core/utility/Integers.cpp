#include "orvo/core/utility/Integers.h"

#include <limits>

#include "orvo/core/Check.h"

namespace ORVO {

unsigned nextPowerOfTwo(unsigned value) {
    ORVO_CHECK_PARAMETER(value <= 0x80000000u);
    unsigned result = 1;
    while (result < value)
        result <<= 1;
    return result;
}

int incrementToBoundary(int value, int boundary) {
    ORVO_CHECK_PARAMETER(boundary > 0);
    long long const rest = value % boundary;
    long long const result = rest > 0 ? value - rest + boundary : value - rest;
    ORVO_CHECK_PARAMETER(result <= std::numeric_limits<int>::max(),
                         "Result of incrementToBoundary is out of range");
    return static_cast<int>(result);
}

} // namespace ORVO
