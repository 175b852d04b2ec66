// The names and numbers by which nodes are told apart in dumps.

#include "orvo/data_flow/nodes/Node.h"

#include "orvo/core/Check.h"

#include <memory>

namespace ORVO::DataFlow {

Node::IndexMap* Node::pIndexMap_ = nullptr;
std::map<std::string, int>* Node::pNameCounter_ = nullptr;

void Node::initializeNodeMaps() {
    ORVO_CHECK(!pIndexMap_);
    ORVO_CHECK(!pNameCounter_);
    auto spIndexMap = std::make_unique<IndexMap>();
    pNameCounter_ = new std::map<std::string, int>;
    pIndexMap_ = spIndexMap.release();
}

void Node::terminateNodeMaps() {
    ORVO_CHECK(pIndexMap_);
    ORVO_CHECK(pNameCounter_);
    delete pIndexMap_;
    pIndexMap_ = nullptr;
    delete pNameCounter_;
    pNameCounter_ = nullptr;
}

void Node::debugAddNode(Node const* pNode, std::string const& sName) {
    ORVO_CHECK(pIndexMap_);
    ORVO_CHECK(pIndexMap_->find(pNode) == pIndexMap_->end(),
               "pIndexMap_->find( pNode ) == pIndexMap_->end()");
    int& nextNumber = (*pNameCounter_)[sName];
    pIndexMap_->emplace(pNode, nextNumber);
    ++nextNumber;
}

void Node::debugRemoveNode(Node const* pNode) {
    // Found first: without the maps there is nothing to erase from.
    auto const it = indexEntry(pNode);
    pIndexMap_->erase(it);
}

void Node::debugRenumberNode(Node const* pNode, std::string const& sName) {
    auto const it = indexEntry(pNode);
    it->second = (*pNameCounter_)[sName]++;
}

int Node::index(Node const* pNode) { return indexEntry(pNode)->second; }

Node::IndexMap::iterator Node::indexEntry(Node const* pNode) {
    ORVO_CHECK(pIndexMap_);
    auto const it = pIndexMap_->find(pNode);
    ORVO_CHECK(it != pIndexMap_->end(), "pIndexMap_->find( pNode ) != pIndexMap_->end()");
    return it;
}

} // namespace ORVO::DataFlow
