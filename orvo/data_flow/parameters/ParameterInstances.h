#pragma once

// The parameters that are built into the library. Parameters of other types, such as the enumerations of the
// image layers, are built where their type is known.

#include "orvo/core/Export.h"
#include "orvo/core/math/Bool.h"
#include "orvo/core/math/Float.h"
#include "orvo/core/math/Int.h"
#include "orvo/core/math/Matrix.h"
#include "orvo/core/spaces/PositionExtentInWorldSpace.h"
#include "orvo/data_flow/parameters/Parameter.h"

#include <string>
#include <vector>

/// Applies a macro of one argument to each of those types that `IntervalParameter` exists for too.
#define ORVO_FOR_EACH_INTERVAL_PARAMETER_TYPE(apply)                                                         \
    apply(bool) apply(int) apply(unsigned int) apply(long) apply(unsigned long) apply(unsigned long long)    \
        apply(float) apply(ORVO::bool2) apply(ORVO::bool3) apply(ORVO::bool4) apply(ORVO::int2)              \
            apply(ORVO::int3) apply(ORVO::int4) apply(ORVO::float2) apply(ORVO::float3) apply(ORVO::float4)  \
                apply(ORVO::float2x2) apply(ORVO::float3x3) apply(ORVO::float4x4) apply(std::vector<float>)

/// Applies a macro of one argument to each of those types.
#define ORVO_FOR_EACH_PARAMETER_TYPE(apply)                                                                  \
    ORVO_FOR_EACH_INTERVAL_PARAMETER_TYPE(apply)                                                             \
    apply(void*) apply(std::vector<ORVO::float2>) apply(std::vector<ORVO::float3>)                           \
        apply(std::vector<ORVO::float4>) apply(std::string) apply(ORVO::PositionExtentInWorldSpace)

/// Declares or defines the instances that a parameter of type T needs: `linkage` is `extern` with the
/// key `class ORVO_API`, or empty with `class`. The declaration alone carries the visibility, which value
/// types without one of their own would otherwise take away.
#define ORVO_PARAMETER_INSTANCES(linkage, key, T)                                                            \
    linkage template key ORVO::DataFlow::ConstDataPointer<T>;                                                \
    linkage template key ORVO::DataFlow::InputTemplate<T>;                                                   \
    linkage template key ORVO::DataFlow::ConstInput<T>;                                                      \
    linkage template key ORVO::DataFlow::ParameterInput<T>;                                                  \
    linkage template key ORVO::DataFlow::Parameter<T>;

/// For the header that knows the type T.
#define ORVO_DECLARE_PARAMETER(T) ORVO_PARAMETER_INSTANCES(extern, class ORVO_API, T)
/// For one source of the same layer, after that declaration.
#define ORVO_DEFINE_PARAMETER(T) ORVO_PARAMETER_INSTANCES(, class, T)

ORVO_FOR_EACH_PARAMETER_TYPE(ORVO_DECLARE_PARAMETER)
