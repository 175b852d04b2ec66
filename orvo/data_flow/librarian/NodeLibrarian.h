#pragma once

#include "orvo/core/Export.h"
#include "orvo/data_flow/librarian/NodeMetaDataSorter.h"
#include "orvo/data_flow/librarian/NodeTargetType.h"

#include <map>
#include <string>
#include <vector>

namespace ORVO::DataFlow {

namespace internal {
struct TestAccess;
}

class Library;
class Node;
class NodeFactory;
class NodeMetaData;

/// The process-wide catalogue of node types. A library registers each type once, with a factory and a
/// metadata record; graph builders ask for a node by its identity or by its short client ID.
///
/// The librarian lives from Library::initialize() to Library::terminate(). It owns what was added to it;
/// nodes that it creates belong to the caller.
///
/// Threads: no locks. Types are registered while libraries start, before other threads work with the
/// catalogue; after that, lookups may come from any thread. Only the making and unmaking of the librarian
/// itself is locked.
class ORVO_API NodeLibrarian {
public:
    using MetaDataIterator = std::vector<NodeMetaData*>::const_iterator;

    NodeLibrarian(NodeLibrarian const&) = delete;
    NodeLibrarian& operator=(NodeLibrarian const&) = delete;

    /// The librarian. Throws InternalException "Enforce gpSingleton_ != NULL" while the library is not up.
    static NodeLibrarian* Instance();

    /// Whether there is a librarian.
    static bool exists();

    /// Registers a node type. Takes ownership of both objects, which may be plainly allocated.
    /// Throws InternalException "Enforce pNodeFactory != NULL" or "Enforce pMetaData != NULL": what was
    /// offered still belongs to the caller. Throws ParameterException "!bDuplicate" if the type is registered
    /// already, and std::bad_alloc: both objects are freed, and the catalogue is as it was.
    void add(NodeFactory* pNodeFactory, NodeMetaData* pMetaData);

    /// The same with a function in place of the factory. Throws also InternalException
    /// "Enforce pCreateFunction != NULL": the record then still belongs to the caller.
    void add(Node* (*pCreateFunction)(NodeTargetType), NodeMetaData* pMetaData);

    /// Makes a node, owned by the caller. The record is only a search key: with a version exactly that one is
    /// asked for, without a version the latest. Null for a null record, an unknown type, and a target that
    /// the type does not serve.
    Node* createNodeByMetadata(NodeMetaData const* pMetaData, NodeTargetType eTarget);

    /// Makes a node, owned by the caller, of the first registered type with this client ID (byte for byte):
    /// of exactly its version, or of the latest one if its record has none. Null if there is no such type, or
    /// if it does not serve the target. Throws InternalException "Enforce gpSingleton_ != NULL" while the
    /// library is not up.
    Node* createNodeByClientID(std::string const& clientID, NodeTargetType eTarget);

    /// The records in the order of registration, not owned. Invalidated by add() and clearAll().
    MetaDataIterator begin() const { return aMetaData_.begin(); }
    /// Behind the last record.
    MetaDataIterator end() const { return aMetaData_.end(); }

    /// Forgets and frees all node types.
    void clearAll();

private:
    friend class Library;
    friend struct internal::TestAccess;

    NodeLibrarian();
    ~NodeLibrarian();

    /// Throws InternalException "gpSingleton_ == 0" if there is one already.
    static void Create();
    /// Throws InternalException "Enforce gpSingleton_ != NULL" if there is none.
    static void Destroy();

    static NodeLibrarian* gpSingleton_;

    std::map<NodeMetaData*, NodeFactory*, NodeMetaDataSorter> oFactories_;
    std::vector<NodeMetaData*> aMetaData_;
};

} // namespace ORVO::DataFlow
