#include "orvo/filter_graph/impl/IOutputAdapter.h"

#include "orvo/filter_graph/internal/OutputAdapter.h"

namespace ORVO::FilterGraph {

IOutputAdapter::~IOutputAdapter() = default;

std::shared_ptr<IOutputAdapter> createOutputAdapter(IAdapter::eRegionSyncMode mode) {
    return std::make_shared<Internal::OutputAdapter>(mode);
}

} // namespace ORVO::FilterGraph
