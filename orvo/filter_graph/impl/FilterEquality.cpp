#include "orvo/filter_graph/impl/FilterEquality.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/IFilter.h"

namespace ORVO::FilterGraph {

namespace {

Identifier const& identifierOf(IFilter const* pFilter) {
    ORVO_ENFORCE(pFilter);
    return pFilter->identifier();
}

} // namespace

FilterEquality::FilterEquality(Identifier const& identifier) : identifier_(identifier) {}

FilterEquality::FilterEquality(IFilter const* pFilter) : identifier_(identifierOf(pFilter)) {}

bool FilterEquality::operator()(std::shared_ptr<IFilter> const& spFilter) const {
    return spFilter && identifier_ == spFilter->identifier();
}

} // namespace ORVO::FilterGraph
