#include "process_tiles/Progress.h"

#include <algorithm>
#include <cmath>
#include <cstdio>

#include <unistd.h>

namespace example {

namespace {

constexpr std::size_t barLength = 40;
constexpr std::chrono::milliseconds interval(100);

std::string timeText(double seconds) {
    auto const whole = static_cast<long>(std::ceil(std::clamp(seconds, 0.0, 3.6e6)));
    char text[32];
    if (whole < 3600)
        std::snprintf(text, sizeof text, "%ld:%02ld", whole / 60, whole % 60);
    else
        std::snprintf(text, sizeof text, "%ld:%02ld:%02ld", whole / 3600, whole / 60 % 60, whole % 60);
    return text;
}

} // namespace

Progress::Progress(std::size_t total) : total_(total), terminal_(::isatty(STDERR_FILENO) == 1) {}

Progress::~Progress() {
    if (terminal_)
        std::fputs("\r\033[K", stderr);
}

void Progress::advance(std::size_t amount) {
    done_ += amount;
    auto const now = Clock::now();
    if (!terminal_ || (now - shown_ < interval && done_ < total_))
        return;
    shown_ = now;
    double const seconds = std::chrono::duration<double>(now - start_).count();
    std::fprintf(stderr, "\r%s\033[K", line(done_, total_, seconds).c_str());
}

std::string Progress::line(std::size_t done, std::size_t total, double seconds) {
    double const share =
        total == 0 ? 1.0 : static_cast<double>(std::min(done, total)) / static_cast<double>(total);
    auto const marks = static_cast<std::size_t>(share * static_cast<double>(barLength));
    char percent[16];
    std::snprintf(percent, sizeof percent, "%3d %%", static_cast<int>(share * 100.0));
    std::string text(1, '[');
    text.append(marks, '#').append(barLength - marks, '.').append("] ").append(percent);
    if (done > 0)
        text.append(", ").append(timeText(seconds * (1.0 - share) / share)).append(" left");
    return text;
}

} // namespace example
