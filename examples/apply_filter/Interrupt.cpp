#include "apply_filter/Interrupt.h"

#include <csignal>

namespace example {

namespace {

volatile std::sig_atomic_t interrupted = 0;

extern "C" void noteInterrupt(int /*signal*/) { interrupted = 1; }

} // namespace

Interrupt::Interrupt() {
    std::signal(SIGINT, noteInterrupt);
    std::signal(SIGTERM, noteInterrupt);
}

Interrupt::~Interrupt() {
    std::signal(SIGINT, SIG_DFL);
    std::signal(SIGTERM, SIG_DFL);
}

bool Interrupt::requested() { return interrupted != 0; }

} // namespace example
