#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/FilterGraphLibrary.h"
#include "orvo/filter_graph/internal/ImageFlowFilterWrapper.h"

namespace ORVO::FilterGraph {

namespace {

Identifier colourTransformIdentifier() { return {"VantleFilterGPU", "ImageFlow", "Norvane", 1}; }

} // namespace

void Library::insertORVOFilters() {
    FilterFactory::Instance()->insert(Internal::ImageFlowFilterWrapper(colourTransformIdentifier()));
}

void Library::removeORVOFilters() { FilterFactory::Instance()->remove(colourTransformIdentifier()); }

} // namespace ORVO::FilterGraph
