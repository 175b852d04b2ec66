#pragma once

// The bounded parameters that are built into the library.

#include "orvo/core/Export.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/ParameterInstances.h"

/// For the header that knows the type T.
#define ORVO_DECLARE_INTERVAL_PARAMETER(T)                                                                   \
    extern template class ORVO_API ORVO::DataFlow::IntervalParameter<T>;
/// For one source of the same layer, after that declaration.
#define ORVO_DEFINE_INTERVAL_PARAMETER(T) template class ORVO::DataFlow::IntervalParameter<T>;

ORVO_FOR_EACH_INTERVAL_PARAMETER_TYPE(ORVO_DECLARE_INTERVAL_PARAMETER)
