#include "orvo/filter_graph/impl/Parameter.h"

#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/parameters/Parameter.h"

#include <memory>

namespace ORVO::FilterGraph {

namespace {

/// The parameter behind the client's one, whose type was checked.
template <class T>
DataFlow::Parameter<T>& dataOf(std::shared_ptr<DataFlow::ParameterBase> const& spData) {
    return static_cast<DataFlow::Parameter<T>&>(*spData);
}

} // namespace

template <class T>
Parameter<T>::Parameter(std::string const& name, T const& value, bool autoPin)
    : ParameterBase(name, DataItemType<T>::value, autoPin) {
    setData(std::make_shared<DataFlow::Parameter<T>>(value, name));
}

template <class T>
Parameter<T>::~Parameter() = default;

template <class T>
T const& Parameter<T>::value() const {
    checkType(DataItemType<T>::value);
    return dataOf<T>(getData()).value();
}

template <class T>
void Parameter<T>::setValue(T const& value) {
    checkType(DataItemType<T>::value);
    dataOf<T>(getData()).setValue(value);
}

template <class T>
Parameter<T>* Parameter<T>::clone() const {
    std::unique_ptr<Parameter<T>, ORVODeleter<Parameter<T>>> copy(
        ORVO_NEW Parameter<T>(name(), value(), isAutoPin()));
    cloneMetadata(copy.get());
    return copy.release();
}

#define ORVO_INSTANTIATE_PARAMETER(T) template class Parameter<T>;
ORVO_FOR_EACH_DATA_ITEM_TYPE(ORVO_INSTANTIATE_PARAMETER)
#undef ORVO_INSTANTIATE_PARAMETER

} // namespace ORVO::FilterGraph
