#include "tests/support/Watchdog.h"

#include <dirent.h>
#include <execinfo.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <chrono>
#include <condition_variable>
#include <csignal>
#include <cstdlib>
#include <mutex>
#include <string>
#include <thread>

namespace ORVO::Test {

namespace {

/// The longest test takes half a minute, under a sanitizer and on a busy machine.
constexpr std::chrono::seconds kLimit(240);

void write(std::string const& text) {
    [[maybe_unused]] auto const written = ::write(STDERR_FILENO, text.data(), text.size());
}

void writeThisStack(int) {
    constexpr int nFrames = 48;
    void* aFrames[nFrames];
    backtrace_symbols_fd(aFrames, backtrace(aFrames, nFrames), STDERR_FILENO);
}

void writeAllStacks() {
    struct sigaction action = {};
    action.sa_handler = writeThisStack;
    sigaction(SIGUSR2, &action, nullptr);
    DIR* const pTasks = opendir("/proc/self/task");
    if (!pTasks) {
        return;
    }
    while (dirent const* const pTask = readdir(pTasks)) {
        long const thread = std::atol(pTask->d_name);
        if (thread > 0 && thread != syscall(SYS_gettid)) {
            write("---- thread " + std::to_string(thread) + "\n");
            syscall(SYS_tgkill, getpid(), thread, SIGUSR2);
            std::this_thread::sleep_for(std::chrono::milliseconds(200)); // one after the other
        }
    }
    closedir(pTasks);
}

} // namespace

struct Watchdog::State {
    void run() {
        std::unique_lock lock(oLock);
        while (!bEnd) {
            if (sTest.empty()) {
                oChange.wait(lock);
            } else if (oChange.wait_until(lock, oUntil) == std::cv_status::timeout && !sTest.empty() &&
                       std::chrono::steady_clock::now() >= oUntil) {
                write("\nA test has not come to an end: " + sTest + "\n");
                writeAllStacks();
                std::abort();
            }
        }
    }

    std::mutex oLock;
    std::condition_variable oChange;
    std::string sTest;
    std::chrono::steady_clock::time_point oUntil;
    bool bEnd = false;
    std::thread oThread;
};

Watchdog::Watchdog() : pState_(std::make_unique<State>()) {
    // The first one loads a library, which a signal handler must not.
    void* pFrame = nullptr;
    backtrace(&pFrame, 1);
    pState_->oThread = std::thread([pState = pState_.get()] { pState->run(); });
}

Watchdog::~Watchdog() {
    {
        std::lock_guard const lock(pState_->oLock);
        pState_->bEnd = true;
    }
    pState_->oChange.notify_one();
    pState_->oThread.join();
}

void Watchdog::watch(char const* suite, char const* test) {
    {
        std::lock_guard const lock(pState_->oLock);
        pState_->sTest = std::string(suite) + "." + test;
        pState_->oUntil = std::chrono::steady_clock::now() + kLimit;
    }
    pState_->oChange.notify_one();
}

void Watchdog::rest() {
    std::lock_guard const lock(pState_->oLock);
    pState_->sTest.clear();
}

} // namespace ORVO::Test
