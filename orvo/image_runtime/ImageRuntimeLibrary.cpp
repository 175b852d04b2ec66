#include "orvo/image_runtime/ImageRuntimeLibrary.h"

#include "orvo/core/Check.h"
#include "orvo/core/CoreLibrary.h"
#include "orvo/core/exceptions/ResourceException.h"
#include "orvo/ogl/OGLLibrary.h"

#include <algorithm>
#include <memory>

namespace ORVO::ImageRuntime {

bool Library::bNativeIntrinsicsRegistered_ = false;
bool Library::bInterpretedIntrinsicsRegistered_ = false;
std::vector<Library::DeviceObject>* Library::pvDeviceObject_ = nullptr;

namespace {

void enforceLowerLayers() {
    ORVO_CHECK(Core::Library::isInitialized());
    ORVO_CHECK(OGL::Library::isInitialized());
}

/// One record of the list. Pools and shader managers belong to contexts, so that a null context has neither.
Library::DeviceObject createDeviceObject(OGL::Context const* pContext) {
    if (pContext) {
        throw ResourceException(__FILE__, __LINE__, "OpenGL contexts are not supported by this version.");
    }
    return Library::DeviceObject{nullptr, nullptr, nullptr};
}

} // namespace

void Library::initialize(std::vector<OGL::Context const*> const& vpContext,
                         VideoMemory::Configuration const&) {
    enforceLowerLayers();
    ORVO_CHECK(!vpContext.empty(), "vpContext.size()");
    ORVO_CHECK(!pvDeviceObject_);
    // Asked before any record is made, so that a refused list leaves nothing behind.
    ORVO_CHECK(vpContext.size() == 1 ||
                   std::find(vpContext.begin(), vpContext.end(), nullptr) == vpContext.end(),
               "vpContext.size() == 1");

    auto pvDeviceObject = std::make_unique<std::vector<DeviceObject>>();
    for (OGL::Context const* pContext : vpContext) {
        pvDeviceObject->push_back(createDeviceObject(pContext));
    }
    pvDeviceObject_ = pvDeviceObject.release();
}

void Library::initialize(OGL::Context const* pContext, VideoMemory::Configuration const& configuration) {
    initialize(std::vector<OGL::Context const*>(1, pContext), configuration);
}

void Library::terminate() {
    enforceLowerLayers();
    delete pvDeviceObject_;
    pvDeviceObject_ = nullptr;
}

bool Library::isInitialized() { return pvDeviceObject_ != nullptr; }

std::vector<OGL::Context const*> Library::initializationContextList() {
    ORVO_ENFORCE(pvDeviceObject_);
    std::vector<OGL::Context const*> vpContext;
    vpContext.reserve(pvDeviceObject_->size());
    for (DeviceObject const& deviceObject : *pvDeviceObject_) {
        vpContext.push_back(deviceObject.pContext_);
    }
    return vpContext;
}

TexturePool* Library::texturePool() {
    ORVO_ENFORCE(pvDeviceObject_);
    // A record without a pool ends the search, and without a context there is no other record.
    return pvDeviceObject_->front().pTPool_;
}

ShaderManagerOGL* Library::shaderManager() {
    ORVO_ENFORCE(pvDeviceObject_);
    return pvDeviceObject_->front().pSMOGL_;
}

AutoInitializer::AutoInitializer(std::vector<OGL::Context const*> const& vpContext,
                                 VideoMemory::Configuration const& configuration)
    : bArmed_(true) {
    Library::initialize(vpContext, configuration);
}

AutoInitializer::AutoInitializer(OGL::Context const* pContext,
                                 VideoMemory::Configuration const& configuration)
    : bArmed_(true) {
    Library::initialize(pContext, configuration);
}

AutoInitializer::~AutoInitializer() {
    if (!bArmed_) {
        return;
    }
    try {
        Library::terminate();
    } catch (...) {
        // A destructor lets nothing out, and a library whose lower layers are gone has nothing left to give
        // back.
        return;
    }
}

void AutoInitializer::release() { bArmed_ = false; }

} // namespace ORVO::ImageRuntime
