#include "orvo/data_flow/parameters/ParameterInstances.h"

#include "orvo/data_flow/parameters/IntervalParameter.h"

ORVO_FOR_EACH_PARAMETER_TYPE(ORVO_DEFINE_PARAMETER)
ORVO_FOR_EACH_INTERVAL_PARAMETER_TYPE(ORVO_DEFINE_INTERVAL_PARAMETER)
