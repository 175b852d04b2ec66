#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/FilterGraphLibrary.h"
#include "orvo/filter_graph/internal/ImageFlowFilterWrapper.h"
#include "orvo/image_flow/ImageFlowLibrary.h"

namespace ORVO::FilterGraph {

namespace {

// The name space and the vendor under which the image-flow layer registers the node.
Identifier colourTransformIdentifier() {
    return {"VantleFilterGPU", ImageFlow::Library::imageFlowNamespace(), ImageFlow::Library::norvaneVendor(),
            1};
}

} // namespace

void Library::insertORVOFilters() {
    FilterFactory::Instance()->insert(Internal::ImageFlowFilterWrapper(colourTransformIdentifier()));
}

void Library::removeORVOFilters() { FilterFactory::Instance()->remove(colourTransformIdentifier()); }

} // namespace ORVO::FilterGraph
