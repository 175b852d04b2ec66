#include "orvo/filter_graph/impl/IInputAdapter.h"

#include "orvo/filter_graph/internal/InputAdapter.h"

namespace ORVO::FilterGraph {

IInputAdapter::~IInputAdapter() = default;

std::shared_ptr<IInputAdapter> createInputAdapter(IAdapter::eRegionSyncMode mode) {
    return std::make_shared<Internal::InputAdapter>(mode);
}

} // namespace ORVO::FilterGraph
