#include "common/Engine.h"

namespace example {

ContextPtr makeContext() {
    auto context = ORVO::OGL::ContextOffscreen::createHeadless();
    context->makeCurrent();
    return context;
}

ContextPtr noContext() { return {}; }

Engine::Engine(ContextPtr (*makeContextOrNone)()) : context(makeContextOrNone()) {
    ORVO::FilterGraph::insertStandardFilters();
    ORVO::FilterGraph::Library::insertORVOFilters();
}

std::string describe(std::exception const& failure) {
    auto const* client = dynamic_cast<ORVO::FilterGraph::Exception const*>(&failure);
    if (client && !client->errorsAndWarnings().empty())
        return client->errorsAndWarnings().front().message();
    return failure.what();
}

} // namespace example
