#include "orvo/ogl/OGLLibrary.h"

#include <atomic>

#include "orvo/core/Check.h"
#include "orvo/core/CoreLibrary.h"
#include "orvo/ogl/internal/Failure.h"

namespace ORVO::OGL {

namespace {
std::atomic<bool> bInitialized{false};
} // namespace

void Library::initialize() {
    ORVO_CHECK(Core::Library::isInitialized());
    ORVO_CHECK(!isInitialized());
    Internal::installResolverFailureHandler();
    bInitialized.store(true, std::memory_order_release);
}

void Library::terminate() {
    ORVO_CHECK(Core::Library::isInitialized());
    ORVO_CHECK(isInitialized());
    Internal::removeResolverFailureHandler();
    bInitialized.store(false, std::memory_order_release);
}

bool Library::isInitialized() noexcept { return bInitialized.load(std::memory_order_acquire); }

AutoInitializer::AutoInitializer() : bArmed_(true) { Library::initialize(); }

AutoInitializer::~AutoInitializer() {
    if (!bArmed_)
        return;
    try {
        Library::terminate();
    } catch (...) {
        // The host stopped the layer itself: nothing is left to do.
    }
}

void AutoInitializer::release() noexcept { bArmed_ = false; }

} // namespace ORVO::OGL
