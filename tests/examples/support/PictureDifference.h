#pragma once

#include "common/Picture.h"

#include <algorithm>
#include <cstddef>
#include <cstdlib>

namespace example {

/// The largest difference between two bytes of the pictures in one place; 256 if they have not the same size.
inline int largestDifference(Picture const& a, Picture const& b) {
    if (a.width != b.width || a.height != b.height || a.channels != b.channels ||
        a.pixels.size() != b.pixels.size())
        return 256;
    int largest = 0;
    for (std::size_t i = 0; i < a.pixels.size(); ++i)
        largest = std::max(largest, std::abs(int(a.pixels[i]) - int(b.pixels[i])));
    return largest;
}

} // namespace example
