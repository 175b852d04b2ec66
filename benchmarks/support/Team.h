#pragma once

#include <barrier>
#include <cstddef>
#include <functional>
#include <thread>
#include <vector>

namespace ORVO::Benchmarks {

/// Runs a job on parts of a range, part 0 on the calling thread and the others on threads that wait between
/// jobs.
class Team {
public:
    explicit Team(int nThreads) : nThreads_(nThreads), oStart_(nThreads), oEnd_(nThreads) {
        for (int i = 1; i < nThreads; ++i) {
            aThreads_.emplace_back([this, i] { work(i); });
        }
    }

    ~Team() {
        job_ = nullptr;
        oStart_.arrive_and_wait();
        for (std::thread& thread : aThreads_) {
            thread.join();
        }
    }

    Team(Team const&) = delete;
    Team& operator=(Team const&) = delete;

    /// job(begin, end) for equal parts of 0 .. n.
    void run(std::size_t n, std::function<void(std::size_t, std::size_t)> const& job) {
        n_ = n;
        job_ = &job;
        oStart_.arrive_and_wait();
        runPart(0);
        oEnd_.arrive_and_wait();
    }

private:
    void work(int iPart) {
        for (;;) {
            oStart_.arrive_and_wait();
            if (!job_) {
                return;
            }
            runPart(iPart);
            oEnd_.arrive_and_wait();
        }
    }

    void runPart(int iPart) {
        std::size_t const nParts = static_cast<std::size_t>(nThreads_);
        std::size_t const nPart = static_cast<std::size_t>(iPart);
        (*job_)(n_ * nPart / nParts, n_ * (nPart + 1) / nParts);
    }

    int nThreads_;
    std::size_t n_ = 0;
    std::function<void(std::size_t, std::size_t)> const* job_ = nullptr;
    std::barrier<> oStart_;
    std::barrier<> oEnd_;
    std::vector<std::thread> aThreads_;
};

} // namespace ORVO::Benchmarks
