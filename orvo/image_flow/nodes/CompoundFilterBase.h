#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

#include <vector>

namespace ORVO {

class Bedding;
class ImageFlowController;

/// The base of a node that runs a private graph of its own: it owns the controller and the bedding of that
/// inner graph and keeps lists of the inner nodes. A subclass derives from this class and from ImageFilter,
/// owns the inner nodes, and wires them to each other. In its run it hands its input to an inner source, runs
/// the inner graph for a region, and takes the result from an inner sink:
///
///     using CompoundFilterBase::internalProcess; // beside the override of ImageFilter's
///     void MyFilter::internalProcess() {
///         bPreparedForRender_ = false;
///         propagatePrecisionHint(outputPrecisionHint());
///         oSource_.setImageCPUWithNoOwnership(const_cast<ImageCPU*>(oInput_.get()));
///         CompoundFilterBase::internalProcess(computeRegionParameter().value());
///         oOutput_.setData(oSink_.releaseImageCPU());
///     }
///
/// Sources, buffers and the like, which can emit, are told to emit before each run of the inner graph.
///
/// An inner graph has a status, slices and exceptions of its own, and runs inside the outer node as one step
/// of the outer frame: cancelling the outer frame does not cancel the inner one, which ends, and is the last
/// that the outer frame runs. A subclass that is to be cancelled in the middle cancels its own controller;
/// the inner frame then ends without a result, and the next one starts from a flushed graph. What the inner
/// frame throws leaves it as it is, and the inner graph is flushed before, so that its next run is right.
///
/// The inner graph has no OpenGL context unless the subclass gives the bedding one; that of the outer
/// controller serves.
///
/// Failures are `InternalException`s with the stated texts, and what the inner graph throws.
///
/// Threads: as the node that derives from it; the controller may be cancelled from any thread.
class ORVO_API CompoundFilterBase {
public:
    /// An empty inner graph.
    CompoundFilterBase();
    CompoundFilterBase(CompoundFilterBase const&) = delete;
    CompoundFilterBase& operator=(CompoundFilterBase const&) = delete;
    /// Ends the inner graph; the inner nodes stay their owner's.
    virtual ~CompoundFilterBase();

    /// Adds a node to the inner graph: to its controller, to the list of image filters if it is one, and to
    /// the list of emitters if it can emit. It stays the caller's. A node that is added twice is listed
    /// twice. Nothing happens while an inner frame runs. Throws "Enforce pNode != NULL", "pController_".
    virtual void addNode(DataFlow::Node* node);
    /// Removes the first occurrence of a node from the controller and from each list. Nothing happens for a
    /// node that is not there, or while an inner frame runs. Throws "pController_".
    virtual void removeNode(DataFlow::Node* node);

protected:
    /// Runs the inner graph for a region (world): pixel extents, domains of definition and regions from
    /// there, then emitAndProcess(). Throws "pController_", "pController_->getSinkNode()" without a sink.
    virtual void internalProcess(PositionExtentInWorldSpace const& region);
    /// Sets "OutputPrecisionHint" of all inner image filters, unless it is the hint that was propagated last;
    /// the first one counts as the default hint.
    virtual void propagatePrecisionHint(ImageFilter::teOutputPrecisionHint hint);

    /// Makes `filter` the sink of the inner graph; it stays the caller's.
    void plantMasterTree(ImageFilter& filter);
    /// Runs the inner graph with domains of definition and regions of interest that stand in the inner nodes
    /// already: each image filter with outputs gets their intersection as its compute region. An infinite one
    /// is not refused here.
    void computeRegionsAndProcess();
    /// Tells all emitters to emit, in the order in which they were added, and runs the inner graph on this
    /// thread. Throws "pController_".
    void emitAndProcess();

    ImageFlowController* pController_;
    Bedding* pBedding_;
    std::vector<ImageFilter*> aImageFilters_;
    std::vector<DataFlow::Node*> aEmitters_;
    ImageFilter::teOutputPrecisionHint eHint_;

private:
    static void computeNodeRegions(ImageFilter* filter);
};

} // namespace ORVO
