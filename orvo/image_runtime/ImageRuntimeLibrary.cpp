#include "orvo/image_runtime/ImageRuntimeLibrary.h"

#include "orvo/core/Check.h"
#include "orvo/core/CoreLibrary.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/image_runtime/LateReturns.h"
#include "orvo/image_runtime/ShaderManagerOGL.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/Context.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/OGLLibrary.h"
#include "orvo/ogl/ScopedContextWrapper.h"

#include <algorithm>
#include <memory>
#include <sstream>
#include <utility>

namespace ORVO::ImageRuntime {

bool Library::bNativeIntrinsicsRegistered_ = false;
bool Library::bInterpretedIntrinsicsRegistered_ = false;
std::vector<Library::DeviceObject>* Library::pvDeviceObject_ = nullptr;

namespace {

void enforceLowerLayers() {
    ORVO_CHECK(Core::Library::isInitialized());
    ORVO_CHECK(OGL::Library::isInitialized());
}

[[noreturn]] void failForeignContext() {
    std::ostringstream text;
    text << "Current context of value " << OGL::NativeContext::currentHandle()
         << " does not share with any context used to initialize image_runtime";
    ORVO_FAIL(text.str());
}

} // namespace

void Library::fill(DeviceObject& deviceObject, VideoMemory::Configuration const& configuration) {
    if (!deviceObject.pContext_)
        return;
    deviceObject.pContext_->makeCurrent();
    if (OGL::ExtensionManager::Instance()->supportsNonPowerOfTwoTextures()) {
        TexturePool::Configuration pool;
        pool.setVideoMemoryListener(configuration.videoMemoryListener());
        pool.setMaximumFreelistSize(configuration.maximumTexturePoolSize());
        pool.setContext(deviceObject.pContext_);
        pool.setProhibitReuseLargerTextures(configuration.prohibitReuseLargerTextures());
        deviceObject.pTPool_ = ORVO_NEW TexturePool(pool);
    }
    deviceObject.pSMOGL_ = ORVO_NEW ShaderManagerOGL;
}

void Library::destroy(std::vector<DeviceObject>* pvDeviceObject) noexcept {
    for (DeviceObject const& deviceObject : *pvDeviceObject) {
        try {
            if (deviceObject.pContext_)
                deviceObject.pContext_->makeCurrent();
        } catch (...) {
            // The host has destroyed the context, and what was made in it is gone with it.
        }
        trackedDelete(deviceObject.pTPool_);
        trackedDelete(deviceObject.pSMOGL_);
    }
    delete pvDeviceObject;
    LateReturns::clear();
}

void Library::initialize(std::vector<OGL::Context const*> const& vpContext,
                         VideoMemory::Configuration const& configuration) {
    OGL::ScopedContextWrapper const restore;
    enforceLowerLayers();
    ORVO_CHECK(!vpContext.empty(), "vpContext.size()");
    ORVO_CHECK(!pvDeviceObject_);
    // Asked before any record is made, so that a refused list leaves nothing behind.
    ORVO_CHECK(vpContext.size() == 1 ||
                   std::find(vpContext.begin(), vpContext.end(), nullptr) == vpContext.end(),
               "vpContext.size() == 1");

    // What was made for the first contexts goes again if a later one fails.
    std::unique_ptr<std::vector<DeviceObject>, void (*)(std::vector<DeviceObject>*)> pvDeviceObject(
        new std::vector<DeviceObject>, [](std::vector<DeviceObject>* p) { destroy(p); });
    pvDeviceObject->reserve(vpContext.size());
    for (OGL::Context const* pContext : vpContext) {
        pvDeviceObject->push_back(DeviceObject{pContext, nullptr, nullptr});
        fill(pvDeviceObject->back(), configuration);
    }
    pvDeviceObject_ = pvDeviceObject.release();
}

void Library::initialize(OGL::Context const* pContext, VideoMemory::Configuration const& configuration) {
    initialize(std::vector<OGL::Context const*>(1, pContext), configuration);
}

void Library::terminate() {
    OGL::ScopedContextWrapper const restore;
    enforceLowerLayers();
    if (pvDeviceObject_)
        destroy(std::exchange(pvDeviceObject_, nullptr));
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
    for (DeviceObject const& deviceObject : *pvDeviceObject_) {
        if (!deviceObject.pTPool_)
            return nullptr;
        if (deviceObject.pContext_->isSharingWithCurrentContext())
            return deviceObject.pTPool_;
    }
    failForeignContext();
}

ShaderManagerOGL* Library::shaderManager() {
    ORVO_ENFORCE(pvDeviceObject_);
    for (DeviceObject const& deviceObject : *pvDeviceObject_) {
        if (!deviceObject.pSMOGL_)
            return nullptr;
        if (deviceObject.pContext_->isSharingWithCurrentContext())
            return deviceObject.pSMOGL_;
    }
    failForeignContext();
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
