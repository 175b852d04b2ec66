#pragma once

#include "orvo/core/Export.h"

#include <memory>

namespace ORVO::OGL {
class Context;
}

namespace ORVO::FilterGraph {

class IEmbeddedProcessor;
class IOutputAdapter;
class IProcessor;

/// A processor for the graph that ends in `output`, an adapter of the mode `REGION_SYNC_FROM_IMAGE`, as all
/// adapters of that graph must be.
///
/// Threads: as `IProcessorBase`.
/// @param output kept as a plain pointer: the host keeps the adapter alive as long as the processor.
/// @param context the host's GL context, not owned; with null only `CPU_PROCESSING` can run.
/// @throws InternalException "Enforce pOriginalGraph_ != NULL" if `output` is null or none of the library's.
ORVO_API std::shared_ptr<IProcessor> createProcessor(std::shared_ptr<IOutputAdapter> output,
                                                     OGL::Context const* context);

/// The same for adapters of the mode `REGION_SYNC_EXPLICIT`.
ORVO_API std::shared_ptr<IEmbeddedProcessor> createEmbeddedProcessor(std::shared_ptr<IOutputAdapter> output,
                                                                     OGL::Context const* context);

} // namespace ORVO::FilterGraph
