#pragma once

#include <memory>

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/filter_graph/internal/ImageFlowFilterWrapperBase.h"

namespace ORVO::FilterGraph::Internal {

/// A filter backed by the node class `T`, which has a default constructor, for one fixed target.
///
/// Threads: the thread that owns the graph.
template <typename T>
class ImageFlowFilter : public ImageFlowFilterWrapperBase {
public:
    ImageFlowFilter(IFilter::Identifier const& identifier, TargetPlatform target)
        : ImageFlowFilterWrapperBase(identifier), target_(target) {}

    /// An unconnected copy for the same target, without a node.
    std::shared_ptr<Filter> clone() override { return std::shared_ptr<Filter>(new ImageFlowFilter(*this)); }

    /// True for the target that the filter was made for.
    bool canBuildFilterExecutable(TargetPlatform target) const override { return target == target_; }

protected:
    ImageFlowFilter(ImageFlowFilter const& other) = default;

private:
    ImageFilter* createFilter(TargetPlatform target) override {
        if (target != target_) {
            return nullptr;
        }
        ImageFilter*& pFilter = pFilters_.at(static_cast<std::size_t>(target));
        if (!pFilter) {
            pFilter = ORVO_NEW T();
        }
        return pFilter;
    }

    TargetPlatform target_;
};

} // namespace ORVO::FilterGraph::Internal
