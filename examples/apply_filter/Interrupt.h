#pragma once

namespace example {

/// While one lives, Ctrl-C and a polite kill are noted instead of ending the program. One may live inside the
/// life of another.
class Interrupt {
public:
    Interrupt();
    Interrupt(Interrupt const&) = delete;
    Interrupt& operator=(Interrupt const&) = delete;
    ~Interrupt();

    [[nodiscard]] static bool requested();

private:
    using Handler = void (*)(int);

    Handler onInterrupt_;
    Handler onTerminate_;
};

} // namespace example
