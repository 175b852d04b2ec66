#pragma once

#include <chrono>
#include <cstddef>
#include <string>

namespace example {

/// A bar on standard error, where that is a terminal, with the time that is left.
class Progress {
public:
    explicit Progress(std::size_t total);
    Progress(Progress const&) = delete;
    Progress& operator=(Progress const&) = delete;
    /// Takes the bar away.
    ~Progress();

    void advance(std::size_t amount);

    /// "[#####...............]  25 %, 1:07 left": the time as if the rest were done as fast.
    [[nodiscard]] static std::string line(std::size_t done, std::size_t total, double seconds);

private:
    using Clock = std::chrono::steady_clock;

    std::size_t total_;
    std::size_t done_ = 0;
    bool terminal_;
    Clock::time_point start_ = Clock::now();
    Clock::time_point shown_ = start_;
};

} // namespace example
