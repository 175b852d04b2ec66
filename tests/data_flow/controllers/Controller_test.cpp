#include "orvo/data_flow/controllers/Controller.h"

#include "orvo/core/exceptions/InternalException.h"

#include "tests/data_flow/controllers/SharedFailure.h"
#include "tests/data_flow/controllers/TestNodes.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/Expect.h"
#include "tests/support/Slots.h"

#include <gtest/gtest.h>
#include <pthread.h>
#include <tbb/info.h>

#include <stdexcept>
#include <thread>

namespace ORVO::Test {

using DataFlow::Connect;
using DataFlow::Controller;
using DataFlow::Node;

namespace {

// Taken while the program is loaded, before any test sets it.
std::size_t const nInitialThreads = Controller::getNumberOfThreads();
std::size_t const nInitialGrain = Controller::getMinimumGrainSize();

class ControllerTest : public ::testing::Test, protected DataFlowLayers {};

std::vector<Node*> listOf(Controller const& controller) {
    return std::vector<Node*>(controller.nodesBegin(), controller.nodesEnd());
}

/// Runs a frame on a thread with a stack of 256 KiB.
void processOnSmallStack(Controller& controller) {
    pthread_attr_t oSmall;
    pthread_attr_init(&oSmall);
    pthread_attr_setstacksize(&oSmall, std::size_t(256) << 10);
    pthread_t oThread;
    auto const run = [](void* pController) -> void* {
        static_cast<Controller*>(pController)->process();
        return nullptr;
    };
    ASSERT_EQ(0, pthread_create(&oThread, &oSmall, run, &controller));
    pthread_join(oThread, nullptr);
    pthread_attr_destroy(&oSmall);
}

using Nodes = std::vector<Node*>;
using Names = std::vector<std::string>;

} // namespace

TEST(ControllerSlotsTest, HasItsOperationsInOrder) {
    // The destructor stands first.
    EXPECT_EQ(2, slotOf(&Controller::addNode));
    EXPECT_EQ(3, slotOf(&Controller::removeNode));
    EXPECT_EQ(4, slotOf(&Controller::removeAllNodes));
    EXPECT_EQ(5, slotOf(&Controller::findUnconnectedNodes));
    EXPECT_EQ(6, slotOf(&Controller::process));
    EXPECT_EQ(7, slotOf(&Controller::processAsync));
    EXPECT_EQ(8, slotOf(&Controller::cancelProcess));
    EXPECT_EQ(9, slotOf(&Controller::notifyOfCompletion));
    EXPECT_EQ(10, slotOf(&Controller::threadsAvailable));
    EXPECT_EQ(11, slotOf(&Controller::stop));
    EXPECT_EQ(12, slotOf(&Controller::registerProcessingCompletedCallback));
    EXPECT_EQ(13, slotOf(&Controller::flushGraph));
    EXPECT_EQ(14, slotOf(&Controller::wait));
    EXPECT_EQ(15, slotOf(&Controller::sleep));
    EXPECT_EQ(16, slotOf(&Controller::processFrameFunction));
}

// The list of nodes

TEST_F(ControllerTest, StartsEmptyAndStopped) {
    Controller controller;
    EXPECT_TRUE(listOf(controller).empty());
    EXPECT_EQ(nullptr, controller.getSinkNode());
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
}

TEST_F(ControllerTest, AddNodeAppendsAndTellsTheNodeItsController) {
    Controller controller;
    SumNode first("first", 0);
    SumNode second("second", 0);
    EXPECT_TRUE(controller.addNode(&first));
    EXPECT_TRUE(controller.addNode(&second));
    EXPECT_EQ((Nodes{&first, &second}), listOf(controller));
    EXPECT_EQ(&controller, first.controller());
    EXPECT_EQ(&controller, second.controller());
}

TEST_F(ControllerTest, AddNodeRefusesNull) {
    Controller controller;
    ORVO_EXPECT_INTERNAL(controller.addNode(nullptr), "Enforce pNode != NULL");
    EXPECT_TRUE(listOf(controller).empty());
}

TEST_F(ControllerTest, AddNodeThatFailsLeavesTheListAsItWas) {
    struct Refusing : SumNode {
        Refusing() : SumNode("refusing", 0) {}
        void setController(Controller&) override { throw std::runtime_error("no"); }
    };
    Controller controller;
    Refusing node;
    EXPECT_THROW(controller.addNode(&node), std::runtime_error);
    EXPECT_TRUE(listOf(controller).empty());
}

TEST_F(ControllerTest, RemoveNodeTakesTheFirstOccurrenceAndKeepsTheOrder) {
    Controller controller;
    SumNode a("a", 0);
    SumNode b("b", 0);
    SumNode c("c", 0);
    for (Node* pNode : Nodes{&a, &b, &c, &b}) {
        controller.addNode(pNode);
    }
    EXPECT_TRUE(controller.removeNode(&b));
    EXPECT_EQ((Nodes{&a, &c, &b}), listOf(controller));
    EXPECT_EQ(&controller, b.controller());
}

TEST_F(ControllerTest, RemoveNodeOfAnUnknownNodeIsFalse) {
    Controller controller;
    SumNode known("known", 0);
    SumNode unknown("unknown", 0);
    controller.addNode(&known);
    EXPECT_FALSE(controller.removeNode(&unknown));
    EXPECT_FALSE(controller.removeNode(nullptr));
    EXPECT_EQ((Nodes{&known}), listOf(controller));
}

TEST_F(ControllerTest, RemoveAllNodesClearsTheList) {
    Controller controller;
    Chain chain(controller, 3);
    EXPECT_TRUE(controller.removeAllNodes());
    EXPECT_TRUE(listOf(controller).empty());
}

TEST_F(ControllerTest, NothingCanBeEditedDuringAFrame) {
    Controller controller;
    Chain chain(controller, 2);
    SumNode other("other", 0);
    Nodes const before = listOf(controller);
    bool bLooked = false;
    chain[1].onRun_ = [&] {
        EXPECT_EQ(1, static_cast<int>(controller.controllerStatus()));
        EXPECT_FALSE(controller.addNode(&other));
        EXPECT_FALSE(controller.removeNode(&chain[0]));
        EXPECT_FALSE(controller.removeAllNodes());
        EXPECT_FALSE(controller.registerProcessingCompletedCallback(nullptr, nullptr));
        bLooked = true;
    };
    controller.process();
    EXPECT_TRUE(bLooked);
    EXPECT_EQ(before, listOf(controller));
    EXPECT_EQ(nullptr, other.controller());
}

TEST_F(ControllerTest, NothingCanBeEditedAfterACancelUntilItIsWaitedFor) {
    Controller controller;
    SumNode node("node", 0);
    controller.cancelProcess();
    EXPECT_EQ(2, static_cast<int>(controller.controllerStatus()));
    EXPECT_FALSE(controller.addNode(&node));
    EXPECT_FALSE(controller.removeAllNodes());
    EXPECT_TRUE(controller.wait(1.0, 0.001));
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
    EXPECT_TRUE(controller.addNode(&node));
}

TEST_F(ControllerTest, SinkCanBeGivenByPointerAndByReference) {
    Controller controller;
    SumNode a("a", 0);
    SumNode b("b", 0);
    controller.setSinkNode(&a);
    EXPECT_EQ(&a, controller.getSinkNode());
    controller.setSinkNode(b);
    EXPECT_EQ(&b, controller.getSinkNode());
    controller.setSinkNode(nullptr);
    EXPECT_EQ(nullptr, controller.getSinkNode());
}

TEST_F(ControllerTest, FindUnconnectedNodesListsEachGapOnceInOrder) {
    Controller controller;
    SumNode source("source", 0, 2);     // one output without consumer
    SumNode middle("middle", 1, 1);     // no gap
    SumNode lonely("lonely", 1, 1);     // gaps on both sides: once
    SumNode closed("closed", 1, 0);     // no outputs, its input connected: no gap
    SumNode starving("starving", 2, 0); // inputs without producer only
    SumNode bare("bare", 0, 0);         // no connectors
    Connect(source.out(0), middle.in());
    Connect(middle.out(), closed.in());
    for (Node* pNode : Nodes{&starving, &bare, &closed, &lonely, &middle, &source}) {
        controller.addNode(pNode);
    }
    EXPECT_EQ((Nodes{&starving, &lonely, &source}), controller.findUnconnectedNodes());
}

// The synchronous frame

TEST_F(ControllerTest, ProcessWithoutSinkFails) {
    Controller controller;
    ORVO_EXPECT_INTERNAL(controller.process(), "pSink");
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
}

TEST_F(ControllerTest, ProcessPullsAChain) {
    Controller controller;
    Chain chain(controller, 5);
    controller.process();
    EXPECT_EQ(5, chain.sink().result());
    EXPECT_EQ(5, chain.runs());
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
    EXPECT_FALSE(chain[0].out().hasData()) << "data moves on to the consumer";
}

TEST_F(ControllerTest, ProducersRunDepthFirstInInputOrderOnTheCallersThread) {
    //   a1   b1
    //   |    |
    //   a2   b2
    //     \ /
    //     sink
    Controller controller;
    RunLog log;
    SumNode a1("a1", 0), a2("a2", 1), b1("b1", 0), b2("b2", 1), sink("sink", 2);
    Connect(a1.out(), a2.in());
    Connect(b1.out(), b2.in());
    Connect(b2.out(), sink.in(1));
    Connect(a2.out(), sink.in(0));
    std::thread::id const caller = std::this_thread::get_id();
    for (SumNode* pNode : {&b1, &sink, &a1, &b2, &a2}) {
        controller.addNode(pNode);
        pNode->pLog_ = &log;
        pNode->onRun_ = [caller] { EXPECT_EQ(caller, std::this_thread::get_id()); };
    }
    controller.setSinkNode(&sink);
    controller.process();
    EXPECT_EQ((Names{"a1", "a2", "b1", "b2", "sink"}), log.take());
    EXPECT_EQ(5, sink.result());
}

TEST_F(ControllerTest, DiamondRunsItsSourceOnce) {
    Controller controller;
    SumNode source("source", 0, 2, 10), left("left", 1, 1, 1), right("right", 1, 1, 2), sink("sink", 2, 1, 0);
    Connect(source.out(0), left.in());
    Connect(source.out(1), right.in());
    Connect(left.out(), sink.in(0));
    Connect(right.out(), sink.in(1));
    for (SumNode* pNode : {&source, &left, &right, &sink}) {
        controller.addNode(pNode);
    }
    controller.setSinkNode(&sink);
    controller.process();
    EXPECT_EQ(23, sink.result());
    EXPECT_EQ(1, source.nRuns_);
}

TEST_F(ControllerTest, ProducerThatHoldsDataIsNotPulled) {
    Controller controller;
    Chain chain(controller, 3);
    chain[1].out().setData(ORVO_NEW Number{40});
    controller.process();
    EXPECT_EQ(41, chain.sink().result());
    EXPECT_EQ(0, chain[0].nRuns_);
    EXPECT_EQ(0, chain[1].nRuns_);
}

TEST_F(ControllerTest, NodeThatHoldsItsResultDoesNotRunAgain) {
    Controller controller;
    Chain chain(controller, 2);
    controller.process();
    chain[0].iOwn_ = 100;
    controller.process();
    EXPECT_EQ(2, chain.sink().result());
    EXPECT_EQ(1, chain.sink().nRuns_);
    EXPECT_TRUE(controller.flushGraph());
    controller.process();
    EXPECT_EQ(101, chain.sink().result());
}

TEST_F(ControllerTest, InputWithoutProducerFails) {
    Controller controller;
    SumNode source("source", 0), sink("sink", 2);
    Connect(source.out(), sink.in(0));
    controller.addNode(&source);
    controller.addNode(&sink);
    controller.setSinkNode(&sink);
    ORVO_EXPECT_INTERNAL(controller.process(), "producerOutput");
    EXPECT_EQ(1, source.nRuns_) << "inputs are pulled in order";
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
}

TEST_F(ControllerTest, OutputWithoutNodeFails) {
    Controller controller;
    DataFlow::ConstOutput<Number> orphan("orphan", nullptr);
    SumNode sink("sink", 1);
    Connect(orphan, sink.in());
    controller.addNode(&sink);
    controller.setSinkNode(&sink);
    ORVO_EXPECT_INTERNAL(controller.process(), "producer");
    orphan.setData(ORVO_NEW Number{6});
    controller.process();
    EXPECT_EQ(7, sink.result()) << "an output that holds data needs no node";
}

TEST_F(ControllerTest, FailureOfANodeReachesTheCallerAsItIs) {
    Controller controller;
    Chain chain(controller, 3);
    chain[1].onRun_ = [] { throw std::runtime_error("broken"); };
    EXPECT_THROW(controller.process(), std::runtime_error);
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
    EXPECT_TRUE(chain[1].isProcessing()) << "until it is flushed";
    EXPECT_FALSE(chain[2].isProcessing());

    // Its lock is free: the next frame neither waits for it nor runs it.
    chain[1].onRun_ = nullptr;
    controller.process();
    EXPECT_EQ(-1, chain.sink().result());

    EXPECT_TRUE(controller.flushGraph());
    EXPECT_FALSE(chain[1].isProcessing());
    controller.process();
    EXPECT_EQ(3, chain.sink().result());
}

TEST_F(ControllerTest, StopDuringAFrameEndsThePull) {
    Controller controller;
    Chain chain(controller, 4);
    chain[1].onRun_ = [&] { controller.stop(); };
    controller.process();
    EXPECT_EQ(2, chain.runs());
    EXPECT_EQ(-1, chain.sink().result());
}

TEST_F(ControllerTest, StoppedFrameDoesNotLookAtTheInputsThatRemain) {
    Controller controller;
    SumNode first("first", 0), second("second", 0), sink("sink", 2);
    Connect(first.out(), sink.in(0));
    Connect(second.out(), sink.in(1));
    controller.setSinkNode(&sink);
    first.onRun_ = [&] { controller.stop(); };
    controller.process();
    EXPECT_EQ(1, first.nRuns_);
    EXPECT_EQ(0, second.nRuns_);
}

TEST_F(ControllerTest, ReadyNodeRunsWithoutAFrame) {
    OpenController controller;
    Chain chain(controller, 2);
    controller.processRecursive(&chain[1]);
    EXPECT_EQ(0, chain.runs()) << "without a frame no producer is pulled";
    controller.processRecursive(&chain[0]);
    EXPECT_EQ(1, chain[0].nRuns_);
    ORVO_EXPECT_INTERNAL(controller.processRecursive(nullptr), "Enforce pNode != NULL");
}

TEST_F(ControllerTest, SecondThreadWaitsForANodeThatIsRunning) {
    OpenController controller;
    Chain chain(controller, 1);
    Signal running;
    Signal goOn;
    std::atomic<bool> bDone{false};
    chain[0].onRun_ = [&] {
        running.raise();
        goOn.await();
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
        bDone = true;
    };
    std::thread first([&] { controller.processRecursive(&chain[0]); });
    running.await();
    EXPECT_TRUE(chain[0].isProcessing());
    goOn.raise();
    controller.processRecursive(&chain[0]);
    EXPECT_TRUE(bDone) << "returned before the other thread had finished";
    first.join();
    EXPECT_EQ(1, chain[0].nRuns_);
}

TEST_F(ControllerTest, LongChainNeedsNoDeepStack) {
    // A walk that called itself would need several hundred bytes for each node.
    constexpr int nNodes = 10000;
    Controller controller;
    Chain chain(controller, nNodes);
    processOnSmallStack(controller);
    EXPECT_EQ(nNodes, chain.sink().result());
}

TEST_F(ControllerTest, CycleIsRefusedAndTheGraphStaysUsable) {
    Controller controller;
    SumNode a("a", 1), b("b", 1), source("source", 0);
    Connect(a.out(), b.in());
    Connect(b.out(), a.in());
    for (SumNode* pNode : {&a, &b, &source}) {
        controller.addNode(pNode);
    }
    controller.setSinkNode(&b);
    ORVO_EXPECT_INTERNAL(controller.process(), "Graph contains a cycle");
    Connect(source.out(), a.in());
    controller.process();
    EXPECT_EQ(3, b.result());
}

TEST_F(ControllerTest, LongChainThatEndsInACycleIsRefused) {
    Controller controller;
    Chain chain(controller, 3000);
    SumNode join("join", 1), knot("knot", 1);
    Connect(join.out(), knot.in());
    Connect(knot.out(), join.in());
    chain[0].disconnect();
    Connect(knot.out(), chain[1].in()); // takes the output away from the join, which now lacks a producer
    ORVO_EXPECT_INTERNAL(controller.process(), "producerOutput");
    SumNode loop("loop", 1, 2);
    Connect(loop.out(0), loop.in());
    Connect(loop.out(1), chain[1].in());
    ORVO_EXPECT_INTERNAL(controller.process(), "Graph contains a cycle");
}

TEST_F(ControllerTest, SynchronousFrameKeepsAnOldExceptionForWhoeverChecks) {
    Controller controller;
    Chain chain(controller, 2);
    controller.saveException(new InternalException("file", 1, "old"));
    controller.process();
    EXPECT_EQ(2, chain.sink().result());
    expectShared<InternalException>([&] { controller.checkException(); }, "old");

    // A node that runs slices checks at their end.
    EXPECT_TRUE(controller.flushGraph());
    chain[1].setSlices(4);
    controller.saveException(new InternalException("file", 1, "older"));
    expectShared<InternalException>([&] { controller.process(); }, "older");
    EXPECT_EQ(4, chain[1].nItemsDone_);
    EXPECT_EQ(-1, chain.sink().result());
}

TEST_F(ControllerTest, FlushGraphFlushesEveryNodeInListOrder) {
    struct Flushed : SumNode {
        using SumNode::SumNode;
        void flush() override { pLog_->add(name()); }
    };
    Controller controller;
    RunLog log;
    Flushed b("b", 0), a("a", 0), c("c", 0);
    for (Flushed* pNode : {&b, &a, &c}) {
        pNode->pLog_ = &log;
        controller.addNode(pNode);
    }
    EXPECT_TRUE(controller.flushGraph());
    EXPECT_EQ((Names{"b", "a", "c"}), log.take());
}

TEST_F(ControllerTest, FlushGraphEmptiesOutputsThatAreNotBound) {
    Controller controller;
    SumNode free("free", 0), bound("bound", 0, 1);
    Number client{7};
    bound.out().setBoundData(&client);
    free.out().setData(ORVO_NEW Number{1});
    free.setProcessing(true);
    controller.addNode(&free);
    controller.addNode(&bound);
    EXPECT_TRUE(controller.flushGraph());
    EXPECT_FALSE(free.out().hasData());
    EXPECT_FALSE(free.isProcessing());
    EXPECT_TRUE(bound.out().hasData());
}

TEST_F(ControllerTest, FlushGraphIsFalseIfTheStopIsRefused) {
    struct Unstoppable : Controller {
        void stop() override {}
    };
    Unstoppable controller;
    SumNode node("node", 0);
    controller.addNode(&node);
    node.out().setData(ORVO_NEW Number{1});
    controller.cancelProcess();
    EXPECT_FALSE(controller.flushGraph());
    EXPECT_TRUE(node.out().hasData());
}

// Settings

TEST_F(ControllerTest, SettingsHaveTheirInitialValues) {
    EXPECT_EQ(static_cast<std::size_t>(tbb::info::default_concurrency()) + 1, nInitialThreads);
    EXPECT_EQ(1u, nInitialGrain);
}

TEST_F(ControllerTest, SettersAnswerTrueAndTheValuesAreReported) {
    SettingsScope const settings;
    Controller controller;
    for (std::size_t const nThreads : {0u, 1u, 2u, 8u}) {
        EXPECT_TRUE(Controller::setNumberOfThreads(nThreads));
        EXPECT_EQ(nThreads, Controller::getNumberOfThreads());
        EXPECT_EQ(nThreads, controller.threadsAvailable());
    }
    for (std::size_t const nUnits : {0u, 1u, 65536u}) {
        EXPECT_TRUE(Controller::setMinimumGrainSize(nUnits));
        EXPECT_EQ(nUnits, Controller::getMinimumGrainSize());
    }
}

TEST_F(ControllerTest, SchedulerSetUpAlwaysSucceeds) {
    OpenController controller;
    EXPECT_TRUE(controller.initializeScheduler(0));
    EXPECT_TRUE(controller.initializeScheduler(4));
    controller.terminateScheduler();
    EXPECT_TRUE(controller.initializeScheduler(4));
}

} // namespace ORVO::Test
