/// Queries that count samples: only one may be active in a context. Not a public header.
#pragma once

namespace ORVO {

/// The active query of the target GL_SAMPLES_PASSED; 0 if there is none. Threads: any with a context current.
unsigned currentSampleQuery() noexcept;

/// Whether a query of samples is active. The targets that later versions have share one place with
/// GL_SAMPLES_PASSED. Threads: any with a context current.
bool isAnySampleQueryActive() noexcept;

} // namespace ORVO
