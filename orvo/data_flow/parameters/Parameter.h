#pragma once

#include "orvo/core/Check.h"
#include "orvo/core/Export.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/data_flow/connectors/ParameterInput.h"
#include "orvo/data_flow/parameters/ParameterBase.h"
#include "orvo/data_flow/parameters/ParameterVisitorBase.h"
#include "orvo/data_flow/parameters/WriteParameterValue.h"

#include <cstddef>
#include <cstring>
#include <memory>
#include <ostream>
#include <string>
#include <type_traits>
#include <typeinfo>
#include <vector>

namespace ORVO {
class PositionExtentInWorldSpace;
}

namespace ORVO::DataFlow {

/// A parameter with a value of type T and a default.
///
/// T is copyable, compares with `==` and writes itself with `<<`. A value equal to the one that stands
/// changes nothing and sets no flag; NaN equals nothing, so setting it always counts as a change.
///
/// Threads: as stated for `ParameterBase`.
template <typename T>
class ORVO_API Parameter : public ParameterBase {
public:
    using ParameterBase::clone;

    /// A parameter whose value and default are `value`, with an empty description.
    Parameter(T const& value, std::string const& sName) : Parameter(value, sName, std::string()) {}

    /// A parameter whose value and default are `value`.
    Parameter(T const& value, std::string const& sName, std::string const& sDescription)
        : ParameterBase(sName, sDescription), value_(value), defaultValue_(value) {}

    Parameter(Parameter const&) = default;
    Parameter& operator=(Parameter const&) = default;
    ~Parameter() override = default;

    /// The constructor without a description, for a shared parameter.
    static std::shared_ptr<Parameter> create(T const& value, std::string const& sName) {
        return std::make_shared<Parameter>(value, sName);
    }
    /// The constructor with a description, for a shared parameter.
    static std::shared_ptr<Parameter> create(T const& value, std::string const& sName,
                                             std::string const& sDescription) {
        return std::make_shared<Parameter>(value, sName, sDescription);
    }

    /// A parameter whose value and default are a value-initialised T: zero, false, an empty sequence. The
    /// size is not used; set the value afterwards. Not there for `std::vector<float>` and
    /// `PositionExtentInWorldSpace`.
    template <typename U = T, std::enable_if_t<!std::is_same_v<U, std::vector<float>> &&
                                                   !std::is_same_v<U, PositionExtentInWorldSpace>,
                                               int> = 0>
    static std::shared_ptr<Parameter> createArray(std::string const& sName, std::string const& sDescription,
                                                  [[maybe_unused]] std::size_t size) {
        return create(U(), sName, sDescription);
    }

    /// A plain parameter of the same name, description, default and value, with all flags set.
    virtual std::shared_ptr<Parameter> cloneParameter() {
        auto spClone = create(defaultValue(), name(), description());
        spClone->setValue(value());
        return spClone;
    }

    /// The value. The reference holds until the value is set or the parameter dies.
    virtual T const& value() const { return value_; }

    /// Stores `value` and sets all dirty flags; does nothing if it equals the value that stands. If the copy
    /// of a T throws, no flag is set.
    virtual void setValue(T const& value) {
        if (value_ == value) {
            return;
        }
        value_ = value;
        setDirty();
    }

    /// The value that the parameter was made with.
    virtual T const& defaultValue() const { return defaultValue_; }

    std::shared_ptr<ParameterBase> clone() override { return cloneParameter(); }

    std::type_info const& datatype() const override { return typeid(T); }

    InputConnector* createProxyConnector(Node* pNode) override {
        return ORVO_NEW ParameterInput<T>(name(), pNode, this);
    }

    void write(std::ostream& oStream) const override {
        oStream << name() << " " << description() << " ";
        internal::writeParameterValue(oStream, value());
    }

    void setValueFromParameter(ParameterBase const& oSource) override { setValue(sameType(oSource).value()); }

    void resetToDefaultValue() override { setValue(defaultValue()); }

    void visit(ParameterVisitorBase* pVisitor) override {
        ORVO_ENFORCE(pVisitor);
        pVisitor->visit(this);
    }

private:
    static Parameter const& sameType(ParameterBase const& oSource) {
        auto const* const pSource = std::strcmp(oSource.datatype().name(), typeid(T).name()) == 0
                                        ? dynamic_cast<Parameter const*>(&oSource)
                                        : nullptr;
        ORVO_CHECK(pSource != nullptr, "isOfType<T>()");
        return *pSource;
    }

    T value_;
    T defaultValue_;
};

} // namespace ORVO::DataFlow

#include "orvo/data_flow/parameters/ParameterInstances.h"
