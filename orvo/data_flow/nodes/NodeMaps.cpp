// The names and numbers by which nodes are told apart in dumps.

#include "orvo/data_flow/nodes/Node.h"

#include "orvo/core/Check.h"

#include <memory>
#include <mutex>

namespace ORVO::DataFlow {

namespace {

// Graphs are independent of each other, also where several threads build them at once: these maps are all
// that their nodes share.
std::mutex oNodeMapsLock;
using NodeMapsGuard = std::lock_guard<std::mutex>;

} // namespace

Node::IndexMap* Node::pIndexMap_ = nullptr;
std::map<std::string, int>* Node::pNameCounter_ = nullptr;

void Node::initializeNodeMaps() {
    NodeMapsGuard const guard(oNodeMapsLock);
    ORVO_CHECK(!pIndexMap_);
    ORVO_CHECK(!pNameCounter_);
    auto spIndexMap = std::make_unique<IndexMap>();
    pNameCounter_ = new std::map<std::string, int>;
    pIndexMap_ = spIndexMap.release();
}

void Node::terminateNodeMaps() {
    NodeMapsGuard const guard(oNodeMapsLock);
    ORVO_CHECK(pIndexMap_);
    ORVO_CHECK(pNameCounter_);
    delete pIndexMap_;
    pIndexMap_ = nullptr;
    delete pNameCounter_;
    pNameCounter_ = nullptr;
}

void Node::debugAddNode(Node const* pNode, std::string const& sName) {
    NodeMapsGuard const guard(oNodeMapsLock);
    ORVO_CHECK(pIndexMap_);
    ORVO_CHECK(pIndexMap_->find(pNode) == pIndexMap_->end(),
               "pIndexMap_->find( pNode ) == pIndexMap_->end()");
    int& nextNumber = (*pNameCounter_)[sName];
    pIndexMap_->emplace(pNode, nextNumber);
    ++nextNumber;
}

void Node::debugRemoveNode(Node const* pNode) {
    NodeMapsGuard const guard(oNodeMapsLock);
    // Found first: without the maps there is nothing to erase from.
    auto const it = indexEntry(pNode);
    pIndexMap_->erase(it);
}

void Node::debugForgetNode(Node const* pNode) noexcept {
    NodeMapsGuard const guard(oNodeMapsLock);
    if (pIndexMap_ != nullptr) {
        pIndexMap_->erase(pNode);
    }
}

void Node::debugRenumberNode(Node const* pNode, std::string const& sName) {
    NodeMapsGuard const guard(oNodeMapsLock);
    auto const it = indexEntry(pNode);
    it->second = (*pNameCounter_)[sName]++;
}

int Node::index(Node const* pNode) {
    NodeMapsGuard const guard(oNodeMapsLock);
    return indexEntry(pNode)->second;
}

Node::IndexMap::iterator Node::indexEntry(Node const* pNode) {
    ORVO_CHECK(pIndexMap_);
    auto const it = pIndexMap_->find(pNode);
    ORVO_CHECK(it != pIndexMap_->end(), "pIndexMap_->find( pNode ) != pIndexMap_->end()");
    return it;
}

} // namespace ORVO::DataFlow
