// The main function of every benchmark program. Unless the command line says otherwise, each benchmark is
// repeated and the aggregates alone are reported: the table shows medians.
#include <benchmark/benchmark.h>

#include <cstring>
#include <string>
#include <vector>

namespace {

bool isGiven(std::vector<char*> const& aArguments, char const* pFlag) {
    for (char const* pArgument : aArguments) {
        if (std::strncmp(pArgument, pFlag, std::strlen(pFlag)) == 0) {
            return true;
        }
    }
    return false;
}

} // namespace

int main(int argc, char** argv) {
    std::vector<char*> aArguments(argv, argv + argc);
    std::string sRepetitions = "--benchmark_repetitions=7";
    std::string sAggregates = "--benchmark_report_aggregates_only=true";
    std::string sTime = "--benchmark_min_time=0.2";
    if (!isGiven(aArguments, "--benchmark_repetitions")) {
        aArguments.push_back(sRepetitions.data());
        aArguments.push_back(sAggregates.data());
    }
    if (!isGiven(aArguments, "--benchmark_min_time")) {
        aArguments.push_back(sTime.data());
    }
    int nArguments = static_cast<int>(aArguments.size());
    aArguments.push_back(nullptr);
    benchmark::Initialize(&nArguments, aArguments.data());
    if (benchmark::ReportUnrecognizedArguments(nArguments, aArguments.data())) {
        return 1;
    }
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
