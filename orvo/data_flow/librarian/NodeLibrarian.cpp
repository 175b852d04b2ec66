#include "orvo/data_flow/librarian/NodeLibrarian.h"

#include "orvo/core/Check.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/librarian/CreateNodeFunctionNodeFactory.h"
#include "orvo/data_flow/librarian/NodeFactory.h"
#include "orvo/data_flow/librarian/NodeMetaData.h"

#include <limits>
#include <memory>
#include <mutex>
#include <new>

namespace ORVO::DataFlow {

namespace {

template <typename T>
using Owned = std::unique_ptr<T, ORVODeleter<T>>;

std::mutex& singletonLock() {
    static std::mutex oLock;
    return oLock;
}

bool isOneFamily(NodeMetaData const& left, NodeMetaData const& right) {
    return left.name() == right.name() && left.nameSpace() == right.nameSpace() &&
           left.vendor() == right.vendor();
}

} // namespace

NodeLibrarian* NodeLibrarian::gpSingleton_ = nullptr;

NodeLibrarian::NodeLibrarian() = default;

NodeLibrarian::~NodeLibrarian() { clearAll(); }

void NodeLibrarian::Create() {
    std::lock_guard const lock(singletonLock());
    ORVO_CHECK(gpSingleton_ == nullptr, "gpSingleton_ == 0");
    gpSingleton_ = new (std::nothrow) NodeLibrarian();
    ORVO_ENFORCE(gpSingleton_);
}

void NodeLibrarian::Destroy() {
    std::lock_guard const lock(singletonLock());
    ORVO_ENFORCE(gpSingleton_);
    delete gpSingleton_;
    gpSingleton_ = nullptr;
}

NodeLibrarian* NodeLibrarian::Instance() {
    ORVO_ENFORCE(gpSingleton_);
    return gpSingleton_;
}

bool NodeLibrarian::exists() { return gpSingleton_ != nullptr; }

void NodeLibrarian::add(NodeFactory* pNodeFactory, NodeMetaData* pMetaData) {
    ORVO_ENFORCE(pNodeFactory);
    ORVO_ENFORCE(pMetaData);
    Owned<NodeFactory> spFactory(pNodeFactory);
    Owned<NodeMetaData> spMetaData(pMetaData);

    aMetaData_.reserve(aMetaData_.size() + 1); // so that nothing fails after the insertion
    bool const bDuplicate = !oFactories_.emplace(pMetaData, pNodeFactory).second;
    ORVO_CHECK_PARAMETER(!bDuplicate);
    aMetaData_.push_back(spMetaData.release());
    spFactory.release();
}

void NodeLibrarian::add(Node* (*pCreateFunction)(NodeTargetType), NodeMetaData* pMetaData) {
    ORVO_ENFORCE(pCreateFunction);
    ORVO_ENFORCE(pMetaData);
    Owned<NodeMetaData> spMetaData(pMetaData);
    Owned<NodeFactory> spFactory(ORVO_NEW CreateNodeFunctionNodeFactory(pCreateFunction));
    add(spFactory.release(), spMetaData.release());
}

Node* NodeLibrarian::createNodeByMetadata(NodeMetaData const* pMetaData, NodeTargetType eTarget) {
    if (pMetaData == nullptr) {
        return nullptr;
    }
    if (pMetaData->hasVersion()) {
        // The key type of the map is not const; a search changes nothing.
        auto const iter = oFactories_.find(const_cast<NodeMetaData*>(pMetaData));
        return iter != oFactories_.end() && iter->second != nullptr ? iter->second->create(eTarget) : nullptr;
    }

    // Above every version of the family; the element before is the latest one, if the family has any.
    NodeMetaData probe(pMetaData->name(), pMetaData->nameSpace(), pMetaData->vendor(),
                       std::numeric_limits<std::uint32_t>::max(), std::string(), std::string());
    auto iter = oFactories_.upper_bound(&probe);
    if (iter == oFactories_.begin()) {
        return nullptr;
    }
    --iter;
    bool const bFound = isOneFamily(*iter->first, *pMetaData) && iter->second != nullptr;
    return bFound ? iter->second->create(eTarget) : nullptr;
}

Node* NodeLibrarian::createNodeByClientID(std::string const& clientID, NodeTargetType eTarget) {
    ORVO_ENFORCE(gpSingleton_);
    for (NodeMetaData const* pMetaData : aMetaData_) {
        if (pMetaData->clientID() == clientID) {
            return createNodeByMetadata(pMetaData, eTarget);
        }
    }
    return nullptr;
}

void NodeLibrarian::clearAll() {
    for (auto const& entry : oFactories_) {
        trackedDelete(entry.second);
    }
    oFactories_.clear(); // before the records, which are its keys
    for (NodeMetaData* pMetaData : aMetaData_) {
        trackedDelete(pMetaData);
    }
    aMetaData_.clear();
}

} // namespace ORVO::DataFlow
