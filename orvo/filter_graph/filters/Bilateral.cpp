#include "orvo/filter_graph/filters/Bilateral.h"

#include "orvo/core/Check.h"
#include "orvo/core/math/Float.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/Connect.h"
#include "orvo/filter_graph/internal/ImageFlowFilter.h"
#include "orvo/filter_graph/internal/ParameterForwarder.h"
#include "orvo/filter_graph/internal/ParameterSet.h"
#include "orvo/image_flow/filters/FastBilateralFilterCPUNode.h"
#include "orvo/image_flow/filters/FastBilateralFilterGPU.h"
#include "orvo/image_flow/filters/SimpleBilateralFilterCPU.h"

namespace ORVO::FilterGraph::Internal {

namespace {

Filter::OwnedParameter publicParameter(DataFlow::ParameterBase const& source) {
    return Filter::OwnedParameter(ParameterSet::createParameterFromDataFlow(&source));
}

template <class Node>
std::shared_ptr<Filter> makeNodeFilter(TargetPlatform target) {
    IFilter::Identifier const identifier("Bilateral Node", "Aux", "Norvane Works", 1);
    return {ORVO_NEW ImageFlowFilter<Node>(identifier, target), ORVODeleter<Filter>()};
}

/// One of the library's filters, of any version that the host has registered.
std::shared_ptr<IFilter> makeCompanion(char const* name) {
    return FilterFactory::Instance()->create(IFilter::Identifier(name, "ORVO", "Norvane"));
}

} // namespace

Bilateral::Bilateral() : bPremultiply_(true), bUseSimpleCPU_(false) {
    setIdentifier(Identifier("FastBilateralBlur", "Motion Loft", "Norvane Works", 1));
    addInput("src", 0);
    addParameter(publicParameter(
        DataFlow::IntervalParameter<float2>(float2(10.0F, 10.0F), float2(0.1F, 0.1F), float2(100.0F, 100.0F),
                                            "spatialSigma", "Reach of the smoothing in x and y, in pixels")));
    addParameter(publicParameter(DataFlow::IntervalParameter<float>(
        0.15F, 0.01F, 1.0F, "rangeSigma", "Difference of intensity that counts as an edge")));
    addParameter(publicParameter(
        DataFlow::Parameter<bool>(false, "colorize", "Keep the colours; without it the result is grey")));
}

Bilateral::Bilateral(Bilateral const& other) : Filter(other), bPremultiply_(true), bUseSimpleCPU_(false) {}

Bilateral::~Bilateral() = default;

std::shared_ptr<Filter> Bilateral::clone() { return {ORVO_NEW Bilateral(*this), ORVODeleter<Filter>()}; }

std::shared_ptr<Filter> Bilateral::makeBilateralNode(OptimizationOptions const& options) const {
    if (options.processingMode() == OptimizationOptions::FULL_OPTIMIZATION) {
        return makeNodeFilter<FastBilateralFilterGPU>(ORVO_TARGET_GL);
    }
    return bUseSimpleCPU_ ? makeNodeFilter<SimpleBilateralFilterCPU>(ORVO_TARGET_CPU)
                          : makeNodeFilter<FastBilateralFilterCPUNode>(ORVO_TARGET_CPU);
}

std::shared_ptr<ParameterForwarder> Bilateral::unFold(OptimizationOptions const& options) {
    auto* const myProducer = dynamic_cast<Filter*>((*inputs())->producerFilter());
    ORVO_CHECK(myProducer != nullptr, "myProducer");
    auto spForwarder = std::make_shared<ParameterForwarder>();

    std::shared_ptr<Filter> const bilateralNode = makeBilateralNode(options);
    ORVO_CHECK(bilateralNode != nullptr, "bilateralNode");
    bilateralNode->initialize();
    ORVO_CHECK(bilateralNode->isInitialized());
    spForwarder->addForward(*this, *bilateralNode);

    Filter* first = bilateralNode.get();
    Filter* last = bilateralNode.get();
    std::shared_ptr<IFilter> spPremultiply;
    std::shared_ptr<IFilter> spUnpremultiply;
    // The node of the CPU weighs colours with alpha by itself.
    if (bPremultiply_ && options.processingMode() == OptimizationOptions::FULL_OPTIMIZATION) {
        spPremultiply = makeCompanion("premultiply");
        spUnpremultiply = makeCompanion("unpremultiply");
        auto* const premul = dynamic_cast<Filter*>(spPremultiply.get());
        ORVO_CHECK(premul != nullptr, "premul");
        auto* const unpremul = dynamic_cast<Filter*>(spUnpremultiply.get());
        ORVO_CHECK(unpremul != nullptr, "unpremul");
        Internal::Connect(premul, bilateralNode.get());
        Internal::Connect(bilateralNode.get(), unpremul);
        first = premul;
        last = unpremul;
    }

    Output* const pOutput = output();
    ORVO_ENFORCE(pOutput, "output");
    Internal::Connect(myProducer, first);
    // Each connection takes the consumer away from this filter.
    while (pOutput->numConsumerInputs() > 0) {
        Internal::Connect(last, *pOutput->consumerInputs());
    }
    DisconnectAll(this);
    spBilateralNode_ = bilateralNode;
    spPremultiply_ = spPremultiply;
    spUnpremultiply_ = spUnpremultiply;
    return spForwarder;
}

bool Bilateral::canBuildFilterExecutable(TargetPlatform /*target*/) const { return false; }

std::shared_ptr<IFilterExecutable> Bilateral::buildFilterExecutable(TargetPlatform /*target*/,
                                                                    GraphExecutable& /*graphExecutable*/) {
    return {};
}

} // namespace ORVO::FilterGraph::Internal
