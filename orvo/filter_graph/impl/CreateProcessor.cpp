#include "orvo/filter_graph/impl/CreateProcessor.h"

#include "orvo/filter_graph/impl/IAdapter.h"
#include "orvo/filter_graph/impl/IEmbeddedProcessor.h"
#include "orvo/filter_graph/impl/IOutputAdapter.h"
#include "orvo/filter_graph/impl/IProcessor.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/filter_graph/internal/Processor.h"
#include "orvo/filter_graph/internal/StandardProcessor.h"

namespace ORVO::FilterGraph {

// The pointers are taken by value: that is part of the signatures.
// NOLINTBEGIN(performance-unnecessary-value-param)
std::shared_ptr<IProcessor> createProcessor(std::shared_ptr<IOutputAdapter> output,
                                            OGL::Context const* context) {
    return std::make_shared<Internal::StandardProcessor>(dynamic_cast<Internal::OutputAdapter*>(output.get()),
                                                         context);
}

std::shared_ptr<IEmbeddedProcessor> createEmbeddedProcessor(std::shared_ptr<IOutputAdapter> output,
                                                            OGL::Context const* context) {
    return std::make_shared<Internal::Processor>(dynamic_cast<Internal::OutputAdapter*>(output.get()),
                                                 IAdapter::REGION_SYNC_EXPLICIT, context);
}

// NOLINTEND(performance-unnecessary-value-param)

} // namespace ORVO::FilterGraph
