#include "orvo/image_flow/ImageFlowLibrary.h"

#include "orvo/core/CoreLibrary.h"
#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/DataFlowLibrary.h"
#include "orvo/data_flow/librarian/NodeLibrarian.h"
#include "orvo/data_flow/librarian/NodeMetaData.h"
#include "orvo/image_flow/filters/CPU2GPU.h"
#include "orvo/image_flow/filters/FastBilateralFilterCPUNode.h"
#include "orvo/image_flow/filters/FastBilateralFilterGPU.h"
#include "orvo/image_flow/filters/LABToRGBCPU.h"
#include "orvo/image_flow/filters/MirelCheckerBoardGPU.h"
#include "orvo/image_flow/filters/MirelGamutTestCompositeGPU.h"
#include "orvo/image_flow/filters/RGBToLABCPU.h"
#include "orvo/image_flow/filters/SimpleBilateralFilterCPU.h"
#include "orvo/image_flow/filters/VantleFilterCPU.h"
#include "orvo/image_flow/filters/VantleFilterGPU.h"
#include "orvo/image_flow/sources/ImageCPUInput.h"
#include "orvo/image_flow/sources/ImageGPUInput.h"
#include "orvo/image_flow/sources/ImageGPUOutput.h"
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/VideoMemoryConfiguration.h"
#include "orvo/ogl/Context.h"
#include "orvo/ogl/OGLLibrary.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

#include <iterator>
#include <memory>
#include <new>
#include <typeinfo>

namespace ORVO {

namespace {

using DataFlow::Node;
using DataFlow::NodeLibrarian;
using DataFlow::NodeMetaData;
using DataFlow::NodeTargetType;
using ImageFlow::Library;
using NodePtr = std::unique_ptr<Node, ORVODeleter<Node>>;

void initializeRuntime() {
    ImageRuntime::Library::initialize(static_cast<OGL::Context const*>(nullptr),
                                      VideoMemory::Configuration());
}

/// The layers below image flow, up for a scope.
struct LowerLayers : ORVO::Test::ImageRuntimeLayers {
    DataFlow::AutoInitializer oDataFlow_;
};

NodePtr create(char const* clientID, int target) {
    return NodePtr(
        NodeLibrarian::Instance()->createNodeByClientID(clientID, static_cast<NodeTargetType>(target)));
}

TEST(ImageFlowLibraryTest, needsTheLowerLayers) {
    ORVO_EXPECT_INTERNAL(Library::terminate(), "ImageFlow is not initialized!");
    ORVO_EXPECT_INTERNAL(Library::initialize(false), "Core::Library::isInitialized()");
    Core::AutoInitializer core;
    ORVO_EXPECT_INTERNAL(Library::initialize(false), "DataFlow::Library::isInitialized()");
    DataFlow::AutoInitializer dataFlow;
    ORVO_EXPECT_INTERNAL(Library::initialize(false), "OGL::Library::isInitialized()");
    OGL::AutoInitializer ogl;
    ORVO_EXPECT_INTERNAL(Library::initialize(false), "ImageRuntime::Library::isInitialized()");
    ORVO_EXPECT_INTERNAL(Library::cpuOnlyMode(), "ImageRuntime::Library::isInitialized()");
    EXPECT_FALSE(Library::isInitialized());
    initializeRuntime();
    EXPECT_TRUE(Library::cpuOnlyMode());
    Library::initialize(true); // no context, no driver to be checked
    EXPECT_TRUE(Library::isInitialized());
    ORVO_EXPECT_INTERNAL(Library::initialize(false), "ImageFlow already initialized");
    Library::terminate();
    EXPECT_FALSE(Library::isInitialized());
    ImageRuntime::Library::terminate();
}

TEST(ImageFlowLibraryTest, terminationNeedsTheLowerLayersToo) {
    Core::Library::initialize();
    OGL::Library::initialize();
    initializeRuntime();
    DataFlow::Library::initialize();
    Library::initialize(false);
    DataFlow::Library::terminate();
    ORVO_EXPECT_INTERNAL(Library::terminate(), "DataFlow::Library::isInitialized()");
    ImageRuntime::Library::terminate();
    OGL::Library::terminate();
    DataFlow::Library::initialize();
    ORVO_EXPECT_INTERNAL(Library::terminate(), "OGL::Library::isInitialized()");
    DataFlow::Library::terminate();
    Core::Library::terminate();
    ORVO_EXPECT_INTERNAL(Library::terminate(), "Core::Library::isInitialized()");
    Core::Library::initialize();
    OGL::Library::initialize();
    DataFlow::Library::initialize();
    Library::terminate();
    DataFlow::Library::terminate();
    OGL::Library::terminate();
    Core::Library::terminate();
}

TEST(ImageFlowLibraryTest, hasNames) {
    EXPECT_EQ("Norvane", Library::norvaneVendor());
    EXPECT_EQ("ImageFlow", Library::imageFlowNamespace());
    EXPECT_EQ("MotionLoft", Library::motionLoftNamespace());
}

struct Row {
    char const* name;
    char const* clientID;
    std::type_info const* pCPU;
    std::type_info const* pGPU;
};

Row const aRows[] = {
    {"CPU2GPU", "CPU2GPU", &typeid(CPU2GPU), &typeid(CPU2GPU)},
    {"ImageGPUInput", "ImageGPUInput", nullptr, &typeid(ImageGPUInput)},
    {"ImageGPUOutput", "ImageGPUOutput", nullptr, &typeid(ImageGPUOutput)},
    {"VantleFilterGPU", "VantleTransformGPU2", nullptr, &typeid(VantleFilterGPU)},
    {"VantleFilterCPU", "VantleTransformCPU2", &typeid(VantleFilterCPU), nullptr},
    {"FastBilateralFilter", "NRVN Fast Bilateral", &typeid(FastBilateralFilterCPUNode),
     &typeid(FastBilateralFilterGPU)},
    {"RGBToLABCPU", "NRVN ORVO RGB2LAB", &typeid(RGBToLABCPU), nullptr},
    {"LABToRGBCPU", "NRVN ORVO LAB2RGB", &typeid(LABToRGBCPU), nullptr},
    {"ImageCPUInput", "ImageCPUInput", &typeid(ImageCPUInput), &typeid(ImageCPUInput)},
    {"MirelCheckerBoardGPU", "NRVN ORVO CheckerBoard GPU", nullptr, &typeid(MirelCheckerBoardGPU)},
    {"SimpleBilateralCPU", "NRVN Simple Bilateral CPU", &typeid(SimpleBilateralFilterCPU), nullptr},
    {"MirelGamutComposite", "Mirel Gamut Test Result Composite", nullptr,
     &typeid(MirelGamutTestCompositeGPU)}};

TEST(ImageFlowLibraryTest, registersItsNodeTypesInOrder) {
    ORVO::Test::ImageFlowLayers layers;
    auto iter = NodeLibrarian::Instance()->begin();
    for (Row const& row : aRows) {
        ASSERT_NE(NodeLibrarian::Instance()->end(), iter);
        NodeMetaData const& metaData = **iter++;
        EXPECT_EQ(row.name, metaData.name());
        EXPECT_EQ("ImageFlow", metaData.nameSpace());
        EXPECT_EQ("Norvane", metaData.vendor());
        EXPECT_TRUE(metaData.hasVersion());
        EXPECT_EQ(1u, metaData.version());
        EXPECT_EQ("", metaData.description());
        EXPECT_EQ(row.clientID, metaData.clientID());
    }
    EXPECT_EQ(NodeLibrarian::Instance()->end(), iter);
}

TEST(ImageFlowLibraryTest, makesNodesForTheTargetsThatATypeServes) {
    ORVO::Test::ImageFlowLayers layers;
    for (Row const& row : aRows) {
        for (int target : {0, 1, 2}) {
            NodePtr const upNode = create(row.clientID, target);
            std::type_info const* const pExpected = target == 1 ? row.pGPU : row.pCPU;
            ASSERT_EQ(pExpected == nullptr, upNode == nullptr) << row.name << " for target " << target;
            if (upNode) {
                EXPECT_TRUE(*pExpected == typeid(*upNode)) << row.name << " for target " << target;
            }
        }
    }
    EXPECT_EQ(nullptr, create("ImageGPUInput", 0));
    EXPECT_EQ(nullptr, create("FastBilateralFilter", 0)); // the name is no client ID
}

TEST(ImageFlowLibraryTest, terminationRemovesEveryNodeType) {
    LowerLayers layers;
    Library::initialize(false);
    NodeLibrarian& librarian = *NodeLibrarian::Instance();
    librarian.add([](NodeTargetType) -> Node* { return nullptr; },
                  ORVO_NEW NodeMetaData("Other", "Name", "Vendor", 1u, "", "other"));
    Library::terminate();
    EXPECT_EQ(librarian.begin(), librarian.end());
}

TEST(ImageFlowLibraryTest, aTypeOfTheSameIdentityIsRefusedAndNothingChanges) {
    LowerLayers layers;
    NodeLibrarian& librarian = *NodeLibrarian::Instance();
    librarian.add([](NodeTargetType) -> Node* { return nullptr; },
                  ORVO_NEW NodeMetaData("LABToRGBCPU", "ImageFlow", "Norvane", 1u, "", "other"));
    ORVO_EXPECT_PARAMETER(Library::initialize(false), "!bDuplicate");
    EXPECT_FALSE(Library::isInitialized());
    EXPECT_EQ(1, librarian.end() - librarian.begin());
    librarian.clearAll();
    Library::initialize(false);
    Library::terminate();
}

TEST(ImageFlowLibraryTest, aStartThatRunsOutOfMemoryMayBeTriedAgain) {
    LowerLayers layers;
    NodeLibrarian& librarian = *NodeLibrarian::Instance();
    std::uint64_t nFailures = 0;
    for (;; ++nFailures) {
        ASSERT_LT(nFailures, 100u);
        Core::AllocationFailure failure(nFailures + 1);
        try {
            Library::initialize(false);
            break;
        } catch (std::bad_alloc const&) {
            EXPECT_TRUE(failure.hasFired());
            EXPECT_FALSE(Library::isInitialized());
            EXPECT_EQ(librarian.begin(), librarian.end());
        }
    }
    EXPECT_GE(nFailures, std::size(aRows)); // a record for each node type at least
    EXPECT_EQ(std::ptrdiff_t(std::size(aRows)), librarian.end() - librarian.begin());
    Library::terminate();
}

TEST(ImageFlowLibraryTest, theAutoInitializerKeepsTheLayerUpInItsScope) {
    LowerLayers layers;
    {
        ImageFlow::AutoInitializer scope(false);
        EXPECT_TRUE(Library::isInitialized());
        ImageFlow::AutoInitializer again(false); // does not start twice
        again.release();
    }
    EXPECT_FALSE(Library::isInitialized());
    {
        ImageFlow::AutoInitializer scope(false);
        Library::terminate(); // what the destructor finds is no failure
    }
    {
        ImageFlow::AutoInitializer scope(false);
        scope.release();
    }
    EXPECT_TRUE(Library::isInitialized());
    Library::terminate();
}

} // namespace

} // namespace ORVO
