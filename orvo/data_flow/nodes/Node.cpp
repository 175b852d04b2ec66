#include "orvo/data_flow/nodes/Node.h"

#include "orvo/data_flow/connectors/ConnectorNameEquals.h"
#include "orvo/data_flow/connectors/InputConnector.h"
#include "orvo/data_flow/connectors/OutputConnector.h"
#include "orvo/data_flow/parameters/ParameterBase.h"

#include "orvo/core/Check.h"
#include "orvo/core/utility/SharedPtr.h"

#include <algorithm>
#include <memory>
#include <ostream>
#include <sstream>

namespace ORVO::DataFlow {

namespace {

/// The first connector of that name, or null.
template <typename T>
T* findByName(std::vector<T*> const& aConnectors, std::string const& sName) {
    auto const it = std::find_if(aConnectors.begin(), aConnectors.end(), ConnectorNameEquals(sName));
    return it == aConnectors.end() ? nullptr : *it;
}

/// Makes room for one element, so that appending it cannot fail.
template <typename T>
void reserveOneMore(std::vector<T*>& aList) {
    if (aList.size() == aList.capacity()) {
        aList.reserve(std::max<std::size_t>(4, 2 * aList.size()));
    }
}

void writeEnd(std::ostream& oStream, Connector const& oConnector) {
    Node const* const pNode = oConnector.node();
    ORVO_ENFORCE(pNode);
    oStream << pNode->debugId() << " : " << oConnector.name();
}

} // namespace

Node::Node(std::string const& sName) : sName_(sName) { debugAddNode(this, sName_); }

Node::~Node() {
    // A node that outlives the library has lost its number already; a destructor reports nothing.
    debugForgetNode(this);
}

void Node::debugWrite(std::ostream& oStream) const {
    // Composed apart, so that a connector that cannot be written leaves the stream alone.
    std::ostringstream oText;
    oText << "Node " << debugId() << "\n";
    oText << "  " << aInputs_.size() << " inputs\n";
    for (InputConnector const* const pInput : aInputs_) {
        OutputConnector const* const pConnectedOutput_ = pInput->connectedOutput();
        ORVO_ENFORCE(pConnectedOutput_);
        oText << "  ";
        writeEnd(oText, *pConnectedOutput_);
        oText << " -> " << debugId() << " : " << pInput->name() << "\n";
    }
    oText << "  " << aOutputs_.size() << " outputs\n";
    for (OutputConnector const* const pOutput : aOutputs_) {
        oText << "  " << debugId() << " : " << pOutput->name() << " -> ";
        if (InputConnector const* const pConnectedInput = pOutput->connectedInput()) {
            writeEnd(oText, *pConnectedInput);
        }
        oText << "\n";
    }
    oStream << oText.str();
}

void Node::setController(Controller& oController) { pController_ = &oController; }

void Node::emit() {}

bool Node::canEmit() const { return false; }

bool Node::hasBufferChanged() { return true; }

void Node::flush() {
    flushInputs();
    flushOutputs();
    setProcessing(false);
}

void Node::disconnect() {
    for (OutputConnector* const pOutput : aOutputs_) {
        if (InputConnector* const pConnectedInput = pOutput->connectedInput()) {
            pConnectedInput->disconnect();
        }
    }
    for (InputConnector* const pInput : aInputs_) {
        pInput->disconnect();
    }
}

void Node::flushOutputs() {
    for (OutputConnector* const pOutput : aOutputs_) {
        pOutput->flushOutput();
    }
}

void Node::flushInputs() {
    for (InputConnector* const pInput : aInputs_) {
        pInput->flushInput();
    }
}

bool Node::isReady() const {
    for (OutputConnector const* const pOutput : aOutputs_) {
        // The result is there already: running again would overwrite it.
        if (pOutput->hasData() && !pOutput->bound()) {
            return false;
        }
    }
    for (InputConnector const* const pInput : aInputs_) {
        OutputConnector const* const pProducerOutput = pInput->connectedOutput();
        if (pProducerOutput == nullptr || !pProducerOutput->hasData()) {
            return false;
        }
    }
    return true;
}

void Node::process() {
    preProcess();
    internalProcess();
    postProcess();
}

void Node::processSlice(std::size_t, std::size_t) { ORVO_FAIL("0"); }

ImageFilter const* Node::asImageFilter() const { return nullptr; }

ImageFilter* Node::asImageFilter() { return nullptr; }

Node::BlockedRange Node::rangeToProcess() { return BlockedRange(); }

void Node::setName(std::string const& sName) {
    // Copied first, so that nothing fails once the number has changed.
    std::string sNewName(sName);
    debugRenumberNode(this, sNewName);
    sName_.swap(sNewName);
}

std::string Node::debugId() const { return sName_ + " [" + std::to_string(index(this)) + "]"; }

InputConnector* Node::input(std::size_t iInput) {
    ORVO_CHECK(iInput < aInputs_.size(), "Range error: iInput < aInputs_.size()");
    return aInputs_[iInput];
}

InputConnector const* Node::input(std::size_t iInput) const {
    ORVO_CHECK(iInput < aInputs_.size(), "Range error: iInput < aInputs_.size()");
    return aInputs_[iInput];
}

InputConnector* Node::input(std::string const& sName) { return findByName(aInputs_, sName); }

InputConnector const* Node::input(std::string const& sName) const { return findByName(aInputs_, sName); }

OutputConnector* Node::output(std::size_t iOutput) {
    ORVO_CHECK(iOutput < aOutputs_.size(), "Range error: iOutput < aOutputs_.size()");
    return aOutputs_[iOutput];
}

OutputConnector const* Node::output(std::size_t iOutput) const {
    ORVO_CHECK(iOutput < aOutputs_.size(), "Range error: iOutput < aOutputs_.size()");
    return aOutputs_[iOutput];
}

OutputConnector* Node::output(std::string const& sName) { return findByName(aOutputs_, sName); }

OutputConnector const* Node::output(std::string const& sName) const { return findByName(aOutputs_, sName); }

ParameterBase* Node::parameter(std::size_t iParameter) { return oParameters_.parameter(iParameter).get(); }

ParameterBase const* Node::parameter(std::size_t iParameter) const {
    return oParameters_.parameter(iParameter).get();
}

ParameterBase* Node::parameter(std::string const& sName) { return oParameters_.getParameter(sName).get(); }

ParameterBase const* Node::parameter(std::string const& sName) const {
    return oParameters_.getParameter(sName).get();
}

InputConnector* Node::convertToConnector(ParameterBase* pParameter) {
    ORVO_ENFORCE(pParameter);
    reserveOneMore(aInputs_);
    InputConnector* const pInput = pParameter->createProxyConnector(this);
    ORVO_ENFORCE(pInput);
    aInputs_.push_back(pInput);
    return pInput;
}

bool Node::hasDirtyParameters() {
    bool bAnyDirty = false;
    for (auto const& spParameter : oParameters_) {
        if (spParameter->isDirty()) {
            spParameter->setClean();
            bAnyDirty = true;
        }
    }
    return bAnyDirty;
}

void Node::updateDirtyState() {
    bDirty_ = hasDirtyProducer() || hasDirtyParametersSimpleCaching();
    setCleanAllParametersSimpleCaching();
}

bool Node::keepsCache() const {
    return std::any_of(aOutputs_.begin(), aOutputs_.end(),
                       [](OutputConnector const* pOutput) { return pOutput->keepsCache(); });
}

void Node::preProcess() {
    for (InputConnector* const pInput : aInputs_) {
        pInput->fetchInput();
    }
}

void Node::internalProcess() {}

void Node::postProcess() {
    for (InputConnector* const pInput : aInputs_) {
        pInput->removeData();
    }
}

void Node::addInput(InputConnector* pInput) {
    ORVO_ENFORCE(pInput);
    aInputs_.push_back(pInput);
}

void Node::addOutput(OutputConnector* pOutput) {
    ORVO_ENFORCE(pOutput);
    aOutputs_.push_back(pOutput);
}

void Node::registerParameter(ParameterBase* pParameter) {
    ORVO_ENFORCE(pParameter);
    oParameters_.insert(std::shared_ptr<ParameterBase>(pParameter, NullDeleter()));
}

bool Node::hasDirtyParametersSimpleCaching() const {
    bool bAnyDirty = false;
    for (auto const& spParameter : oParameters_) {
        bAnyDirty = spParameter->isDirtySimpleCaching() || bAnyDirty;
    }
    return bAnyDirty;
}

void Node::setCleanAllParametersSimpleCaching() {
    for (auto const& spParameter : oParameters_) {
        spParameter->setCleanSimpleCaching();
    }
}

bool Node::hasDirtyProducer() const {
    return std::any_of(aInputs_.begin(), aInputs_.end(), [](InputConnector const* pInput) {
        OutputConnector const* const pOutput = pInput->connectedOutput();
        return pOutput != nullptr && pOutput->node() != nullptr && pOutput->node()->isDirty();
    });
}

bool Node::hasUniqueName(ParameterBase*) const { return true; }

std::ostream& operator<<(std::ostream& oStream, Node const& oNode) {
    oNode.debugWrite(oStream);
    return oStream;
}

} // namespace ORVO::DataFlow
