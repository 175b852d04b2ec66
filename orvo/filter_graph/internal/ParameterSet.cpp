#include "orvo/filter_graph/internal/ParameterSet.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/filter_graph/impl/Parameter.h"

#include <algorithm>
#include <cstring>
#include <type_traits>

namespace ORVO::FilterGraph::Internal {

namespace {

template <class T>
void addBounds(DataFlow::ParameterBase const& source, ParameterBase& parameter) {
    // There are no bounds of pointers.
    if constexpr (!std::is_same_v<T, void*>) {
        if (auto const* pInterval = dynamic_cast<DataFlow::IntervalParameter<T> const*>(&source)) {
            parameter.addMetadataItem(ORVO_NEW MetadataItem<T>("Minimum Value", pInterval->lowerBound()));
            parameter.addMetadataItem(ORVO_NEW MetadataItem<T>("Maximum Value", pInterval->upperBound()));
        }
    }
}

/// The client's form of a parameter of type T; null if it is of another type.
template <class T>
ParameterBase* createAs(DataFlow::ParameterBase const& source) {
    if (std::strcmp(source.datatype().name(), typeid(T).name()) != 0)
        return nullptr;
    auto const* pSource = dynamic_cast<DataFlow::Parameter<T> const*>(&source);
    if (!pSource)
        return nullptr;

    std::unique_ptr<ParameterBase, ORVODeleter<ParameterBase>> parameter(
        ORVO_NEW Parameter<T>(source.name(), pSource->value(), false));
    if (!source.name().empty())
        parameter->addMetadataItem(ORVO_NEW MetadataItem<std::string>("Name", source.name()));
    if (!source.description().empty())
        parameter->addMetadataItem(ORVO_NEW MetadataItem<std::string>("Description", source.description()));
    parameter->addMetadataItem(ORVO_NEW MetadataItem<T>("Default Value", pSource->defaultValue()));
    addBounds<T>(source, *parameter);
    return parameter.release();
}

/// The first of the types that the source is of decides.
template <class... T>
ParameterBase* createAsFirstOf(DataFlow::ParameterBase const& source) {
    ParameterBase* pParameter = nullptr;
    static_cast<void>(((pParameter = createAs<T>(source)) || ...));
    return pParameter;
}

} // namespace

ParameterSet::NameEquals::NameEquals(std::string const& name) : name_(name) {}

ParameterSet::NameEquals::~NameEquals() = default;

bool ParameterSet::NameEquals::operator()(ParameterBase const* pParameter) const {
    return pParameter && pParameter->name() == name_;
}

ParameterSet::ParameterSet() = default;

ParameterSet::~ParameterSet() = default;

void ParameterSet::insert(ParameterBase* pParameter) {
    ORVO_ENFORCE(pParameter);
    ParameterBase const* iParameter = parameter(pParameter->name());
    ORVO_CHECK(!iParameter);
    aParameters_.push_back(pParameter);
}

void ParameterSet::remove(ParameterBase* pParameter) {
    auto const iParameter = std::find(aParameters_.begin(), aParameters_.end(), pParameter);
    if (iParameter != aParameters_.end())
        aParameters_.erase(iParameter);
}

ParameterBase* ParameterSet::parameter(std::string const& name) {
    auto const iParameter = std::find_if(aParameters_.begin(), aParameters_.end(), NameEquals(name));
    return iParameter != aParameters_.end() ? *iParameter : nullptr;
}

ParameterBase const* ParameterSet::parameter(std::string const& name) const {
    return const_cast<ParameterSet*>(this)->parameter(name);
}

ParameterIterator ParameterSet::parameters() { return {aParameters_.begin(), aParameters_.end()}; }

ParameterConstIterator ParameterSet::parameters() const { return {aParameters_.begin(), aParameters_.end()}; }

void ParameterSet::clear() { aParameters_.clear(); }

void ParameterSet::deleteAll() {
    for (ParameterBase* pParameter : aParameters_)
        trackedDelete(pParameter);
    aParameters_.clear();
}

ParameterBase* ParameterSet::createParameterFromDataFlow(DataFlow::ParameterBase const* source) {
    ORVO_ENFORCE(source);
    return createAsFirstOf<int, float, bool, int2, bool2, float2, int3, bool3, float3, int4, bool4, float4,
                           float2x2, float3x3, float4x4, std::vector<float>, void*>(*source);
}

std::shared_ptr<DataFlow::ParameterBase> const& ParameterSet::getDataPtr(ParameterBase& parameter) {
    return parameter.spData_;
}

std::shared_ptr<DataFlow::ParameterBase> const& ParameterSet::getDataPtr(ParameterBase const& parameter) {
    return parameter.spData_;
}

void ParameterSet::setValue(ParameterBase& parameter, DataFlow::ParameterBase const& source) {
    parameter.spData_->setValueFromParameter(source);
}

} // namespace ORVO::FilterGraph::Internal
