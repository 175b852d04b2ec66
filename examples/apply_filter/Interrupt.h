#pragma once

namespace example {

/// While one lives, Ctrl-C and a polite kill are noted instead of ending the program.
class Interrupt {
public:
    Interrupt();
    Interrupt(Interrupt const&) = delete;
    Interrupt& operator=(Interrupt const&) = delete;
    ~Interrupt();

    [[nodiscard]] static bool requested();
};

} // namespace example
