#pragma once

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <ctime>
#include <vector>

namespace ORVO::Benchmarks {

/// Wall-clock seconds that the work takes: for works that are measured by turns, so that whatever else the
/// machine does falls on all of them alike.
template <class Work>
double secondsOf(Work const& work) {
    auto const start = std::chrono::steady_clock::now();
    work();
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

/// Seconds that the work takes on all of the process's threads together: what else the machine does hardly
/// counts. A software driver draws on threads of the process.
template <class Work>
double processorSecondsOf(Work const& work) {
    std::clock_t const start = std::clock();
    work();
    return static_cast<double>(std::clock() - start) / CLOCKS_PER_SEC;
}

/// The upper median; there is at least one value.
inline double medianOf(std::vector<double> aValues) {
    auto const middle = aValues.begin() + static_cast<std::ptrdiff_t>(aValues.size() / 2);
    std::nth_element(aValues.begin(), middle, aValues.end());
    return *middle;
}

} // namespace ORVO::Benchmarks
