#pragma once

// For layers that build the connectors of a payload type into the library once.

#include "orvo/core/Export.h"
#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/data_flow/data/ConstDataPointer.h"

/// Declares or defines the connectors for data of type T: `linkage` is `extern` with the key `class
/// ORVO_API`, or empty with `class`.
#define ORVO_CONNECTOR_INSTANCES(linkage, key, T)                                                            \
    linkage template key ORVO::DataFlow::ConstDataPointer<T>;                                                \
    linkage template key ORVO::DataFlow::InputTemplate<T>;                                                   \
    linkage template key ORVO::DataFlow::OutputTemplate<T>;                                                  \
    linkage template key ORVO::DataFlow::ConstInput<T>;                                                      \
    linkage template key ORVO::DataFlow::Input<T>;                                                           \
    linkage template key ORVO::DataFlow::ConstOutput<T>;                                                     \
    linkage template key ORVO::DataFlow::Output<T>;

/// For the header that knows the type T.
#define ORVO_DECLARE_CONNECTORS(T) ORVO_CONNECTOR_INSTANCES(extern, class ORVO_API, T)
/// For one source of the same layer, after that declaration.
#define ORVO_DEFINE_CONNECTORS(T) ORVO_CONNECTOR_INSTANCES(, class, T)
