#include "apply_filter/Interrupt.h"

#include <csignal>

namespace example {

namespace {

volatile std::sig_atomic_t interrupted = 0;

extern "C" void noteInterrupt(int /*signal*/) { interrupted = 1; }

} // namespace

Interrupt::Interrupt()
    : onInterrupt_(std::signal(SIGINT, noteInterrupt)), onTerminate_(std::signal(SIGTERM, noteInterrupt)) {}

Interrupt::~Interrupt() {
    std::signal(SIGINT, onInterrupt_);
    std::signal(SIGTERM, onTerminate_);
}

bool Interrupt::requested() { return interrupted != 0; }

} // namespace example
