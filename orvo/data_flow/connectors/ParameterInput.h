#pragma once

#include "orvo/core/Export.h"
#include "orvo/data_flow/connectors/Inputs.h"

#include <string>

namespace ORVO::DataFlow {

template <typename T>
class Parameter;

/// An input that feeds a parameter: whenever its node runs, the parameter takes the value that was fetched.
/// Made by `ParameterBase::createProxyConnector` and added to a node by `Node::convertToConnector`.
///
/// Threads: as stated for `Connector`.
template <typename T>
class ORVO_API ParameterInput : public ConstInput<T> {
public:
    /// An empty, unconnected input named `sName` of `pNode` (may be null) for `pParameter`. Neither is owned;
    /// the parameter lives whenever the input fetches. Throws `InternalException`
    /// "Enforce pParameter != NULL".
    ParameterInput(std::string const& sName, Node* pNode, Parameter<T>* pParameter)
        : ConstInput<T>(sName, pNode), pParameter_(pParameter) {
        ORVO_ENFORCE(pParameter);
    }

    /// Fetches as every `ConstInput` does and sets the parameter to the value. Throws `InternalException`
    /// "Enforce pConnectedOutput_ != NULL" when unconnected and "Enforce spData_.get() != NULL" if the output
    /// holds no value.
    void fetchInput() override {
        ConstInput<T>::fetchInput();
        pParameter_->setValue(**this);
    }

private:
    Parameter<T>* pParameter_;
};

} // namespace ORVO::DataFlow

// The parameter makes its inputs, and the inputs set their parameter.
#include "orvo/data_flow/parameters/Parameter.h"
