#include "orvo/filter_graph/internal/ImageFlowFilterWrapper.h"

#include <algorithm>

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/librarian/NodeLibrarian.h"
#include "orvo/data_flow/librarian/NodeMetaData.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/image_flow/ImageFlowLibrary.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO::FilterGraph::Internal {

namespace {

using DataFlow::NodeLibrarian;
using DataFlow::NodeMetaData;

/// The first record of the librarian with exactly this identity, or null.
NodeMetaData const* findMetaData(IFilter::Identifier const& id) {
    NodeLibrarian const* const librarian = NodeLibrarian::exists() ? NodeLibrarian::Instance() : nullptr;
    ORVO_ENFORCE(librarian);
    auto const iFound = std::find_if(librarian->begin(), librarian->end(), [&](NodeMetaData const* node) {
        ORVO_ENFORCE(node);
        return node->name() == id.name() && node->nameSpace() == id.nameSpace() &&
               node->vendor() == id.vendor() && static_cast<long long>(node->version()) == id.version();
    });
    return iFound == librarian->end() ? nullptr : *iFound;
}

/// The librarian counts its targets the other way round.
DataFlow::NodeTargetType librarianTarget(TargetPlatform target) {
    ORVO_CHECK(target == ORVO_TARGET_GL || target == ORVO_TARGET_CPU, "Target must be CPU or GPU");
    return target == ORVO_TARGET_GL ? DataFlow::NODE_TARGET_GPU : DataFlow::NODE_TARGET_CPU;
}

std::unique_ptr<DataFlow::Node, ORVODeleter<DataFlow::Node>> createNode(std::string const& clientID,
                                                                        TargetPlatform target) {
    return std::unique_ptr<DataFlow::Node, ORVODeleter<DataFlow::Node>>(
        NodeLibrarian::Instance()->createNodeByClientID(clientID, librarianTarget(target)));
}

} // namespace

ImageFlowFilterWrapper::ImageFlowFilterWrapper(IFilter::Identifier const& identifier)
    : ImageFlowFilterWrapperBase(identifier) {
    NodeMetaData const* const pMetaData = findMetaData(identifier);
    if (!pMetaData) {
        return;
    }
    clientID_ = pMetaData->clientID();
    for (char const* const name : {"mlMatchname", "clientID"}) {
        addMetadataItem(ORVO_NEW MetadataItem<std::string>(name, clientID_));
    }
}

ImageFlowFilterWrapper::ImageFlowFilterWrapper(ImageFlowFilterWrapper const& other) = default;

ImageFlowFilterWrapper::~ImageFlowFilterWrapper() = default;

std::shared_ptr<Filter> ImageFlowFilterWrapper::clone() {
    return std::shared_ptr<Filter>(new ImageFlowFilterWrapper(*this));
}

bool ImageFlowFilterWrapper::canBuildFilterExecutable(TargetPlatform target) const {
    return target == lastTarget_;
}

ImageFilter* ImageFlowFilterWrapper::createFilter(TargetPlatform target) {
    if (target != ORVO_TARGET_CPU && ORVO::ImageFlow::Library::cpuOnlyMode()) {
        return nullptr;
    }
    ORVO_CHECK(target == ORVO_TARGET_GL || target == ORVO_TARGET_CPU, "Target must be CPU or GPU");
    ImageFilter*& pFilter = pFilters_.at(static_cast<std::size_t>(target));
    if (!pFilter) {
        auto pNode = createNode(clientID_, target);
        pFilter = pNode ? pNode->asImageFilter() : nullptr;
        if (pFilter) {
            static_cast<void>(pNode.release());
        }
    }
    lastTarget_ = target;
    return pFilter;
}

} // namespace ORVO::FilterGraph::Internal
