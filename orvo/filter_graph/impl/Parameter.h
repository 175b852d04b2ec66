#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/DataItemType.h"
#include "orvo/filter_graph/impl/ParameterBase.h"

#include <string>

namespace ORVO::FilterGraph {

/// A parameter of a filter with a value of type `T`, one of the types of `DataItemType`.
///
/// Threads: as `IFilter`.
template <class T>
class ORVO_API Parameter : public ParameterBase {
public:
    /// @param value the value, and the default of the data-flow parameter behind it.
    Parameter(std::string const& name, T const& value, bool autoPin);
    ~Parameter() override;

    /// The value; the reference lives as long as the parameter.
    T const& value() const;

    /// Sets the value. Setting the value that it has already changes nothing, so that nothing is computed
    /// again.
    void setValue(T const& value);
    using ParameterBase::setValue;

    Parameter<T>* clone() const override;
};

template <class T>
Parameter<T>& ParameterBase::as() {
    checkType(DataItemType<T>::value);
    return static_cast<Parameter<T>&>(*this);
}

template <class T>
Parameter<T> const& ParameterBase::as() const {
    checkType(DataItemType<T>::value);
    return static_cast<Parameter<T> const&>(*this);
}

// The instances are made once, in the library. They name their visibility themselves, which value types
// without one of their own would otherwise take away.
#define ORVO_EXTERN_PARAMETER(T) extern template class ORVO_API Parameter<T>;
ORVO_FOR_EACH_DATA_ITEM_TYPE(ORVO_EXTERN_PARAMETER)
#undef ORVO_EXTERN_PARAMETER

} // namespace ORVO::FilterGraph
