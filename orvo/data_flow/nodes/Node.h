#pragma once

#include "orvo/core/Export.h"
#include "orvo/data_flow/parameters/ParameterSet.h"

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <iosfwd>
#include <map>
#include <mutex>
#include <string>
#include <vector>

namespace ORVO {
class ImageFilter;
}

namespace ORVO::DataFlow {

class Controller;
class InputConnector;
class Library;
class OutputConnector;
class ParameterBase;

/// A unit of work of a data-flow graph: named inputs, named outputs, parameters, and the operations by which
/// a controller runs it.
///
/// Data is pulled. When a node runs, `preProcess` takes the objects of the connected outputs over,
/// `internalProcess` computes and fills the outputs, `postProcess` drops what was taken. A subclass creates
/// its connectors in its constructor, adds them with `addInput` and `addOutput`, registers its parameters
/// with `registerParameter`, and overrides `internalProcess`; to run in parallel slices it overrides
/// `rangeToProcess` and `processSlice` too.
///
/// Nodes belong to whoever built the graph. They live between `DataFlow::Library::initialize` and
/// `terminate`, and are disconnected before they die.
///
/// Threads: the nodes of one graph are constructed, renamed, connected and destroyed by one thread at a time,
/// while no frame of theirs runs; graphs are independent of each other. During a frame the thread that holds
/// the node's lock runs it; `processSlice` runs on many threads at once; `isProcessing` may be asked by any
/// thread.
class ORVO_API Node {
public:
    /// Mark of a graph traversal.
    enum teColor {
        COLOR_NOT_VISITED = 0, ///< not seen yet
        COLOR_DISCOVERED = 1,  ///< seen, its producers are being walked
        COLOR_FINISHED = 2     ///< done
    };

    /// The work of a node that runs in slices. Nothing runs if either of the first two is 0.
    struct BlockedRange {
        std::uint64_t unitsPerItem = 0; ///< work units in one item (for images: pixels in a row)
        std::uint64_t items = 0;        ///< number of items (for images: rows)
        std::uint64_t reserved = 0;     ///< written 0, not read
    };

    /// A node named `sName`, which need not be unique; `debugId` is. Throws `InternalException` "pIndexMap_"
    /// if the data-flow library is not up.
    explicit Node(std::string const& sName);
    Node(Node const&) = delete;
    Node& operator=(Node const&) = delete;

    /// Disconnects nothing and frees no connector.
    virtual ~Node();

    /// Writes the node and its connections, one line each. Throws `InternalException`
    /// "Enforce pConnectedOutput_ != NULL" for an unconnected input and "Enforce pNode != NULL" for a partner
    /// without a node, with nothing written.
    virtual void debugWrite(std::ostream& oStream) const;

    /// Remembers the controller that the node was added to. Not owned.
    virtual void setController(Controller& oController);

    /// For nodes that give something to the outside of their own accord. Does nothing here.
    virtual void emit();

    /// Whether `emit` has something to give: false here.
    virtual bool canEmit() const;

    /// Whether a buffer that the node reads from outside the graph may have changed: true here.
    virtual bool hasBufferChanged();

    /// Drops the data of all inputs and of all outputs that are not bound, and ends a run that threw.
    virtual void flush();

    /// Disconnects all outputs and all inputs, at both ends.
    virtual void disconnect();

    /// Drops the data of all outputs that are not bound.
    virtual void flushOutputs();

    /// Drops the data of all inputs.
    virtual void flushInputs();

    /// Whether the node can and should run: no output that is not bound holds data already, and every input
    /// is connected to an output that holds data.
    virtual bool isReady() const;

    /// Runs the node: `preProcess`, `internalProcess`, `postProcess`. The caller holds the node's lock. Lets
    /// every exception of the three out; what was fetched by then stays in the inputs until `flush`.
    virtual void process();

    /// Does items `begin` to `end` (exclusive) of `rangeToProcess`. A node that reports items overrides it:
    /// throws `InternalException` "0" here.
    virtual void processSlice(std::size_t begin, std::size_t end);

    /// The node as an image filter, or null: null here.
    virtual ImageFilter const* asImageFilter() const;
    /// The node as an image filter, or null: null here.
    virtual ImageFilter* asImageFilter();

    /// The slices that `Controller::processSlices` runs: none here.
    virtual BlockedRange rangeToProcess();

    /// The name given at construction or by `setName`.
    std::string const& name() const { return sName_; }

    /// Renames the node, which takes the next number of the new name in `debugId`, also if that is its name
    /// already. Throws `InternalException` "pIndexMap_" after the library was terminated.
    void setName(std::string const& sName);

    /// The name, " [", the node's number among the nodes that ever bore its name, "]". Throws
    /// `InternalException` "pIndexMap_" after the library was terminated.
    std::string debugId() const;

    /// The controller that the node was added to last, or null. Not owned.
    Controller* controller() const { return pController_; }

    /// The number given to `setPriority`, 0 at first. Nothing in the library reads it.
    std::uint32_t priority() const { return iPriority_; }
    /// Stores the number that `priority` gives.
    void setPriority(std::uint32_t iPriority) { iPriority_ = iPriority; }

    /// The mark of the last traversal, `COLOR_NOT_VISITED` at first.
    teColor color() const { return eColor_; }
    /// Sets the mark.
    void setColor(teColor eColor) { eColor_ = eColor; }

    /// Whether a thread runs the node, or a run threw and the node was not flushed since. What the running
    /// thread wrote before `setProcessing(false)` is visible to who reads false here.
    bool isProcessing() const { return iProcessing_.load(std::memory_order_acquire) > 0; }
    /// Marks the node as running or idle. Called by the thread that holds the node's lock, and by `flush`.
    void setProcessing(bool bProcessing) {
        iProcessing_.store(bProcessing ? 1 : 0, std::memory_order_release);
    }

    /// Input number `iInput`, in the order of `addInput`. Not owned. Throws `InternalException`
    /// "Range error: iInput < aInputs_.size()".
    InputConnector* input(std::size_t iInput);
    /// The same of a const node.
    InputConnector const* input(std::size_t iInput) const;

    /// The first input of that name (byte for byte), or null. Not owned.
    InputConnector* input(std::string const& sName);
    /// The same of a const node.
    InputConnector const* input(std::string const& sName) const;

    /// Output number `iOutput`, in the order of `addOutput`. Not owned. Throws `InternalException`
    /// "Range error: iOutput < aOutputs_.size()".
    OutputConnector* output(std::size_t iOutput);
    /// The same of a const node.
    OutputConnector const* output(std::size_t iOutput) const;

    /// The first output of that name (byte for byte), or null. Not owned.
    OutputConnector* output(std::string const& sName);
    /// The same of a const node.
    OutputConnector const* output(std::string const& sName) const;

    /// How many inputs were added, those made of parameters included.
    std::size_t numberOfInputs() const { return aInputs_.size(); }
    /// How many outputs were added.
    std::size_t numberOfOutputs() const { return aOutputs_.size(); }
    /// How many parameters the node's set holds.
    std::size_t numberOfParameters() const { return oParameters_.size(); }

    /// Parameter number `iParameter`, in the order of registration. Not owned. Throws `InternalException`
    /// "Range error: iParameter < size()".
    ParameterBase* parameter(std::size_t iParameter);
    /// The same of a const node.
    ParameterBase const* parameter(std::size_t iParameter) const;

    /// The first parameter of that name (byte for byte), or null. Not owned.
    ParameterBase* parameter(std::string const& sName);
    /// The same of a const node.
    ParameterBase const* parameter(std::string const& sName) const;

    /// All parameters of the node. The set refers to registered ones without owning them.
    ParameterSet& parameters() { return oParameters_; }
    /// The same of a const node.
    ParameterSet const& parameters() const { return oParameters_; }

    /// Turns a parameter into an input of its name, from which it takes a new value at every run. The input
    /// belongs to the caller, who keeps it for as long as the node lives, and frees it then with
    /// `ORVODeleter<InputConnector>`. Throws `InternalException` "Enforce pParameter != NULL", and
    /// "Enforce pInput != NULL" if the parameter makes none.
    InputConnector* convertToConnector(ParameterBase* pParameter);

    /// Whether the plain dirty flag of any parameter is set; clears that flag of all of them.
    bool hasDirtyParameters();

    /// Finds out whether the node must run anew: it is dirty if a producer is dirty or a parameter changed
    /// since the last call. Called once a frame, producers first.
    void updateDirtyState();

    /// The result of the last `updateDirtyState`; false at first.
    bool isDirty() const { return bDirty_; }

    /// Whether any output keeps its data when it is fetched.
    bool keepsCache() const;

protected:
    /// Takes over the data of every input, in order: `InputConnector::fetchInput`.
    virtual void preProcess();

    /// Computes: reads the inputs and fills the outputs. Does nothing here.
    virtual void internalProcess();

    /// Drops the data of every input, in order: `InputConnector::removeData`.
    virtual void postProcess();

    /// Appends a connector, which is not owned. Throws `InternalException` "Enforce pInput != NULL".
    void addInput(InputConnector* pInput);

    /// Appends a connector, which is not owned. Throws `InternalException` "Enforce pOutput != NULL".
    void addOutput(OutputConnector* pOutput);

    /// Appends a parameter, which is not owned and lives as long as the node. Throws `InternalException`
    /// "Enforce pParameter != NULL".
    void registerParameter(ParameterBase* pParameter);

    /// Whether the simple-caching flag of any parameter is set. Clears nothing.
    bool hasDirtyParametersSimpleCaching() const;

    /// Clears the simple-caching flag of all parameters.
    void setCleanAllParametersSimpleCaching();

    /// Whether some input is connected to a node that is dirty.
    bool hasDirtyProducer() const;

    /// Whether the parameter's name is free to use: always true.
    bool hasUniqueName(ParameterBase* pParameter) const;

    /// Makes the two maps of names and numbers. Throws `InternalException` "!pIndexMap_" or "!pNameCounter_"
    /// if they exist. Called by `Library::initialize`.
    static void initializeNodeMaps();

    /// Frees the two maps. Throws `InternalException` "pIndexMap_" or "pNameCounter_" if they do not exist.
    /// Called by `Library::terminate`.
    static void terminateNodeMaps();

    /// Gives the node the next number of the name. Throws `InternalException` "pIndexMap_" before
    /// `initializeNodeMaps`, and "pIndexMap_->find( pNode ) == pIndexMap_->end()" if it has one.
    static void debugAddNode(Node const* pNode, std::string const& sName);

    /// Forgets the node's number, which is not used again. Throws `InternalException` "pIndexMap_" before
    /// `initializeNodeMaps`, and "pIndexMap_->find( pNode ) != pIndexMap_->end()" if it has none.
    static void debugRemoveNode(Node const* pNode);

    /// The node's number among the nodes that bear its name, with the failures of `debugRemoveNode`.
    static int index(Node const* pNode);

private:
    friend class Controller;
    friend class Library;

    using IndexMap = std::map<Node const*, int>;

    /// The node's entry in the map, with the failures of `debugRemoveNode`. The caller has locked the maps.
    static IndexMap::iterator indexEntry(Node const* pNode);

    /// Forgets the node's number, if it has one.
    static void debugForgetNode(Node const* pNode) noexcept;

    /// `debugRemoveNode` and `debugAddNode` in one, which changes nothing if it throws.
    static void debugRenumberNode(Node const* pNode, std::string const& sName);

    /// Node to its number among the nodes that bear its name; null while the library is not up.
    static IndexMap* pIndexMap_;
    /// Name to the next number to hand out; null while the library is not up.
    static std::map<std::string, int>* pNameCounter_;

    std::string sName_;
    Controller* pController_ = nullptr;
    std::uint32_t iPriority_ = 0;
    teColor eColor_ = COLOR_NOT_VISITED;
    /// Held by the thread that runs the node. A second thread that pulls the same node waits on it, and then
    /// finds the node's outputs filled.
    std::mutex oProcessLock_;
    std::atomic<std::int32_t> iProcessing_{0};
    ParameterSet oParameters_;
    std::vector<OutputConnector*> aOutputs_;
    std::vector<InputConnector*> aInputs_;
    bool bDirty_ = false;
};

/// Writes the node with `Node::debugWrite`.
ORVO_API std::ostream& operator<<(std::ostream& oStream, Node const& oNode);

} // namespace ORVO::DataFlow
