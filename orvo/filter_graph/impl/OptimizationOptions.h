#pragma once

#include "orvo/core/Export.h"

#include <cstdint>

namespace ORVO::FilterGraph {

/// How a frame is computed, known as `IProcessorBase::OptimizationOptions`. A processor whose last frame had
/// other options, in any field, compiles its graph anew.
///
/// Threads: a plain value; any thread, one at a time for each object.
class ORVO_API OptimizationOptions {
public:
    enum eProcessingMode : std::int32_t {
        FULL_OPTIMIZATION = 0, ///< on the GPU; needs a GL context
        CPU_PROCESSING = 1,    ///< on the CPU
    };

    /// Kept and compared; has no influence on results.
    enum eConcatenationMode : std::int32_t {
        CONCATENATION_OFF = 0,
        CONCATENATION_ON = 1,
    };

    enum eDebuggingMode : std::int32_t {
        DEBUGGING_OFF = 0,
        DEBUGGING_SINGLE_THREAD = 1, ///< row slices run on one thread, in order
    };

    enum eCachingMode : std::int32_t {
        CACHING_OFF = 0, ///< every frame computes everything
        CACHING_ON = 1,  ///< results that are still valid are kept from frame to frame
    };

    /// Precision of intermediate images in `FULL_OPTIMIZATION`, where a filter does not decide it.
    enum eIntermediateBufferPrecision : std::int32_t {
        INTERMEDIATE_PRECISION_DEFAULT = 0,
        INTERMEDIATE_PRECISION_16_BIT_FLOAT = 1,
        INTERMEDIATE_PRECISION_32_BIT_FLOAT = 2,
    };

    OptimizationOptions() = default;

    eProcessingMode processingMode() const { return processingMode_; }

    eConcatenationMode concatenationMode() const { return concatenationMode_; }

    eDebuggingMode debuggingMode() const { return debuggingMode_; }

    eCachingMode cachingMode() const { return cachingMode_; }

    eIntermediateBufferPrecision intermediateBufferPrecision() const { return intermediateBufferPrecision_; }

    void setProcessingMode(eProcessingMode mode) { processingMode_ = mode; }

    void setConcatenationMode(eConcatenationMode mode) { concatenationMode_ = mode; }

    void setDebuggingMode(eDebuggingMode mode) { debuggingMode_ = mode; }

    void setCachingMode(eCachingMode mode) { cachingMode_ = mode; }

    void setIntermediateBufferPrecision(eIntermediateBufferPrecision precision) {
        intermediateBufferPrecision_ = precision;
    }

    /// Whether all five fields are equal.
    bool equals(OptimizationOptions const& other) const;

private:
    eProcessingMode processingMode_ = FULL_OPTIMIZATION;
    eConcatenationMode concatenationMode_ = CONCATENATION_ON;
    eDebuggingMode debuggingMode_ = DEBUGGING_OFF;
    eCachingMode cachingMode_ = CACHING_ON;
    eIntermediateBufferPrecision intermediateBufferPrecision_ = INTERMEDIATE_PRECISION_DEFAULT;
};

} // namespace ORVO::FilterGraph
