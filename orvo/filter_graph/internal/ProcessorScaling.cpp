// The scaling filters that a processor puts where 16-bit images of the 0..32768 scale meet a graph on OpenGL,
// which reads 16-bit textures on the scale 0..65535.
#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/internal/Connect.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/InputAdapter.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/filter_graph/internal/Processor.h"

namespace ORVO::FilterGraph::Internal {

namespace {

constexpr int kChannelType15_1 = 2;

bool isOn15_1Scale(ImageDescriptor const& descriptor) {
    return static_cast<int>(descriptor.format().channelType) == kChannelType15_1;
}

/// A scaling filter from the factory; `prefix` is "scaleUp" or "scaleDown".
std::shared_ptr<Filter> createScalingFilter(std::string const& prefix, std::size_t nChannel) {
    ORVO_CHECK(
        nChannel >= 1 && nChannel <= 4,
        "Not implemented: Only 1/2/3/4 channel 15+1 to 16 bit scaling nodes are available in the filter "
        "factory\n");
    IFilter::Identifier const identifier(prefix + std::to_string(nChannel) + "channel", "ORVO", "Norvane", 1);
    auto spFilter = std::dynamic_pointer_cast<Filter>(FilterFactory::Instance()->create(identifier));
    ORVO_ENFORCE(spFilter.get(), "spFilter");
    return spFilter;
}

} // namespace

void Processor::insertGPU15_1ScalingNodes() {
    // The scaling filters join the map as their own keys, and are no input adapters when this loop meets
    // them.
    for (auto const& [pOriginal, spClone] : clones_) {
        ORVO_ENFORCE(pOriginal->output(), "output");
        insertInputScaling(pOriginal, spClone.get());
    }
    insertOutputScaling();
}

void Processor::insertInputScaling(Filter* pOriginal, Filter* pClone) {
    auto const* const pAdapter = dynamic_cast<InputAdapter*>(pOriginal);
    if (!pAdapter || !isOn15_1Scale(pAdapter->getImageDescriptor())) {
        return;
    }
    std::shared_ptr<Filter> const spScaling =
        createScalingFilter("scaleUp", pAdapter->getImageDescriptor().format().nChannel);
    clones_[spScaling.get()] = spScaling;
    for (InputIterator iInput = pOriginal->output()->consumerInputs(); iInput.isValid(); ++iInput) {
        Input* const pConsumerInput = cloneOfConsumer((*iInput)->parentFilter())->input((*iInput)->name());
        Disconnect(pConsumerInput);
        Connect(pClone, spScaling.get());
        Connect(spScaling.get(), pConsumerInput);
    }
}

void Processor::insertOutputScaling() {
    ImageDescriptor const& descriptor = pOriginalGraph_->getImageDescriptor();
    if (!isOn15_1Scale(descriptor)) {
        return;
    }
    std::shared_ptr<Filter> const spScaling = createScalingFilter("scaleDown", descriptor.format().nChannel);
    Input* const pOutputInput = clones_[pOriginalGraph_]->input("InputImage");
    auto* const pProducer = dynamic_cast<Filter*>(pOutputInput->producerFilter());
    Disconnect(pOutputInput);
    Connect(pProducer, spScaling.get());
    Connect(spScaling.get(), pOutputInput);
    clones_[spScaling.get()] = spScaling;
}

} // namespace ORVO::FilterGraph::Internal
