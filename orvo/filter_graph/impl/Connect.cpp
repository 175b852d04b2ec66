#include "orvo/filter_graph/impl/Connect.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/IInputAdapter.h"
#include "orvo/filter_graph/impl/IOutputAdapter.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/internal/Connect.h"
#include "orvo/filter_graph/internal/Filter.h"

namespace ORVO::FilterGraph {

namespace {

template <class T>
Internal::Filter* asFilter(std::shared_ptr<T> const& p) {
    return dynamic_cast<Internal::Filter*>(p.get());
}

} // namespace

void Connect(std::shared_ptr<IFilter> const& src, std::shared_ptr<IFilter> const& dst) {
    Internal::Connect(asFilter(src), asFilter(dst));
}

void Connect(std::shared_ptr<IFilter> const& src, Input* dst) { Internal::Connect(asFilter(src), dst); }

void Connect(std::shared_ptr<IFilter> const& src, std::shared_ptr<IOutputAdapter> const& dst) {
    Internal::Connect(asFilter(src), asFilter(dst));
}

// The forms for adapters take their pointers by value: that is part of their signature.
// NOLINTBEGIN(performance-unnecessary-value-param)
void Connect(std::shared_ptr<IInputAdapter> src, Input* dst) { Internal::Connect(asFilter(src), dst); }

void Connect(std::shared_ptr<IInputAdapter> src, std::shared_ptr<IFilter> dst) {
    Internal::Connect(asFilter(src), asFilter(dst));
}

void Connect(std::shared_ptr<IInputAdapter> src, std::shared_ptr<IOutputAdapter> dst) {
    Internal::Connect(asFilter(src), asFilter(dst));
}

// NOLINTEND(performance-unnecessary-value-param)

void Disconnect(Input* pInput) {
    ORVO_ENFORCE(pInput);
    auto* pProducer = dynamic_cast<Internal::Filter*>(pInput->producerFilter());
    ORVO_ENFORCE(pProducer);
    auto* pParentOfDest = dynamic_cast<Internal::Filter*>(pInput->parentFilter());
    ORVO_ENFORCE(pParentOfDest);
    Output* pOutput = pProducer->output();
    ORVO_ENFORCE(pOutput);

    pOutput->removeConsumer(pInput);
    pInput->setProducer(nullptr);
    pProducer->updateTimeStamp();
    pParentOfDest->updateTimeStamp();
}

void DisconnectAll(IFilter* pFilter) {
    ORVO_ENFORCE(pFilter);
    for (Input* pInput : pFilter->inputs())
        if (pInput->producerFilter())
            Disconnect(pInput);
}

} // namespace ORVO::FilterGraph
