#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <vector>

#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/CreateProcessor.h"
#include "orvo/filter_graph/impl/IEmbeddedProcessor.h"
#include "orvo/filter_graph/impl/IFilter.h"
#include "orvo/filter_graph/impl/IInputAdapter.h"
#include "orvo/filter_graph/impl/IOutputAdapter.h"
#include "orvo/filter_graph/impl/IProcessor.h"
#include "orvo/filter_graph/impl/OptimizationOptions.h"
#include "tests/support/FloatImage.h"
#include "tests/support/Layers.h"
#include "tests/support/TestFilters.h"

namespace ORVO::Test {

using FilterGraph::IAdapter;
using FilterGraph::IProcessorBase;
using FilterGraph::OptimizationOptions;

using FilterPtr = std::shared_ptr<FilterGraph::IFilter>;
using SourcePtr = std::shared_ptr<FilterGraph::IInputAdapter>;
using SinkPtr = std::shared_ptr<FilterGraph::IOutputAdapter>;

/// The options of a frame on the CPU.
inline OptimizationOptions cpuOptions() {
    OptimizationOptions options;
    options.setProcessingMode(OptimizationOptions::CPU_PROCESSING);
    return options;
}

/// A source with its image bound.
inline SourcePtr makeSource(FloatImage& image,
                            IAdapter::eRegionSyncMode mode = IAdapter::REGION_SYNC_FROM_IMAGE) {
    SourcePtr spSource = FilterGraph::createInputAdapter(mode);
    spSource->setImage(image.handle());
    return spSource;
}

/// A sink with its image bound.
inline SinkPtr makeSink(FloatImage& image,
                        IAdapter::eRegionSyncMode mode = IAdapter::REGION_SYNC_FROM_IMAGE) {
    SinkPtr spSink = FilterGraph::createOutputAdapter(mode);
    spSink->setImage(image.handle());
    return spSink;
}

/// Brings all layers up, without OpenGL.
class FrameTest : public testing::Test {
protected:
    FrameTest() { TestNode::resetRuns(); }

    FilterGraphLayers oLayers_;
};

} // namespace ORVO::Test
