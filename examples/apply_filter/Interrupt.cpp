#include "apply_filter/Interrupt.h"

#include <csignal>
#include <cstddef>

namespace example {

namespace {

volatile std::sig_atomic_t interrupted = 0;

constexpr std::array<int, 3> signals = {SIGINT, SIGTERM, SIGHUP};

extern "C" void noteInterrupt(int /*signal*/) { interrupted = 1; }

} // namespace

Interrupt::Interrupt() : former_() {
    for (std::size_t i = 0; i < signals.size(); ++i) {
        former_[i] = std::signal(signals[i], noteInterrupt);
        // Started by nohup, or in the background of a script.
        if (former_[i] == SIG_IGN)
            std::signal(signals[i], SIG_IGN);
    }
}

Interrupt::~Interrupt() {
    for (std::size_t i = 0; i < signals.size(); ++i)
        std::signal(signals[i], former_[i]);
}

bool Interrupt::requested() { return interrupted != 0; }

} // namespace example
