#include "orvo/data_flow/librarian/NodeLibrarian.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/data_flow/librarian/CreateNodeFunctionNodeFactory.h"
#include "orvo/data_flow/librarian/NodeFactory.h"
#include "orvo/data_flow/librarian/NodeMetaData.h"
#include "orvo/data_flow/nodes/Node.h"

#include "tests/data_flow/controllers/TestAccess.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/Expect.h"
#include "tests/support/Slots.h"

#include <gtest/gtest.h>

#include <limits>
#include <new>
#include <vector>

namespace ORVO::Test {

using namespace DataFlow;
using DataFlow::internal::TestAccess;

namespace {

constexpr std::uint32_t nNoVersion = std::numeric_limits<std::uint32_t>::max() - 1;

/// Makes nodes that bear the name of their type; remembers the last target and counts its end.
class NamedFactory : public NodeFactory {
public:
    explicit NamedFactory(std::string const& sName) : sName_(sName) { ++nAlive; }
    ~NamedFactory() override { --nAlive; }
    Node* create(NodeTargetType eTarget) override {
        eLastTarget = eTarget;
        return ORVO_NEW Node(sName_);
    }
    static int nAlive;
    static NodeTargetType eLastTarget;

private:
    std::string sName_;
};
int NamedFactory::nAlive = 0;
NodeTargetType NamedFactory::eLastTarget = NODE_TARGET_CPU;

/// A record that counts its end.
class CountedMetaData : public NodeMetaData {
public:
    using NodeMetaData::NodeMetaData;
    ~CountedMetaData() override { ++nEnded; }
    static int nEnded;
};
int CountedMetaData::nEnded = 0;

Node* createCPUOnly(NodeTargetType eTarget) {
    return eTarget == NODE_TARGET_CPU ? ORVO_NEW Node("cpu only") : nullptr;
}

class NodeLibrarianTest : public ::testing::Test, protected DataFlowLayers {
protected:
    NodeLibrarian& librarian = *NodeLibrarian::Instance();

    /// Registers a type whose nodes are named `sNodeName`.
    NodeMetaData* add(std::string const& sNodeName, std::string const& name,
                      std::uint32_t iVersion = nNoVersion, std::string const& clientID = "id",
                      std::string const& nameSpace = "space", std::string const& vendor = "maker") {
        NodeMetaData* pMetaData =
            iVersion == nNoVersion
                ? ORVO_NEW CountedMetaData(name, nameSpace, vendor, "text", clientID)
                : ORVO_NEW CountedMetaData(name, nameSpace, vendor, iVersion, "text", clientID);
        librarian.add(ORVO_NEW NamedFactory(sNodeName), pMetaData);
        return pMetaData;
    }

    /// Name of the node that the operation makes; empty if it makes none.
    static std::string nameAndFree(Node* pNode) {
        std::string sName = pNode != nullptr ? pNode->name() : std::string();
        trackedDelete(pNode);
        return sName;
    }
    std::string made(NodeMetaData const& key) {
        return nameAndFree(librarian.createNodeByMetadata(&key, NODE_TARGET_CPU));
    }
    std::string madeByID(std::string const& clientID) {
        return nameAndFree(librarian.createNodeByClientID(clientID, NODE_TARGET_CPU));
    }
};

NodeMetaData key(std::string const& name) { return NodeMetaData(name, "space", "maker", "", ""); }
NodeMetaData key(std::string const& name, std::uint32_t iVersion) {
    return NodeMetaData(name, "space", "maker", iVersion, "", "");
}

} // namespace

TEST(NodeFactorySlotsTest, CreatesThroughTheSlotAfterTheDestructor) {
    EXPECT_EQ(2, slotOf(&NodeFactory::create));
}

// Creating nodes

TEST_F(NodeLibrarianTest, RecordWithAVersionAsksForExactlyThatOne) {
    add("blur 1", "blur", 1);
    add("blur 2", "blur", 2);
    EXPECT_EQ("blur 1", made(key("blur", 1)));
    EXPECT_EQ("blur 2", made(key("blur", 2)));
    EXPECT_EQ("", made(key("blur", 3)));
    EXPECT_EQ("", made(key("blur", 0)));
}

TEST_F(NodeLibrarianTest, RecordWithoutAVersionAsksForTheLatest) {
    add("blur 2", "blur", 2);
    add("blur 10", "blur", 10);
    add("blur 1", "blur", 1);
    EXPECT_EQ("blur 10", made(key("blur"))) << "versions are numbers, not texts";
    add("blur last", "blur", std::numeric_limits<std::uint32_t>::max());
    EXPECT_EQ("blur last", made(key("blur")));
}

TEST_F(NodeLibrarianTest, RecordWithoutAVersionFindsATypeWithoutOne) {
    add("plain", "plain");
    EXPECT_EQ("plain", made(key("plain")));
    EXPECT_EQ("plain", made(key("plain", 0))) << "no version counts as version 0";
}

TEST_F(NodeLibrarianTest, NeighbourOfTheNameIsNotTaken) {
    add("blur", "blur", 1);
    EXPECT_EQ("", made(key("blurb"))) << "the step back lands on blur";
    EXPECT_EQ("", made(key("blu"))) << "there is no step back";
    EXPECT_EQ("", made(NodeMetaData("blur", "space2", "maker", "", "")));
    EXPECT_EQ("", made(NodeMetaData("blur", "space", "maker2", "", "")));
    EXPECT_EQ("blur", made(key("blur")));
}

TEST_F(NodeLibrarianTest, NullRecordAndEmptyCatalogueYieldNull) {
    EXPECT_EQ(nullptr, librarian.createNodeByMetadata(nullptr, NODE_TARGET_CPU));
    EXPECT_EQ("", made(key("blur")));
    EXPECT_EQ("", made(key("blur", 1)));
    EXPECT_EQ("", madeByID("blur"));
}

TEST_F(NodeLibrarianTest, ClientIDFindsTheFirstThatWasRegistered) {
    add("z first", "z", 1, "shared");
    add("a second", "a", 1, "shared");
    add("other", "other", 1, "other id");
    EXPECT_EQ("z first", madeByID("shared"));
    EXPECT_EQ("other", madeByID("other id"));
    EXPECT_EQ("", madeByID("Shared"));
    EXPECT_EQ("", madeByID(""));
}

TEST_F(NodeLibrarianTest, ClientIDKeepsTheVersionOfItsRecord) {
    add("blur 1", "blur", 1, "old");
    add("blur 2", "blur", 2, "new");
    EXPECT_EQ("blur 1", madeByID("old"));
    EXPECT_EQ("blur 2", madeByID("new"));
}

TEST_F(NodeLibrarianTest, ClientIDOfARecordWithoutAVersionGivesTheLatest) {
    add("blur none", "blur", nNoVersion, "any");
    add("blur 4", "blur", 4, "four");
    EXPECT_EQ("blur 4", madeByID("any"));
}

TEST_F(NodeLibrarianTest, TargetIsHandedThrough) {
    add("node", "node", 1, "id");
    NamedFactory::eLastTarget = NODE_TARGET_CPU;
    nameAndFree(librarian.createNodeByClientID("id", NODE_TARGET_GPU));
    EXPECT_EQ(NODE_TARGET_GPU, NamedFactory::eLastTarget);
    EXPECT_EQ(0, static_cast<int>(NODE_TARGET_CPU));
    EXPECT_EQ(1, static_cast<int>(NODE_TARGET_GPU));
}

TEST_F(NodeLibrarianTest, CreationFunctionMayAnswerNullForATarget) {
    librarian.add(&createCPUOnly, ORVO_NEW NodeMetaData("cpu", "space", "maker", 1, "text", "cpu"));
    EXPECT_EQ("cpu only", nameAndFree(librarian.createNodeByClientID("cpu", NODE_TARGET_CPU)));
    EXPECT_EQ(nullptr, librarian.createNodeByClientID("cpu", NODE_TARGET_GPU));
    EXPECT_EQ(nullptr, librarian.createNodeByClientID("cpu", static_cast<NodeTargetType>(9)));
}

// Adding

TEST_F(NodeLibrarianTest, RecordsAreListedInTheOrderOfRegistration) {
    NodeMetaData* const pZ = add("z", "z", 1);
    NodeMetaData* const pA = add("a", "a", 1);
    NodeMetaData* const pM = add("m", "m", 1);
    EXPECT_EQ((std::vector<NodeMetaData*>{pZ, pA, pM}),
              (std::vector<NodeMetaData*>(librarian.begin(), librarian.end())));
}

TEST_F(NodeLibrarianTest, DuplicateIsRefusedAndFreed) {
    add("first", "blur", 1, "id");
    int const nFactories = NamedFactory::nAlive;
    CountedMetaData::nEnded = 0;
    ORVO_EXPECT_PARAMETER(add("second", "blur", 1, "another id"), "!bDuplicate");
    EXPECT_EQ(nFactories, NamedFactory::nAlive);
    EXPECT_EQ(1, CountedMetaData::nEnded);
    EXPECT_EQ(1, librarian.end() - librarian.begin());
    EXPECT_EQ("first", made(key("blur", 1)));
    EXPECT_EQ("", madeByID("another id"));
}

TEST_F(NodeLibrarianTest, NoVersionIsADuplicateOfVersionZero) {
    add("none", "blur");
    ORVO_EXPECT_PARAMETER(add("zero", "blur", 0), "!bDuplicate");
    add("zero", "sharpen", 0);
    ORVO_EXPECT_PARAMETER(add("none", "sharpen"), "!bDuplicate");
}

TEST_F(NodeLibrarianTest, DifferenceInAnyPartOfTheIdentityIsNoDuplicate) {
    add("base", "n", 1, "1", "s", "v");
    add("name", "N", 1, "2", "s", "v");
    add("nameSpace", "n", 1, "3", "S", "v");
    add("vendor", "n", 1, "4", "s", "V");
    add("version", "n", 2, "5", "s", "v");
    EXPECT_EQ(5, librarian.end() - librarian.begin());
}

TEST_F(NodeLibrarianTest, NullsAreRefusedAndStayTheCallers) {
    NodeMetaData* const pMetaData = ORVO_NEW NodeMetaData("n", "s", "v", "text", "id");
    NodeFactory* const pFactory = ORVO_NEW NamedFactory("n");
    ORVO_EXPECT_INTERNAL(librarian.add(static_cast<NodeFactory*>(nullptr), pMetaData),
                         "Enforce pNodeFactory != NULL");
    ORVO_EXPECT_INTERNAL(librarian.add(pFactory, nullptr), "Enforce pMetaData != NULL");
    ORVO_EXPECT_INTERNAL(librarian.add(static_cast<Node* (*)(NodeTargetType)>(nullptr), pMetaData),
                         "Enforce pCreateFunction != NULL");
    ORVO_EXPECT_INTERNAL(librarian.add(&createCPUOnly, nullptr), "Enforce pMetaData != NULL");
    ORVO_EXPECT_INTERNAL(CreateNodeFunctionNodeFactory(nullptr), "Enforce pCreateFunction != NULL");
    EXPECT_EQ(librarian.begin(), librarian.end());
    librarian.add(pFactory, pMetaData);
    EXPECT_EQ("n", madeByID("id"));
}

TEST_F(NodeLibrarianTest, RecordIsFreedIfThereIsNoMemoryForItsFactory) {
    NodeMetaData* const pMetaData = ORVO_NEW CountedMetaData("n", "s", "v", "text", "id");
    CountedMetaData::nEnded = 0;
    {
        Core::AllocationFailure const failure(1);
        EXPECT_THROW(librarian.add(&createCPUOnly, pMetaData), std::bad_alloc);
    }
    EXPECT_EQ(1, CountedMetaData::nEnded);
    EXPECT_EQ(librarian.begin(), librarian.end());
    librarian.add(&createCPUOnly, ORVO_NEW NodeMetaData("n", "s", "v", "text", "id"));
    EXPECT_EQ("cpu only", madeByID("id"));
}

TEST_F(NodeLibrarianTest, PlainlyAllocatedObjectsMayBeHandedOver) {
    librarian.add(new NamedFactory("plain"), new NodeMetaData("n", "s", "v", "text", "id"));
    EXPECT_EQ("plain", madeByID("id"));
}

TEST_F(NodeLibrarianTest, ClearAllFreesEverythingAndTheCatalogueWorksOn) {
    int const nFactories = NamedFactory::nAlive;
    add("a", "a", 1);
    add("b", "b", 1);
    CountedMetaData::nEnded = 0;
    librarian.clearAll();
    EXPECT_EQ(nFactories, NamedFactory::nAlive);
    EXPECT_EQ(2, CountedMetaData::nEnded);
    EXPECT_EQ(librarian.begin(), librarian.end());
    EXPECT_EQ("", made(key("a")));
    add("a again", "a", 1);
    EXPECT_EQ("a again", made(key("a")));
    librarian.clearAll();
    librarian.clearAll();
}

TEST_F(NodeLibrarianTest, ClearAllFreesTheFactoriesInTheOrderOfTheCatalogue) {
    struct Logging : NamedFactory {
        Logging(std::string const& sName, std::vector<std::string>& aEnded)
            : NamedFactory(sName), sName_(sName), aEnded_(aEnded) {}
        ~Logging() override { aEnded_.push_back(sName_); }
        std::string sName_;
        std::vector<std::string>& aEnded_;
    };
    std::vector<std::string> aEnded;
    for (char const* const pName : {"z", "a", "m"}) {
        librarian.add(ORVO_NEW Logging(pName, aEnded), ORVO_NEW NodeMetaData(pName, "s", "v", "", ""));
    }
    librarian.clearAll();
    EXPECT_EQ((std::vector<std::string>{"a", "m", "z"}), aEnded);
}

// The singleton

TEST_F(NodeLibrarianTest, SecondLibrarianIsRefused) {
    add("kept", "kept", 1);
    ORVO_EXPECT_INTERNAL(TestAccess::createLibrarian(), "gpSingleton_ == 0");
    EXPECT_EQ("kept", made(key("kept", 1)));
}

TEST(NodeLibrarianLifeTest, ThereIsNoneBeforeCreateAndAfterDestroy) {
    EXPECT_FALSE(NodeLibrarian::exists());
    ORVO_EXPECT_INTERNAL(NodeLibrarian::Instance(), "Enforce gpSingleton_ != NULL");
    ORVO_EXPECT_INTERNAL(TestAccess::destroyLibrarian(), "Enforce gpSingleton_ != NULL");
    TestAccess::createLibrarian();
    EXPECT_TRUE(NodeLibrarian::exists());
    NodeLibrarian* const pLibrarian = NodeLibrarian::Instance();
    EXPECT_EQ(pLibrarian, NodeLibrarian::Instance());
    TestAccess::destroyLibrarian();
    EXPECT_FALSE(NodeLibrarian::exists());
    ORVO_EXPECT_INTERNAL(NodeLibrarian::Instance(), "Enforce gpSingleton_ != NULL");
}

TEST(NodeLibrarianLifeTest, ClientIDsNeedTheLibrarianOfTheProcess) {
    auto const pLone = TestAccess::makeLoneLibrarian();
    ORVO_EXPECT_INTERNAL(pLone->createNodeByClientID("id", NODE_TARGET_CPU), "Enforce gpSingleton_ != NULL");
}

TEST(NodeLibrarianLifeTest, DestroyFreesWhatWasRegistered) {
    int const nFactories = NamedFactory::nAlive;
    CountedMetaData::nEnded = 0;
    TestAccess::createLibrarian();
    NodeLibrarian::Instance()->add(ORVO_NEW NamedFactory("n"),
                                   ORVO_NEW CountedMetaData("n", "s", "v", "text", "id"));
    TestAccess::destroyLibrarian();
    EXPECT_EQ(nFactories, NamedFactory::nAlive);
    EXPECT_EQ(1, CountedMetaData::nEnded);
}

} // namespace ORVO::Test
