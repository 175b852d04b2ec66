#pragma once

#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/data_flow/nodes/Node.h"

#include "tests/data_flow/connectors/Payload.h"

#include <cstddef>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace ORVO::Test {

/// A node whose connectors are made on demand, which owns them, and whose protected operations can be called.
class TestNode : public DataFlow::Node {
public:
    explicit TestNode(std::string const& sName) : Node(sName) {}
    ~TestNode() override { disconnect(); }

    using Node::addInput;
    using Node::addOutput;
    using Node::hasDirtyParametersSimpleCaching;
    using Node::hasDirtyProducer;
    using Node::hasUniqueName;
    using Node::registerParameter;
    using Node::setCleanAllParametersSimpleCaching;

    template <typename T = Payload>
    DataFlow::ConstInput<T>& addConstInput(std::string const& sName) {
        return keep(std::make_unique<DataFlow::ConstInput<T>>(sName, this), aOwnedInputs_);
    }
    template <typename T = Payload>
    DataFlow::Input<T>& addMutableInput(std::string const& sName) {
        return keep(std::make_unique<DataFlow::Input<T>>(sName, this), aOwnedInputs_);
    }
    template <typename T = Payload>
    DataFlow::ConstOutput<T>& addConstOutput(std::string const& sName) {
        return keep(std::make_unique<DataFlow::ConstOutput<T>>(sName, this), aOwnedOutputs_);
    }
    template <typename T = Payload>
    DataFlow::Output<T>& addMutableOutput(std::string const& sName) {
        return keep(std::make_unique<DataFlow::Output<T>>(sName, this), aOwnedOutputs_);
    }

    /// What `internalProcess` does.
    std::function<void()> pfnWork_;
    /// What was called, in order.
    std::vector<std::string> aCalls_;

protected:
    void preProcess() override {
        aCalls_.emplace_back("preProcess");
        Node::preProcess();
    }
    void internalProcess() override {
        aCalls_.emplace_back("internalProcess");
        Node::internalProcess();
        if (pfnWork_) {
            pfnWork_();
        }
    }
    void postProcess() override {
        aCalls_.emplace_back("postProcess");
        Node::postProcess();
    }

private:
    template <typename Connector>
    Connector& keep(std::unique_ptr<Connector> spInput,
                    std::vector<std::unique_ptr<DataFlow::InputConnector>>& aOwned) {
        Connector& oInput = *spInput;
        aOwned.emplace_back(std::move(spInput));
        addInput(&oInput);
        return oInput;
    }
    template <typename Connector>
    Connector& keep(std::unique_ptr<Connector> spOutput,
                    std::vector<std::unique_ptr<DataFlow::OutputConnector>>& aOwned) {
        Connector& oOutput = *spOutput;
        aOwned.emplace_back(std::move(spOutput));
        addOutput(&oOutput);
        return oOutput;
    }

    std::vector<std::unique_ptr<DataFlow::InputConnector>> aOwnedInputs_;
    std::vector<std::unique_ptr<DataFlow::OutputConnector>> aOwnedOutputs_;
};

} // namespace ORVO::Test
