#pragma once

#include "orvo/core/Export.h"

#include <memory>

namespace ORVO::FilterGraph {

class IFilter;
class IInputAdapter;
class Input;
class IOutputAdapter;

// Wiring of the client graph. Each connection feeds the output of `src` into one input; an input that is
// connected already is taken from its old producer first. The two-filter forms need a destination with
// exactly one input.
//
// All of them throw an `Exception` if the channel counts of both sides are fixed and differ (the input is
// then left unconnected), and an `InternalException` "Enforce pSourceFilter != NULL" or "Enforce pInput !=
// NULL" for a null pointer. The two-filter forms throw an `Exception` if the destination has no or several
// inputs, and an `InternalException` "Enforce pDestinationFilter != NULL" if it is null.
//
// Cycles are not found here but by the processor. Connections are plain pointers: the host keeps the filters
// alive.
//
// Threads: as `IFilter`.

/// Connects `src` to the one input of `dst`.
ORVO_API void Connect(std::shared_ptr<IFilter> const& src, std::shared_ptr<IFilter> const& dst);

/// Connects `src` to an input.
ORVO_API void Connect(std::shared_ptr<IFilter> const& src, Input* dst);

/// Connects `src` to the sink of the graph.
ORVO_API void Connect(std::shared_ptr<IFilter> const& src, std::shared_ptr<IOutputAdapter> const& dst);

/// Connects a source of the graph to an input.
ORVO_API void Connect(std::shared_ptr<IInputAdapter> src, Input* dst);

/// Connects a source of the graph to the one input of `dst`.
ORVO_API void Connect(std::shared_ptr<IInputAdapter> src, std::shared_ptr<IFilter> dst);

/// Connects a source of the graph straight to its sink.
ORVO_API void Connect(std::shared_ptr<IInputAdapter> src, std::shared_ptr<IOutputAdapter> dst);

/// Takes the input from its producer.
/// @throws InternalException "Enforce pInput != NULL" for null, "Enforce pProducer != NULL" if it is not
/// connected.
ORVO_API void Disconnect(Input* pInput);

/// Disconnects every input of the filter that has a producer, in their order. What the filter feeds stays
/// connected.
/// @throws InternalException "Enforce pFilter != NULL" for null.
ORVO_API void DisconnectAll(IFilter* pFilter);

} // namespace ORVO::FilterGraph
