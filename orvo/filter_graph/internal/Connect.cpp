#include "orvo/filter_graph/internal/Connect.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/Exception.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/internal/Filter.h"

#include <sstream>

namespace ORVO::FilterGraph::Internal {

namespace {

void checkChannels(Filter const& source, Input const& input) {
    std::size_t const nSource = source.nChannel();
    std::size_t const nInput = input.nChannel();
    if (nSource == 0 || nInput == 0 || nSource == nInput)
        return;
    std::ostringstream message;
    message << "Channel mismatch between the output image and input image of the filters being connected: "
            << source.identifier().name() << " node having" << nSource << " channels is connected to "
            << input.parentFilter()->identifier().name() << " node having " << nInput << " channels\n";
    throw Exception(message.str());
}

} // namespace

void Connect(Filter* pSourceFilter, Input* pInput) {
    ORVO_ENFORCE(pSourceFilter);
    ORVO_ENFORCE(pInput);
    if (pInput->producerFilter())
        Disconnect(pInput);
    checkChannels(*pSourceFilter, *pInput);

    auto* pParentOfDest = dynamic_cast<Filter*>(pInput->parentFilter());
    ORVO_ENFORCE(pParentOfDest);
    Output* output = pSourceFilter->output();
    ORVO_ENFORCE(output);
    output->insertConsumer(pInput);
    pInput->setProducer(pSourceFilter);
    pSourceFilter->updateTimeStamp();
    pParentOfDest->updateTimeStamp();
}

void Connect(Filter* pSourceFilter, Filter* pDestinationFilter) {
    ORVO_ENFORCE(pSourceFilter);
    ORVO_ENFORCE(pDestinationFilter);
    if (pDestinationFilter->getNumberOfInputs() != 1) {
        std::ostringstream message;
        message << "Filter has to have exactly one input to be used in Connect(Filter *, Filter *) API: "
                << pDestinationFilter->identifier();
        throw Exception(message.str());
    }
    Connect(pSourceFilter, *pDestinationFilter->inputs());
}

} // namespace ORVO::FilterGraph::Internal
