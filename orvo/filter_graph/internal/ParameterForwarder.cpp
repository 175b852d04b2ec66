#include "orvo/filter_graph/internal/ParameterForwarder.h"

#include "orvo/core/Check.h"
#include "orvo/data_flow/nodes/Node.h"
#include "orvo/data_flow/parameters/ParameterBase.h"
#include "orvo/filter_graph/impl/ParameterBase.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/ParameterSet.h"

namespace ORVO::FilterGraph::Internal {

ParameterForwarder::ParameterForwarder() = default;

ParameterForwarder::~ParameterForwarder() = default;

void ParameterForwarder::forwardStuff() {
    for (Pair const& pair : aForwards_)
        doForward(pair);
}

void ParameterForwarder::returnStuff() {}

void ParameterForwarder::clear() {
    aForwards_.clear();
    aChildren_.clear();
}

void ParameterForwarder::addForward(FilterGraph::ParameterBase const& source,
                                    FilterGraph::ParameterBase& destination) {
    addForwardPtr(ParameterSet::getDataPtr(source).get(), ParameterSet::getDataPtr(destination).get());
}

void ParameterForwarder::addForward(Filter const& source, DataFlow::Node& destination) {
    for (std::size_t i = 0; i < destination.numberOfParameters(); ++i) {
        DataFlow::ParameterBase* pDestination = destination.parameter(i);
        if (FilterGraph::ParameterBase const* pSource = source.parameter(pDestination->name()))
            addForwardPtr(ParameterSet::getDataPtr(*pSource).get(), pDestination);
    }
}

void ParameterForwarder::addForward(Filter const& source, Filter& destination) {
    for (FilterGraph::ParameterBase* pDestination : destination.parameters())
        if (FilterGraph::ParameterBase const* pSource = source.parameter(pDestination->name()))
            addForward(*pSource, *pDestination);
}

void ParameterForwarder::addForwardPtr(DataFlow::ParameterBase const* source,
                                       DataFlow::ParameterBase* destination) {
    ORVO_ENFORCE(source);
    ORVO_ENFORCE(destination);
    aForwards_.emplace_back(source, destination);
}

void ParameterForwarder::addChild(std::shared_ptr<ParameterForwarder> spChild) {
    ORVO_ENFORCE(spChild.get());
    aChildren_.push_back(std::move(spChild));
}

void ParameterForwarder::forwardByPtr(std::shared_ptr<ParameterForwarder> const& spForwarder) {
    ORVO_ENFORCE(spForwarder.get());
    spForwarder->forwardStuff();
}

void ParameterForwarder::doForward(Pair const& pair) { pair.second->setValueFromParameter(*pair.first); }

void ParameterForwarder::forwardChildren() {
    for (std::shared_ptr<ParameterForwarder> const& spChild : aChildren_)
        forwardByPtr(spChild);
}

} // namespace ORVO::FilterGraph::Internal
