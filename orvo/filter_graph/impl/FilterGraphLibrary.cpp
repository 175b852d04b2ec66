#include "orvo/filter_graph/impl/FilterGraphLibrary.h"

#include "orvo/core/Check.h"
#include "orvo/core/CoreLibrary.h"
#include "orvo/data_flow/DataFlowLibrary.h"
#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/image_flow/ImageFlowLibrary.h"
#include "orvo/ogl/OGLLibrary.h"

namespace ORVO::FilterGraph {

namespace {

void checkLowerLayers() {
    ORVO_CHECK(ORVO::Core::Library::isInitialized());
    ORVO_CHECK(ORVO::OGL::Library::isInitialized());
    ORVO_CHECK(ORVO::DataFlow::Library::isInitialized());
    ORVO_CHECK(ORVO::ImageFlow::Library::isInitialized());
}

} // namespace

bool Library::isInitialized_ = false;
Library::InitializationOptions Library::initOptions_;

void Library::initialize(InitializationOptions const& options) {
    ORVO_CHECK(!isInitialized_);
    checkLowerLayers();
    FilterFactory::create();
    isInitialized_ = true;
    initOptions_ = options;
}

void Library::terminate() {
    ORVO_CHECK(isInitialized_);
    checkLowerLayers();
    FilterFactory::Instance()->removeAll();
    FilterFactory::destroy();
    isInitialized_ = false;
}

bool Library::isInitialized() { return isInitialized_; }

Library::InitializationOptions const& Library::getInitializationOptions() { return initOptions_; }

AutoInitializer::AutoInitializer(Library::InitializationOptions const& options) : armed_(true) {
    Library::initialize(options);
}

AutoInitializer::~AutoInitializer() {
    if (!armed_)
        return;
    try {
        Library::terminate();
    } catch (...) {
        // The end of a scope is no place to report that a lower layer is down already.
    }
}

void AutoInitializer::release() { armed_ = false; }

void setNumberOfThreads(std::size_t nThreads) { DataFlow::Controller::setNumberOfThreads(nThreads); }

} // namespace ORVO::FilterGraph
