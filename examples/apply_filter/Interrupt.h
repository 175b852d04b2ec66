#pragma once

#include <array>

namespace example {

/// While one lives, Ctrl-C, a polite kill and the end of the terminal are noted instead of ending the
/// program, but for those that it was started to ignore. One may live inside the life of another.
class Interrupt {
public:
    Interrupt();
    Interrupt(Interrupt const&) = delete;
    Interrupt& operator=(Interrupt const&) = delete;
    ~Interrupt();

    [[nodiscard]] static bool requested();

private:
    using Handler = void (*)(int);

    std::array<Handler, 3> former_;
};

} // namespace example
