#include "orvo/filter_graph/impl/OptimizationOptions.h"

namespace ORVO::FilterGraph {

bool OptimizationOptions::equals(OptimizationOptions const& other) const {
    return processingMode_ == other.processingMode_ && concatenationMode_ == other.concatenationMode_ &&
           debuggingMode_ == other.debuggingMode_ && cachingMode_ == other.cachingMode_ &&
           intermediateBufferPrecision_ == other.intermediateBufferPrecision_;
}

} // namespace ORVO::FilterGraph
