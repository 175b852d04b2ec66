#include "orvo/data_flow/DataFlowLibrary.h"

#include "orvo/core/CoreLibrary.h"
#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/data_flow/librarian/NodeFactory.h"
#include "orvo/data_flow/librarian/NodeLibrarian.h"
#include "orvo/data_flow/librarian/NodeMetaData.h"
#include "orvo/data_flow/nodes/Node.h"

#include "tests/data_flow/controllers/SharedFailure.h"
#include "tests/data_flow/controllers/TestAccess.h"
#include "tests/data_flow/controllers/TestNodes.h"
#include "tests/support/CoreLayer.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <chrono>
#include <memory>
#include <optional>
#include <string>
#include <thread>

namespace ORVO::Test {

using DataFlow::AutoInitializer;
using DataFlow::Controller;
using DataFlow::Library;
using DataFlow::Node;
using DataFlow::NodeFactory;
using DataFlow::NodeLibrarian;
using DataFlow::NodeMetaData;
using DataFlow::NodeTargetType;
using DataFlow::internal::TestAccess;

namespace {
Node* createNode(NodeTargetType) { return ORVO_NEW Node("node"); }
} // namespace

TEST(DataFlowLibraryTest, StartsAndStops) {
    CoreLayer const core;
    EXPECT_FALSE(Library::isInitialized());
    Library::initialize();
    EXPECT_TRUE(Library::isInitialized());
    EXPECT_TRUE(NodeLibrarian::exists());
    Library::terminate();
    EXPECT_FALSE(Library::isInitialized());
    EXPECT_FALSE(NodeLibrarian::exists());
}

TEST(DataFlowLibraryTest, SecondStartIsRefused) {
    CoreLayer const core;
    AutoInitializer const dataFlow;
    ORVO_EXPECT_INTERNAL(Library::initialize(), "!bInitialized_");
    EXPECT_TRUE(Library::isInitialized());
}

TEST(DataFlowLibraryTest, StartNeedsTheCore) {
    ORVO_EXPECT_INTERNAL(Library::initialize(), "Core::Library::isInitialized()");
    EXPECT_FALSE(Library::isInitialized());
    EXPECT_FALSE(NodeLibrarian::exists());
}

TEST(DataFlowLibraryTest, StartThatFailsHalfWayLeavesNothingBehind) {
    CoreLayer const core;
    TestAccess::createLibrarian();
    ORVO_EXPECT_INTERNAL(Library::initialize(), "gpSingleton_ == 0");
    EXPECT_FALSE(Library::isInitialized());
    ORVO_EXPECT_INTERNAL(Node("n"), "pIndexMap_");
    TestAccess::destroyLibrarian();
    AutoInitializer const dataFlow;
    EXPECT_TRUE(Library::isInitialized());
}

TEST(DataFlowLibraryTest, StopWithoutStartIsRefused) {
    CoreLayer const core;
    ORVO_EXPECT_INTERNAL(Library::terminate(), "bInitialized_");
}

TEST(DataFlowLibraryTest, StopNeedsTheCore) {
    std::optional<CoreLayer> core(std::in_place);
    Library::initialize();
    core.reset();
    ORVO_EXPECT_INTERNAL(Library::terminate(), "Core::Library::isInitialized()");
    EXPECT_TRUE(Library::isInitialized());
    core.emplace();
    Library::terminate();
}

TEST(DataFlowLibraryTest, AutoInitializerKeepsTheLayerUpForAScope) {
    CoreLayer const core;
    {
        AutoInitializer const dataFlow;
        EXPECT_TRUE(Library::isInitialized());
    }
    EXPECT_FALSE(Library::isInitialized());
}

TEST(DataFlowLibraryTest, AutoInitializerPassesTheFailureOfTheStartOn) {
    ORVO_EXPECT_INTERNAL(AutoInitializer(), "Core::Library::isInitialized()");
    CoreLayer const core;
    AutoInitializer const dataFlow;
    ORVO_EXPECT_INTERNAL(AutoInitializer(), "!bInitialized_");
    EXPECT_TRUE(Library::isInitialized()) << "the failed one terminates nothing";
}

TEST(DataFlowLibraryTest, AutoInitializerSwallowsTheFailureOfTheStop) {
    CoreLayer const core;
    {
        AutoInitializer const dataFlow;
        Library::terminate();
    }
    EXPECT_FALSE(Library::isInitialized());
}

TEST(DataFlowLibraryTest, StopFreesTheRegisteredTypes) {
    CoreLayer const core;
    for (int i = 0; i < 2; ++i) {
        AutoInitializer const dataFlow;
        EXPECT_EQ(NodeLibrarian::Instance()->begin(), NodeLibrarian::Instance()->end());
        NodeLibrarian::Instance()->add(&createNode, ORVO_NEW NodeMetaData("n", "s", "v", 1, "text", "id"));
    }
    // What is left of tracked memory is compared at the end of every test.
}

TEST(DataFlowLibraryTest, StopFreesTheTypesWhileNodesStillHaveNames) {
    struct Factory : NodeFactory {
        explicit Factory(std::string& sLastWords) : sLastWords_(sLastWords) {}
        ~Factory() override {
            sLastWords_ = Node("last").debugId();
            EXPECT_TRUE(Library::isInitialized());
        }
        Node* create(NodeTargetType) override { return nullptr; }
        std::string& sLastWords_;
    };
    CoreLayer const core;
    std::string sLastWords;
    {
        AutoInitializer const dataFlow;
        NodeLibrarian::Instance()->add(ORVO_NEW Factory(sLastWords),
                                       ORVO_NEW NodeMetaData("n", "s", "v", 1, "text", "id"));
    }
    EXPECT_EQ("last [0]", sLastWords);
}

TEST(DataFlowLibraryTest, NamesAreCountedAnewAfterARestart) {
    CoreLayer const core;
    for (int i = 0; i < 2; ++i) {
        AutoInitializer const dataFlow;
        Node const node("blur");
        EXPECT_EQ("blur [0]", node.debugId());
    }
}

TEST(DataFlowLibraryTest, StopWaitsForFramesThatRun) {
    CoreLayer const core;
    Library::initialize();
    auto pController = std::make_unique<Controller>();
    auto pNode = std::make_unique<SumNode>("node", 0);
    Signal running;
    std::atomic<bool> bEnded{false};
    pNode->onRun_ = [&] {
        running.raise();
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
        bEnded = true;
    };
    pController->addNode(pNode.get());
    pController->setSinkNode(pNode.get());
    pController->processAsync();
    running.await();
    Library::terminate();
    EXPECT_TRUE(bEnded);
    EXPECT_EQ(1, pNode->result());
    pController.reset();
    pNode.reset();
}

TEST(DataFlowLibraryTest, StopOnTheThreadOfAFrameIsRefused) {
    CoreLayer const core;
    AutoInitializer const dataFlow;
    Controller controller;
    SumNode node("node", 0);
    node.onRun_ = [] { Library::terminate(); };
    controller.addNode(&node);
    controller.setSinkNode(node);
    controller.processAsync();
    ASSERT_TRUE(controller.wait(60.0, 0.001));
    expectShared<InternalException>([&] { controller.checkException(); },
                                    "!internal::FrameThreads::isFrameThread()");
    EXPECT_TRUE(Library::isInitialized());
}

} // namespace ORVO::Test
