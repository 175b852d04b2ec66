#pragma once

#include "orvo/core/Export.h"

namespace ORVO::DataFlow {

class Connector;
class InputConnector;
class OutputConnector;

/// Whether the data types of the two connectors bear the same name. The names are compared as strings, so
/// that connectors built in different modules fit.
///
/// Threads: any.
ORVO_API bool ConnectorsAreCompatible(Connector const& oFirst, Connector const& oSecond);

/// Connects the two, after taking each from the partner it had: an output feeds at most one input. Throws
/// `InternalException` "ConnectorsAreCompatible(out, in)" if their types differ, changing nothing.
///
/// Threads: the one that owns the graph, between frames.
ORVO_API void Connect(InputConnector& in, OutputConnector& out);

/// The same with the arguments exchanged.
ORVO_API void Connect(OutputConnector& out, InputConnector& in);

} // namespace ORVO::DataFlow
