#include "orvo/colour_engine/internal/EngineFailure.h"

#include "orvo/colour_engine/internal/HandleTable.h"

#include <array>
#include <memory>

namespace ORVO::ColourEngine::Internal {

namespace {

constexpr std::array<char const*, 11> aFailureTexts = {
    "Invalid argument",     "Invalid handle",
    "Unknown profile code", "No transform between the profiles",
    "Unsupported pixels",   "Unknown shader family",
    "Invalid index",        "Missing method",
    "Missing Interface",    "Out of memory",
    "Internal failure",
};

using FailureResults = std::array<VantleResult, aFailureTexts.size()>;

FailureResults makeFailures() {
    FailureResults aResults{};
    for (std::size_t i = 0; i < aResults.size(); ++i) {
        auto const spError = std::make_shared<EngineError const>(EngineError{aFailureTexts[i], "Vantle"});
        aResults[i] =
            reinterpret_cast<VantleResult>(HandleTable::instance().addPermanent(HandleKind::Error, spError));
    }
    return aResults;
}

FailureResults const& failureResults() {
    static FailureResults const aResults = makeFailures();
    return aResults;
}

} // namespace

void prepareEngineFailures() { failureResults(); }

VantleResult engineFailure(EngineFailure eFailure) noexcept {
    return failureResults()[static_cast<std::size_t>(eFailure)];
}

} // namespace ORVO::ColourEngine::Internal
