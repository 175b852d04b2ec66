#include "benchmarks/support/MemoryBandwidth.h"

#include <benchmark/benchmark.h>

#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

namespace ORVO::Benchmarks {

void registerMemcpy(std::size_t bytes) {
    std::string const sName = "memcpy/" + std::to_string(bytes);
    benchmark::RegisterBenchmark(sName.c_str(), [bytes](benchmark::State& state) {
        std::vector<std::uint8_t> const aFrom(bytes, 1);
        std::vector<std::uint8_t> aTo(bytes, 2);
        for (auto _ : state) {
            std::memcpy(aTo.data(), aFrom.data(), bytes);
            benchmark::DoNotOptimize(aTo.data());
            benchmark::ClobberMemory();
        }
        state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations()) * 2 *
                                static_cast<std::int64_t>(bytes));
    })->UseRealTime();
}

} // namespace ORVO::Benchmarks
