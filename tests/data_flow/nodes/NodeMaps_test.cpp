// The numbers by which nodes of one name are told apart.

#include "orvo/core/CoreLibrary.h"
#include "orvo/data_flow/DataFlowLibrary.h"
#include "orvo/data_flow/nodes/Node.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <set>
#include <string>
#include <thread>
#include <vector>

namespace {

using namespace ORVO::DataFlow;

constexpr char const* pAlreadyThere = "pIndexMap_->find( pNode ) == pIndexMap_->end()";
constexpr char const* pNotThere = "pIndexMap_->find( pNode ) != pIndexMap_->end()";

/// Opens the operations on the maps.
struct Maps : Node {
    using Node::debugAddNode;
    using Node::debugRemoveNode;
    using Node::index;
    using Node::initializeNodeMaps;
    using Node::terminateNodeMaps;
};

class NodeMapsTest : public testing::Test {
protected:
    ORVO::Test::DataFlowLayers oLayers_;
};

TEST_F(NodeMapsTest, NodesOfOneNameAreNumbered) {
    auto spFirst = std::make_unique<Node>("blur");
    Node const oSecond("blur");
    Node const oOther("sharpen");
    EXPECT_EQ("blur [0]", spFirst->debugId());
    EXPECT_EQ("blur [1]", oSecond.debugId());
    EXPECT_EQ("sharpen [0]", oOther.debugId());
    spFirst.reset();
    Node const oThird("blur");
    EXPECT_EQ("blur [2]", oThird.debugId());
    EXPECT_EQ("blur [1]", oSecond.debugId());
}

TEST_F(NodeMapsTest, NoNumberIsGivenTwiceOnManyThreads) {
    constexpr int nThreads = 4;
    constexpr int nNodes = 200;
    std::vector<std::set<std::string>> aIds(nThreads);
    std::vector<std::thread> aThreads;
    aThreads.reserve(nThreads);
    for (std::set<std::string>& ids : aIds) {
        aThreads.emplace_back([&ids] {
            Node const kept("blur");
            ids.insert(kept.debugId());
            for (int i = 0; i < nNodes; ++i) {
                Node node("other");
                node.setName("blur");
                ids.insert(node.debugId());
            }
        });
    }
    std::set<std::string> all;
    for (int i = 0; i < nThreads; ++i) {
        aThreads[std::size_t(i)].join();
        all.merge(aIds[std::size_t(i)]);
    }
    EXPECT_EQ(std::size_t(nThreads * (nNodes + 1)), all.size());
    EXPECT_EQ("other [800]", Node("other").debugId());
}

TEST_F(NodeMapsTest, EmptyAndStrangeNamesAreNumberedToo) {
    Node const oEmpty("");
    Node const oSecondEmpty("");
    std::string const sLong(10000, 'x');
    Node const oLong(sLong);
    Node const oZero(std::string("a\0b", 3));
    EXPECT_EQ(" [0]", oEmpty.debugId());
    EXPECT_EQ(" [1]", oSecondEmpty.debugId());
    EXPECT_EQ(sLong + " [0]", oLong.debugId());
    EXPECT_EQ(std::string("a\0b [0]", 7), oZero.debugId());
}

TEST_F(NodeMapsTest, ARenamedNodeTakesAFreshNumber) {
    Node oFirst("blur");
    Node oSecond("blur");
    Node const oOther("glow");
    oFirst.setName("glow");
    EXPECT_EQ("glow", oFirst.name());
    EXPECT_EQ("glow [1]", oFirst.debugId());
    EXPECT_EQ("blur [1]", oSecond.debugId());
    oFirst.setName("blur");
    EXPECT_EQ("blur [2]", oFirst.debugId());
    oFirst.setName("blur");
    EXPECT_EQ("blur [3]", oFirst.debugId());
    oFirst.setName(oFirst.name());
    EXPECT_EQ("blur [4]", oFirst.debugId());
}

TEST_F(NodeMapsTest, ANodeIsAddedOnceAndRemovedOnce) {
    Node const oNode("n");
    ORVO_EXPECT_INTERNAL(Maps::debugAddNode(&oNode, "n"), pAlreadyThere);
    ORVO_EXPECT_INTERNAL(Maps::debugAddNode(&oNode, "other"), pAlreadyThere);
    EXPECT_EQ(0, Maps::index(&oNode));
    Maps::debugRemoveNode(&oNode);
    ORVO_EXPECT_INTERNAL(Maps::debugRemoveNode(&oNode), pNotThere);
    ORVO_EXPECT_INTERNAL((void)Maps::index(&oNode), pNotThere);
    ORVO_EXPECT_INTERNAL((void)oNode.debugId(), pNotThere);
    Maps::debugAddNode(&oNode, "n");
    EXPECT_EQ("n [1]", oNode.debugId());
    Node const oNext("other");
    EXPECT_EQ("other [0]", oNext.debugId()) << "a refused node takes no number";
}

TEST_F(NodeMapsTest, ANodeThatLostItsNumberDiesQuietly) {
    auto spNode = std::make_unique<Node>("n");
    Maps::debugRemoveNode(spNode.get());
    ORVO_EXPECT_INTERNAL(spNode->setName("m"), pNotThere);
    EXPECT_EQ("n", spNode->name());
    spNode.reset();
}

TEST_F(NodeMapsTest, TheMapsAreMadeOnce) {
    ORVO_EXPECT_INTERNAL(Maps::initializeNodeMaps(), "!pIndexMap_");
    Node const oNode("n");
    EXPECT_EQ("n [0]", oNode.debugId());
}

TEST(NodeMapsWithoutLibraryTest, NodesNeedTheLibrary) {
    ORVO_EXPECT_INTERNAL(Node("n"), "pIndexMap_");
    ORVO_EXPECT_INTERNAL(Maps::terminateNodeMaps(), "pIndexMap_");
    ORVO_EXPECT_INTERNAL((void)Maps::index(nullptr), "pIndexMap_");
    ORVO_EXPECT_INTERNAL(Maps::debugRemoveNode(nullptr), "pIndexMap_");
}

TEST(NodeMapsWithoutLibraryTest, NumbersStartAnewWithTheLibrary) {
    for (int iRound = 0; iRound < 2; ++iRound) {
        ORVO::Test::DataFlowLayers oLayers;
        Node const oNode("n");
        EXPECT_EQ("n [0]", oNode.debugId());
    }
}

TEST(NodeMapsWithoutLibraryTest, ANodeThatOutlivesTheLibraryReportsAndDiesQuietly) {
    std::optional<ORVO::Test::DataFlowLayers> oLayers(std::in_place);
    auto spNode = std::make_unique<Node>("n");
    oLayers.reset();
    ORVO_EXPECT_INTERNAL((void)spNode->debugId(), "pIndexMap_");
    ORVO_EXPECT_INTERNAL(spNode->setName("m"), "pIndexMap_");
    EXPECT_EQ("n", spNode->name());
    oLayers.emplace();
    Node const oOther("n");
    EXPECT_EQ("n [0]", oOther.debugId());
    spNode.reset();
    EXPECT_EQ("n [0]", oOther.debugId());
}

} // namespace
