#pragma once

#include <memory>

namespace ORVO::Test {

/// Ends the program when one test takes far longer than any should, and first says which test it is and where
/// every thread stands: a test that hangs on another machine leaves no other trace.
///
/// Threads: all from the main thread; it has one of its own.
class Watchdog {
public:
    Watchdog();
    Watchdog(Watchdog const&) = delete;
    Watchdog& operator=(Watchdog const&) = delete;
    ~Watchdog();

    /// A test begins; the time runs from now on. The name is kept.
    void watch(char const* suite, char const* test);

    /// No test runs.
    void rest();

private:
    struct State;
    std::unique_ptr<State> pState_;
};

} // namespace ORVO::Test
