#include "orvo/filter_graph/impl/Input.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"

namespace ORVO::FilterGraph {

Input::Input(IFilter* pParentFilter, std::string const& name, std::size_t nChannel)
    : nChannel_(nChannel), name_(name), parentFilter_(pParentFilter) {
    ORVO_CHECK(pParentFilter != nullptr, "Need valid pParentFilter.");
}

Input::~Input() = default;

Input* Input::clone(IFilter* pNewParent) const { return ORVO_NEW Input(pNewParent, name_, nChannel_); }

} // namespace ORVO::FilterGraph
