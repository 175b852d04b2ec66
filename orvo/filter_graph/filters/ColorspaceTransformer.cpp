#include "orvo/filter_graph/filters/ColorspaceTransformer.h"

#include "orvo/colour_engine/ProfileCodes.h"
#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/Connect.h"
#include "orvo/filter_graph/internal/ImageFlowFilter.h"
#include "orvo/filter_graph/internal/ParameterSet.h"
#include "orvo/image_flow/ImageFlowLibrary.h"
#include "orvo/image_flow/colour/CVantle.h"
#include "orvo/image_flow/colour/TrelException.h"
#include "orvo/image_flow/filters/VantleFilterCPU.h"
#include "orvo/image_flow/filters/VantleFilterGPU.h"

#include <string>

namespace ORVO::FilterGraph::Internal::Filters {

namespace {

constexpr char const* pNodeName = "VantleFilterGPU";

Filter::OwnedParameter profileParameter(char const* name, char const* description) {
    DataFlow::Parameter<int> const source(static_cast<int>(ColourEngine::PROFILE_WIDE_GAMUT), name,
                                          description);
    return Filter::OwnedParameter(ParameterSet::createParameterFromDataFlow(&source));
}

template <class Node>
std::shared_ptr<Filter> makeTransformNode(TargetPlatform target) {
    IFilter::Identifier const identifier(pNodeName, ImageFlow::Library::imageFlowNamespace(),
                                         ImageFlow::Library::norvaneVendor(), 1);
    return {ORVO_NEW ImageFlowFilter<Node>(identifier, target), ORVODeleter<Filter>()};
}

/// A handle of the engine's, dropped at the end of the scope.
template <class Handle, VantleResult (*drop)(Handle*)>
class EngineHandle {
public:
    EngineHandle() = default;
    EngineHandle(EngineHandle const&) = delete;
    EngineHandle& operator=(EngineHandle const&) = delete;
    ~EngineHandle() {
        try {
            if (pHandle_ != nullptr) {
                drop(pHandle_);
            }
        } catch (...) { // The engine is gone, and the object with it.
            pHandle_ = nullptr;
        }
    }

    Handle* get() const noexcept { return pHandle_; }
    Handle** out() noexcept { return &pHandle_; }

private:
    Handle* pHandle_ = nullptr;
};

using Profile = EngineHandle<VantleProfile, &CVantle::UnReferenceProfile>;
using Transform = EngineHandle<VantleTransform, &CVantle::UnReferenceTransform>;

/// Runs an operation of the engine; an engine that refuses it or is not there is told of in these words.
template <class Operation>
void requireOfEngine(Operation const& operation, char const* pMessage) {
    bool bDone = false;
    try {
        bDone = operation() == 0;
    } catch (TrelException const&) {
        bDone = false;
    }
    ORVO_CHECK(bDone, pMessage);
}

VantleTransform* makeOptimizedTransform(std::uint32_t sourceCode, std::uint32_t destinationCode) {
    Transform transform;
    {
        Profile source;
        Profile destination;
        requireOfEngine([&] { return CVantle::ProfileFromCode(source.out(), sourceCode); },
                        "Cannot make src profile from code");
        requireOfEngine([&] { return CVantle::ProfileFromCode(destination.out(), destinationCode); },
                        "Cannot make dst profile from code");
        requireOfEngine(
            [&] {
                return CVantle::MakeColorTransform(transform.out(), source.get(), destination.get(),
                                                   VANTLE_INTENT_PERCEPTUAL, 0);
            },
            "Cannot transform from source colorspace to destination colorspace");
    }
    VantleTransform* pOptimized = nullptr;
    requireOfEngine([&] { return CVantle::OptimizeTransform(&pOptimized, transform.get(), 0); },
                    "Cannot optimize the colorspace transformation");
    return pOptimized;
}

/// Whether a filter of the compiler's graph is a colour transform, unfolded or not.
bool isTransform(IFilter const& filter) {
    return dynamic_cast<ColorspaceTransformer const*>(&filter) != nullptr ||
           filter.identifier().name() == pNodeName;
}

/// The channels of the sink that a filter's result comes to; 0 if another transform is on the way, or if the
/// sink does not say.
std::size_t channelsOfSink(Filter const& filter) {
    Output const* pOutput = filter.output();
    while (pOutput != nullptr && pOutput->numConsumerInputs() > 0) {
        Input const* const pInput = *pOutput->consumerInputs();
        if (pInput->nChannel() != 0) {
            return pInput->nChannel();
        }
        IFilter const& consumer = *pInput->parentFilter();
        pOutput = isTransform(consumer) ? nullptr : consumer.output();
    }
    return 0;
}

/// The channels of the source behind a filter's first input; 0 if it does not say.
std::size_t channelsOfSource(Filter const& filter) {
    IFilter const* pFilter = &filter;
    while (pFilter != nullptr && pFilter->nChannel() == 0) {
        InputConstIterator const iInput = pFilter->inputs();
        pFilter = iInput.isValid() ? (*iInput)->producerFilter() : nullptr;
    }
    return pFilter != nullptr ? pFilter->nChannel() : 0;
}

/// Whether a node of the CPU would write a picture of one or two channels in this filter's place.
bool hasGreyResult(Filter const& filter) {
    std::size_t const nSink = channelsOfSink(filter);
    std::size_t const nChannels = nSink != 0 ? nSink : channelsOfSource(filter);
    return nChannels == 1 || nChannels == 2;
}

} // namespace

ColorspaceTransformer::ColorspaceTransformer() {
    setIdentifier(
        Identifier("ColorspaceTransformer", "com.norvane.orvo", ImageFlow::Library::norvaneVendor(), 1));
    addInput("src", 0);
    OwnedParameter source = profileParameter("srcProfile", "Code of the colour space of the input");
    source->addMetadataItem(ORVO_NEW MetadataItem<int>("minValue", 0));
    source->addMetadataItem(ORVO_NEW MetadataItem<int>("maxValue", -1));
    OwnedParameter destination = profileParameter("dstProfile", "Code of the colour space of the result");
    for (char const* name : {"minValue", "maxValue"}) {
        destination->addMetadataItem(source->metadataItem(name)->clone());
    }
    addParameter(std::move(source));
    addParameter(std::move(destination));
}

ColorspaceTransformer::ColorspaceTransformer(ColorspaceTransformer const& other)
    : Filter(other), vantleNode_g(other.vantleNode_g), vantleNode_c(other.vantleNode_c) {}

ColorspaceTransformer::~ColorspaceTransformer() = default;

std::shared_ptr<Filter> ColorspaceTransformer::clone() {
    return {ORVO_NEW ColorspaceTransformer(*this), ORVODeleter<Filter>()};
}

Filter* ColorspaceTransformer::node() const noexcept {
    return vantleNode_c ? vantleNode_c.get() : vantleNode_g.get();
}

std::shared_ptr<ParameterForwarder> ColorspaceTransformer::unFold(OptimizationOptions const& options) {
    vantleNode_g.reset();
    vantleNode_c.reset();
    if (options.processingMode() != OptimizationOptions::CPU_PROCESSING) {
        vantleNode_g = makeTransformNode<VantleFilterGPU>(ORVO_TARGET_GL);
        vantleNode_g->initialize();
        ORVO_CHECK(vantleNode_g->isInitialized());
        vantleNode_g->parameter("Grey Result")->as<bool>().setValue(hasGreyResult(*this));
    } else {
        vantleNode_c = makeTransformNode<VantleFilterCPU>(ORVO_TARGET_CPU);
        vantleNode_c->initialize();
        ORVO_CHECK(vantleNode_c->isInitialized());
    }
    auto spForwarder = std::make_shared<Forwarder>(*this);
    spForwarder->addForward(*this, *node());

    auto* const producer = dynamic_cast<Filter*>((*inputs())->producerFilter());
    ORVO_CHECK(producer != nullptr, "producer");
    Internal::Connect(producer, node());
    Output* const pOutput = output();
    ORVO_ENFORCE(pOutput, "output");
    // Each connection takes the consumer away from this filter.
    while (pOutput->numConsumerInputs() > 0) {
        Internal::Connect(node(), *pOutput->consumerInputs());
    }
    DisconnectAll(this);
    return spForwarder;
}

std::shared_ptr<IFilterExecutable>
ColorspaceTransformer::buildFilterExecutable(TargetPlatform /*target*/,
                                             GraphExecutable& /*graphExecutable*/) {
    return {};
}

ColorspaceTransformer::Forwarder::Forwarder(ColorspaceTransformer& transformer)
    : pTransformer_(&transformer) {}

ColorspaceTransformer::Forwarder::~Forwarder() = default;

void ColorspaceTransformer::Forwarder::forwardStuff() {
    ColorspaceTransformer const& transformer = *pTransformer_;
    // First, so that no transform is made that nobody takes.
    Filter* const pNode = transformer.node();
    ORVO_ENFORCE(pNode, "vantleNode_g");
    FilterGraph::ParameterBase* const pParameter = pNode->parameter("Transform");
    ORVO_ENFORCE(pParameter);
    auto const code = [&](char const* name) {
        return static_cast<std::uint32_t>(transformer.parameter(name)->as<int>().value());
    };
    VantleTransform* const pTransform = makeOptimizedTransform(code("srcProfile"), code("dstProfile"));
    pParameter->as<void*>().setValue(pTransform);
    forwardChildren();
}

} // namespace ORVO::FilterGraph::Internal::Filters
