#include "orvo/filter_graph/internal/Filter.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/MetadataItemBase.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/impl/ParameterBase.h"
#include "orvo/filter_graph/internal/InputSet.h"
#include "orvo/filter_graph/internal/ParameterSet.h"

#include <algorithm>
#include <utility>

namespace ORVO::FilterGraph::Internal {

/// The clones of what another filter consists of, collected before any of them replaces anything.
struct Filter::Parts {
    std::unique_ptr<ParameterSet> parameterSet = std::make_unique<ParameterSet>();
    std::vector<OwnedParameter> parameters;
    std::unique_ptr<InputSet> inputSet = std::make_unique<InputSet>();
    std::vector<OwnedInput> inputs;
    OwnedOutput output;
    std::vector<OwnedMetadata> metadata;
};

Filter::Filter() { Filter::lazyInitialize(); }

Filter::Filter(Filter const& other) : IFilter(other), IExecutableBuilder(other) { Filter::assign(other); }

Filter& Filter::operator=(Filter const& other) {
    if (this != &other)
        assign(other);
    return *this;
}

Filter::~Filter() {
    ownedParameters_.clear();
    pParameterSet_.reset();
    releaseInputs();
}

void Filter::releaseInputs() noexcept {
    for (OwnedInput const& input : ownedInputs_) {
        try {
            if (input->producerFilter())
                Disconnect(input.get());
        } catch (...) {
            // A filter dies whatever its neighbours say.
        }
    }
    ownedInputs_.clear();
    pInputSet_.reset();
}

void Filter::lazyInitialize() {
    pParameterSet_ = std::make_unique<ParameterSet>();
    pInputSet_ = std::make_unique<InputSet>();
    pOutput_.reset(ORVO_NEW Output);
}

void Filter::finishLazyInitialization() { initialized = true; }

void Filter::initialize() const {
    if (initialized)
        return;
    // Filters are never constant objects: constant is only the view of a prototype that the factory hands
    // out.
    auto* pSelf = const_cast<Filter*>(this);
    Sizes const sizesBefore = {ownedInputs_.size(), ownedParameters_.size(), ownedMetadata_.size()};
    try {
        pSelf->finishLazyInitialization();
    } catch (...) {
        // Half a set-up would stand in the way of the next try.
        pSelf->shrinkTo(sizesBefore);
        throw;
    }
    pSelf->initialized = true;
}

void Filter::shrinkTo(Sizes const& sizes) noexcept {
    for (; ownedInputs_.size() > sizes.nInputs; ownedInputs_.pop_back())
        if (pInputSet_)
            pInputSet_->remove(ownedInputs_.back().get());
    for (; ownedParameters_.size() > sizes.nParameters; ownedParameters_.pop_back())
        if (pParameterSet_)
            pParameterSet_->remove(ownedParameters_.back().get());
    if (ownedMetadata_.size() > sizes.nMetadata) {
        ownedMetadata_.resize(sizes.nMetadata);
        metadata_.resize(sizes.nMetadata);
    }
}

void Filter::assign(Filter const& other) {
    Parts parts;
    cloneParameters(other, parts);
    cloneConnectors(other, parts);
    for (MetadataItemBase const* pItem : other.metadata())
        parts.metadata.push_back(OwnedMetadata(pItem->clone()));
    std::vector<MetadataItemBase const*> metadataView;
    for (OwnedMetadata const& item : parts.metadata)
        metadataView.push_back(item.get());
    setIdentifier(other.identifier());

    // From here on nothing throws.
    color = 0;
    pParameterSet_ = std::move(parts.parameterSet);
    ownedParameters_ = std::move(parts.parameters);
    int const ownTimeStamp = timeStamp;
    releaseInputs();
    timeStamp = ownTimeStamp; // which the lost connections moved
    pInputSet_ = std::move(parts.inputSet);
    ownedInputs_ = std::move(parts.inputs);
    pOutput_ = std::move(parts.output);
    metadata_ = std::move(metadataView);
    ownedMetadata_ = std::move(parts.metadata);
    clonedTimeStamp = other.timeStamp;
    initialized = other.initialized;
}

void Filter::cloneParameters(Filter const& other, Parts& parts) {
    for (ParameterBase* pParameter : other.parameters()) {
        parts.parameters.push_back(OwnedParameter(pParameter->clone()));
        parts.parameterSet->insert(parts.parameters.back().get());
    }
}

void Filter::cloneConnectors(Filter const& other, Parts& parts) {
    for (Input* pInput : other.inputs()) {
        parts.inputs.push_back(OwnedInput(pInput->clone(this)));
        parts.inputSet->insert(parts.inputs.back().get());
    }
    ORVO_ENFORCE(other.pOutput_);
    parts.output.reset(other.pOutput_->clone(this));
    for (auto iInput = parts.inputSet->inputs(); iInput.isValid(); ++iInput)
        ORVO_CHECK((*iInput)->producerFilter() == nullptr, "(*iInput)->producerFilter() == 0");
    auto const iInput = parts.output->consumerInputs();
    ORVO_CHECK(!*iInput);
}

void Filter::setIdentifier(Identifier const& identifier) {
    Identifier copy(identifier);
    identifier_ = std::move(copy);
}

Filter::Identifier const& Filter::identifier() const { return identifier_; }

std::size_t Filter::nChannel() const {
    ORVO_ENFORCE(pOutput_);
    return pOutput_->nChannel();
}

InputConstIterator Filter::inputs() const { return inputSet().inputs(); }

InputIterator Filter::inputs() { return inputSet().inputs(); }

Input const* Filter::input(std::string const& name) const { return inputSet().input(name); }

Input* Filter::input(std::string const& name) { return inputSet().input(name); }

std::size_t Filter::getNumberOfInputs() const { return inputSet().size(); }

Output const* Filter::output(std::string const&) const { return pOutput_.get(); }

Output* Filter::output(std::string const&) { return pOutput_.get(); }

Output const* Filter::output() const { return pOutput_.get(); }

Output* Filter::output() { return pOutput_.get(); }

ParameterConstIterator Filter::parameters() const { return parameterSet().parameters(); }

ParameterIterator Filter::parameters() { return parameterSet().parameters(); }

ParameterBase const* Filter::parameter(std::string const& name) const {
    return parameterSet().parameter(name);
}

ParameterBase* Filter::parameter(std::string const& name) { return parameterSet().parameter(name); }

std::size_t Filter::getNumberOfParameters() const { return parameterSet().size(); }

MetadataConstIterator Filter::metadata() const { return {metadata_.begin(), metadata_.end()}; }

MetadataItemBase const* Filter::metadataItem(std::string const& name) const {
    auto const item = std::find_if(metadata_.begin(), metadata_.end(),
                                   [&name](MetadataItemBase const* pItem) { return pItem->name() == name; });
    return item != metadata_.end() ? *item : nullptr;
}

std::size_t Filter::getNumberOfMetadataItems() const { return metadata_.size(); }

void Filter::addMetadataItem(MetadataItemBase const* pItem) {
    ORVO_ENFORCE(pItem);
    OwnedMetadata item(pItem);
    ownedMetadata_.reserve(ownedMetadata_.size() + 1);
    metadata_.push_back(pItem);
    ownedMetadata_.push_back(std::move(item));
}

void Filter::cloneMetadata(Filter* pTarget) const {
    ORVO_ENFORCE(pTarget);
    // By number, since the target may be this filter.
    for (std::size_t i = 0, n = metadata_.size(); i < n; ++i)
        pTarget->addMetadataItem(metadata_[i]->clone());
}

bool Filter::canBuildFilterExecutable(TargetPlatform target) const {
    return target == ORVO_TARGET_GL || target == ORVO_TARGET_CPU;
}

std::shared_ptr<ParameterForwarder> Filter::unFold(OptimizationOptions const&) { return {}; }

void Filter::updateNumChannelsOnInput(Input* pInput, std::size_t nChannel) {
    ORVO_ENFORCE(pInput);
    pInput->nChannel_ = nChannel;
}

void Filter::addInput(std::string const& name, std::size_t nChannel) {
    Input const* existing = input(name);
    ORVO_CHECK(existing == nullptr, "existing==0");
    OwnedInput added(ORVO_NEW Input(this, name, nChannel));
    ownedInputs_.reserve(ownedInputs_.size() + 1);
    inputSet().insert(added.get());
    ownedInputs_.push_back(std::move(added));
}

void Filter::addParameter(ParameterBase* pParameter) { parameterSet().insert(pParameter); }

void Filter::addParameter(OwnedParameter parameter) {
    ownedParameters_.reserve(ownedParameters_.size() + 1);
    parameterSet().insert(parameter.get());
    ownedParameters_.push_back(std::move(parameter));
}

void Filter::clearParameterSet() {
    for (OwnedParameter& parameter : ownedParameters_)
        parameter.release();
    ownedParameters_.clear();
    pParameterSet_.reset();
}

void Filter::deleteAllParameters() {
    if (!pParameterSet_)
        return;
    // The set deletes each parameter, so that those that are owned must be let go first.
    for (OwnedParameter& parameter : ownedParameters_)
        parameter.release();
    ownedParameters_.clear();
    pParameterSet_->deleteAll();
    pParameterSet_.reset();
}

InputSet& Filter::inputSet() const {
    ORVO_ENFORCE(pInputSet_);
    return *pInputSet_;
}

ParameterSet& Filter::parameterSet() const {
    ORVO_ENFORCE(pParameterSet_);
    return *pParameterSet_;
}

} // namespace ORVO::FilterGraph::Internal
