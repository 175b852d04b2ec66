#include "orvo/filter_graph/filters/Bilateral.h"

#include "orvo/core/Check.h"
#include "orvo/core/math/Float.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/Connect.h"
#include "orvo/filter_graph/internal/ImageFlowFilter.h"
#include "orvo/filter_graph/internal/ParameterForwarder.h"
#include "orvo/filter_graph/internal/ParameterSet.h"
#include "orvo/image_flow/filters/FastBilateralFilterCPUNode.h"
#include "orvo/image_flow/filters/SimpleBilateralFilterCPU.h"

namespace ORVO::FilterGraph::Internal {

namespace {

Filter::OwnedParameter publicParameter(DataFlow::ParameterBase const& source) {
    return Filter::OwnedParameter(ParameterSet::createParameterFromDataFlow(&source));
}

template <class Node>
std::shared_ptr<Filter> makeNodeFilter() {
    IFilter::Identifier const identifier("Bilateral Node", "Aux", "Norvane Works", 1);
    return {ORVO_NEW ImageFlowFilter<Node>(identifier, ORVO_TARGET_CPU), ORVODeleter<Filter>()};
}

} // namespace

Bilateral::Bilateral() : bUseSimpleCPU_(false) {
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

Bilateral::Bilateral(Bilateral const& other) : Filter(other), bUseSimpleCPU_(false) {}

Bilateral::~Bilateral() = default;

std::shared_ptr<Filter> Bilateral::clone() { return {ORVO_NEW Bilateral(*this), ORVODeleter<Filter>()}; }

std::shared_ptr<ParameterForwarder> Bilateral::unFold(OptimizationOptions const& /*options*/) {
    auto* const myProducer = dynamic_cast<Filter*>((*inputs())->producerFilter());
    ORVO_CHECK(myProducer != nullptr, "myProducer");
    auto spForwarder = std::make_shared<ParameterForwarder>();

    std::shared_ptr<Filter> const bilateralNode = bUseSimpleCPU_
                                                      ? makeNodeFilter<SimpleBilateralFilterCPU>()
                                                      : makeNodeFilter<FastBilateralFilterCPUNode>();
    ORVO_CHECK(bilateralNode != nullptr, "bilateralNode");
    bilateralNode->initialize();
    ORVO_CHECK(bilateralNode->isInitialized());
    spForwarder->addForward(*this, *bilateralNode);

    Internal::Connect(myProducer, bilateralNode.get());
    Output* const pOutput = output();
    ORVO_ENFORCE(pOutput, "output");
    // Each connection takes the consumer away from this filter.
    while (pOutput->numConsumerInputs() > 0) {
        Internal::Connect(bilateralNode.get(), *pOutput->consumerInputs());
    }
    DisconnectAll(this);
    spBilateralNode_ = bilateralNode;
    return spForwarder;
}

bool Bilateral::canBuildFilterExecutable(TargetPlatform /*target*/) const { return false; }

std::shared_ptr<IFilterExecutable> Bilateral::buildFilterExecutable(TargetPlatform /*target*/,
                                                                    GraphExecutable& /*graphExecutable*/) {
    return {};
}

} // namespace ORVO::FilterGraph::Internal
