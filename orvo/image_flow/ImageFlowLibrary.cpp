#include "orvo/image_flow/ImageFlowLibrary.h"

#include "orvo/core/Check.h"
#include "orvo/core/CoreLibrary.h"
#include "orvo/core/exceptions/ResourceException.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/data_flow/DataFlowLibrary.h"
#include "orvo/data_flow/librarian/NodeLibrarian.h"
#include "orvo/data_flow/librarian/NodeMetaData.h"
#include "orvo/image_flow/colour/QuorClient.h"
#include "orvo/image_flow/colour/ScopedQuorInitializer.h"
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
#include "orvo/ogl/Context.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/OGLLibrary.h"
#include "orvo/ogl/ScopedContextWrapper.h"

#include <algorithm>
#include <cstdint>

namespace ORVO::ImageFlow {

namespace {

using DataFlow::Node;
using DataFlow::NodeLibrarian;
using DataFlow::NodeMetaData;
using DataFlow::NodeTargetType;

constexpr std::uint32_t iNodeVersion = 1;

bool bInitialized = false;
ScopedQuorInitializer oColourEngine;

/// A node type that runs on the CPU alone.
template <typename CPUNode>
Node* createOnCPU(NodeTargetType target) {
    return target == DataFlow::NODE_TARGET_GPU ? nullptr : ORVO_NEW CPUNode();
}

/// A node type that runs on the GPU alone.
template <typename GPUNode>
Node* createOnGPU(NodeTargetType target) {
    return target == DataFlow::NODE_TARGET_GPU ? ORVO_NEW GPUNode() : nullptr;
}

/// A node type with one class for the GPU and another for every other target.
template <typename CPUNode, typename GPUNode>
Node* createForTarget(NodeTargetType target) {
    if (target == DataFlow::NODE_TARGET_GPU) {
        return ORVO_NEW GPUNode();
    }
    return ORVO_NEW CPUNode();
}

/// A node type with one class for every target.
template <typename AnyNode>
Node* createOnAny(NodeTargetType /*target*/) {
    return ORVO_NEW AnyNode();
}

struct NodeType {
    char const* pName_;
    char const* pClientID_;
    Node* (*pCreate_)(NodeTargetType);
};

/// The node types in the order of their registration.
constexpr NodeType aNodeTypes[] = {
    {"CPU2GPU", "CPU2GPU", createOnAny<CPU2GPU>},
    {"ImageGPUInput", "ImageGPUInput", createOnGPU<ImageGPUInput>},
    {"ImageGPUOutput", "ImageGPUOutput", createOnGPU<ImageGPUOutput>},
    {"VantleFilterGPU", "VantleTransformGPU2", createOnGPU<VantleFilterGPU>},
    {"VantleFilterCPU", "VantleTransformCPU2", createOnCPU<VantleFilterCPU>},
    {"FastBilateralFilter", "NRVN Fast Bilateral",
     createForTarget<FastBilateralFilterCPUNode, FastBilateralFilterGPU>},
    {"RGBToLABCPU", "NRVN ORVO RGB2LAB", createOnCPU<RGBToLABCPU>},
    {"LABToRGBCPU", "NRVN ORVO LAB2RGB", createOnCPU<LABToRGBCPU>},
    {"ImageCPUInput", "ImageCPUInput", createOnAny<ImageCPUInput>},
    {"MirelCheckerBoardGPU", "NRVN ORVO CheckerBoard GPU", createOnGPU<MirelCheckerBoardGPU>},
    {"SimpleBilateralCPU", "NRVN Simple Bilateral CPU", createOnCPU<SimpleBilateralFilterCPU>},
    {"MirelGamutComposite", "Mirel Gamut Test Result Composite", createOnGPU<MirelGamutTestCompositeGPU>},
};

bool isRegistered(NodeLibrarian const& librarian, NodeType const& type) {
    return std::any_of(librarian.begin(), librarian.end(), [&](NodeMetaData const* pMetaData) {
        return pMetaData->vendor() == Library::norvaneVendor() &&
               pMetaData->nameSpace() == Library::imageFlowNamespace() && pMetaData->name() == type.pName_ &&
               pMetaData->version() == iNodeVersion;
    });
}

void registerNodeTypes(NodeLibrarian& librarian) {
    for (NodeType const& type : aNodeTypes) {
        bool const bDuplicate = isRegistered(librarian, type);
        ORVO_CHECK_PARAMETER(!bDuplicate);
    }
    try {
        for (NodeType const& type : aNodeTypes) {
            librarian.add(type.pCreate_,
                          ORVO_NEW NodeMetaData(type.pName_, Library::imageFlowNamespace(),
                                                Library::norvaneVendor(), iNodeVersion, "", type.pClientID_));
        }
    } catch (...) {
        // Half a catalogue would refuse the next start as a duplicate.
        librarian.clearAll();
        throw;
    }
}

void checkLowerLayers() {
    ORVO_CHECK(Core::Library::isInitialized());
    ORVO_CHECK(DataFlow::Library::isInitialized());
    ORVO_CHECK(OGL::Library::isInitialized());
}

/// A host may do without an engine: the binding stays closed then, and who asks for a transform is told so.
void openColourEngine() {
    QuorGetAddressProc const pProc = GetQuorGetAddressProc();
    if (pProc != QuorClient::addressProc()) {
        // Left open by a start that failed later, before the host chose another engine.
        oColourEngine.terminate();
    }
    if (pProc != nullptr) {
        oColourEngine.initialize(pProc);
    }
}

/// Throws where the driver of the first context lacks what the nodes of the GPU need.
void checkDriver() {
    OGL::ScopedContextWrapper const wrapper;
    ImageRuntime::Library::initializationContextList().front()->makeCurrent();
    auto const* const pManager = OGL::ExtensionManager::Instance();
    ORVO_CHECK(pManager != nullptr, "pManager != 0");
    if (pManager->majorVersion() == 1 && pManager->minorVersion() < 5) {
        throw ResourceException(__FILE__, __LINE__, "Minimum OpenGL Version (1.5) not supported.");
    }
    if (!pManager->isSupported(OGL::EXTENSION_EXT_FRAMEBUFFER_OBJECT)) {
        throw ResourceException(__FILE__, __LINE__, "Framebuffer Object Extension not supported.");
    }
    if (!pManager->supportsNonPowerOfTwoTextures()) {
        throw ResourceException(__FILE__, __LINE__, "Non power of two textures not supported.");
    }
}

} // namespace

void Library::initialize(bool checkGPU) {
    ORVO_CHECK(!bInitialized, "ImageFlow already initialized");
    checkLowerLayers();
    openColourEngine();
    // A driver is there to be checked only where the runtime was given a context.
    if (!cpuOnlyMode() && checkGPU) {
        checkDriver();
    }
    if (NodeLibrarian::exists()) {
        registerNodeTypes(*NodeLibrarian::Instance());
    }
    bInitialized = true;
}

void Library::terminate() {
    ORVO_CHECK(bInitialized, "ImageFlow is not initialized!");
    checkLowerLayers();
    NodeLibrarian::Instance()->clearAll();
    oColourEngine.terminate();
    bInitialized = false;
}

bool Library::isInitialized() { return bInitialized; }

bool Library::cpuOnlyMode() {
    ORVO_CHECK(ImageRuntime::Library::isInitialized());
    return ImageRuntime::Library::initializationContextList().front() == nullptr;
}

std::string Library::norvaneVendor() { return "Norvane"; }

std::string Library::imageFlowNamespace() { return "ImageFlow"; }

std::string Library::motionLoftNamespace() { return "MotionLoft"; }

AutoInitializer::AutoInitializer(bool checkGPU) : bActive_(true) {
    if (!Library::isInitialized()) {
        Library::initialize(checkGPU);
    }
}

AutoInitializer::~AutoInitializer() {
    if (!bActive_) {
        return;
    }
    try {
        Library::terminate();
    } catch (...) { // A destructor never throws; the host may have terminated the layer itself.
    }
}

void AutoInitializer::release() { bActive_ = false; }

} // namespace ORVO::ImageFlow
