#include "orvo/filter_graph/filters/StandardFilters.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/filters/Bilateral.h"
#include "orvo/filter_graph/filters/ColorspaceTransformer.h"
#include "orvo/filter_graph/filters/Premultiply.h"
#include "orvo/filter_graph/filters/Scale15_1_to_16.h"
#include "orvo/filter_graph/filters/Scale16_to_15_1.h"
#include "orvo/filter_graph/filters/Unpremultiply.h"
#include "orvo/filter_graph/impl/FilterEquality.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/internal/ImageFlowFilter.h"
#include "orvo/filter_graph/internal/ImageFlowFilterWrapper.h"
#include "orvo/image_flow/ImageFlowLibrary.h"
#include "orvo/image_flow/filters/ConvertFromSIMDOptimized.h"
#include "orvo/image_flow/filters/ConvertToSIMDOptimized.h"
#include "orvo/image_flow/filters/MirelToneMappingGPU.h"

#include <algorithm>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace ORVO::FilterGraph {

namespace {

IFilter::Identifier imageFlowIdentifier(char const* name) {
    return {name, ImageFlow::Library::imageFlowNamespace(), ImageFlow::Library::norvaneVendor(), 1};
}

// A result of fewer than three channels would be widened to R, G, B, which has no place for an alpha.
constexpr int resultChannels(int nChannels) { return nChannels == 2 ? 4 : nChannels; }

/// "scaleUp<n>channel".
template <int nChannels>
class ScaleUp : public Internal::Filters::Scale15_1_to_16 {
public:
    static std::string nodeName() { return "scaleUp" + std::to_string(nChannels) + "channel"; }
    ScaleUp() : Scale15_1_to_16(nodeName().c_str(), resultChannels(nChannels)) {}
};

/// "scaleDown<n>channel".
template <int nChannels>
class ScaleDown : public Internal::Filters::Scale16_to_15_1 {
public:
    static std::string nodeName() { return "scaleDown" + std::to_string(nChannels) + "channel"; }
    ScaleDown() : Scale16_to_15_1(nodeName().c_str(), resultChannels(nChannels)) {}
};

template <class Node>
std::shared_ptr<IFilter> shaderFilter(std::string const& name) {
    return std::make_shared<Internal::ImageFlowFilter<Node>>(
        IFilter::Identifier(name, "ORVO", ImageFlow::Library::norvaneVendor(), 1), ORVO_TARGET_GL);
}

template <int... nChannels>
void appendScalingFilters(std::vector<std::shared_ptr<IFilter>>& prototypes,
                          std::integer_sequence<int, nChannels...>) {
    (prototypes.push_back(shaderFilter<ScaleUp<nChannels>>(ScaleUp<nChannels>::nodeName())), ...);
    (prototypes.push_back(shaderFilter<ScaleDown<nChannels>>(ScaleDown<nChannels>::nodeName())), ...);
}

std::vector<std::shared_ptr<IFilter>> standardPrototypes() {
    std::vector<std::shared_ptr<IFilter>> prototypes;
    prototypes.push_back(std::make_shared<Internal::Bilateral>());
    prototypes.push_back(std::make_shared<Internal::Filters::ColorspaceTransformer>());
    for (char const* name : {"FastBilateralFilter", "SimpleBilateralCPU", "RGBToLABCPU", "LABToRGBCPU",
                             "VantleFilterCPU", "MirelCheckerBoardGPU", "MirelGamutComposite"})
        prototypes.push_back(std::make_shared<Internal::ImageFlowFilterWrapper>(imageFlowIdentifier(name)));
    prototypes.push_back(std::make_shared<Internal::ImageFlowFilter<ConvertToSIMDOptimized>>(
        imageFlowIdentifier("ConvertToSIMDOptimized"), ORVO_TARGET_CPU));
    prototypes.push_back(std::make_shared<Internal::ImageFlowFilter<ConvertFromSIMDOptimized>>(
        imageFlowIdentifier("ConvertFromSIMDOptimized"), ORVO_TARGET_CPU));
    prototypes.push_back(std::make_shared<Internal::ImageFlowFilter<MirelToneMappingGPU>>(
        imageFlowIdentifier("MirelToneMappingGPU"), ORVO_TARGET_GL));
    prototypes.push_back(shaderFilter<Internal::Filters::Premultiply>("premultiply"));
    prototypes.push_back(shaderFilter<Internal::Filters::Unpremultiply>("unpremultiply"));
    appendScalingFilters(prototypes, std::integer_sequence<int, 1, 2, 3, 4>());
    return prototypes;
}

} // namespace

void insertStandardFilters() {
    FilterFactory& factory = *FilterFactory::Instance();
    std::vector<IFilter::Identifier> inserted;
    try {
        for (auto const& prototype : standardPrototypes()) {
            inserted.reserve(inserted.size() + 1);
            inserted.push_back(factory.insert(*prototype));
        }
    } catch (...) {
        for (auto const& identifier : inserted)
            factory.remove(identifier);
        throw;
    }
}

void removeStandardFilters() {
    FilterFactory& factory = *FilterFactory::Instance();
    auto const prototypes = standardPrototypes();
    // The first that is missing is refused, as by the factory itself, before anything is removed.
    for (auto const& prototype : prototypes) {
        auto const registered = static_cast<FilterFactory const&>(factory).prototypes();
        bool const isRegistered =
            std::any_of(registered.begin(), registered.end(), FilterEquality(prototype->identifier()));
        ORVO_CHECK(isRegistered, "iter != aFilters_.end()");
    }
    for (auto const& prototype : prototypes)
        factory.remove(prototype->identifier());
}

} // namespace ORVO::FilterGraph
