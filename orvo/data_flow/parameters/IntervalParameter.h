#pragma once

#include "orvo/core/Export.h"
#include "orvo/data_flow/parameters/Parameter.h"

#include <memory>
#include <string>
#include <utility>

namespace ORVO::DataFlow {

/// A parameter with two bounds, which tell clients what values make sense. They are never enforced: a value
/// outside is stored as it is.
///
/// Threads: as stated for `ParameterBase`.
template <typename T>
class ORVO_API IntervalParameter : public Parameter<T> {
public:
    using ParameterBase::clone;

    /// A parameter whose value and default are `value`, with an empty description.
    IntervalParameter(T const& value, T const& lower, T const& upper, std::string const& sName)
        : IntervalParameter(value, lower, upper, sName, std::string()) {}

    /// A parameter whose value and default are `value`.
    IntervalParameter(T const& value, T const& lower, T const& upper, std::string const& sName,
                      std::string const& sDescription)
        : Parameter<T>(value, sName, sDescription), lowerBound_(lower), upperBound_(upper) {}

    IntervalParameter(IntervalParameter const&) = default;
    IntervalParameter& operator=(IntervalParameter const&) = default;
    ~IntervalParameter() override = default;

    /// The constructor, for shared parameters.
    static std::shared_ptr<IntervalParameter> create(T const& value, T const& lower, T const& upper,
                                                     std::string const& sName,
                                                     std::string const& sDescription) {
        return std::make_shared<IntervalParameter>(value, lower, upper, sName, sDescription);
    }

    /// The smallest value that makes sense. The reference holds until bounds are taken over or the parameter
    /// dies.
    T const& lowerBound() const { return lowerBound_; }
    /// The largest value that makes sense, held as long.
    T const& upperBound() const { return upperBound_; }

    bool isInterval() const override { return true; }

    /// An interval parameter with the same bounds; `cloneParameter` gives a plain one.
    std::shared_ptr<ParameterBase> clone() override {
        auto const spClone =
            create(this->defaultValue(), lowerBound_, upperBound_, this->name(), this->description());
        spClone->setValue(this->value());
        return spClone;
    }

    /// Takes the value of `oSource` and, if that has bounds, its bounds too. Bounds set no flag. Throws
    /// `InternalException` "isOfType<T>()" if its type is another. If it throws, value and bounds stay.
    void setValueFromParameter(ParameterBase const& oSource) override {
        auto const* const pSource = dynamic_cast<IntervalParameter const*>(&oSource);
        if (pSource == nullptr || !oSource.isInterval()) {
            Parameter<T>::setValueFromParameter(oSource);
            return;
        }
        // Copied before the value is set, so that a copy that fails changes nothing.
        T lowerBound(pSource->lowerBound_);
        T upperBound(pSource->upperBound_);
        Parameter<T>::setValueFromParameter(oSource);
        lowerBound_ = std::move(lowerBound);
        upperBound_ = std::move(upperBound);
    }

private:
    T lowerBound_;
    T upperBound_;
};

} // namespace ORVO::DataFlow

#include "orvo/data_flow/parameters/IntervalParameterInstances.h"
