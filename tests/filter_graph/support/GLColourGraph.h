/// A graph of one source, colour transformers and a sink, on OpenGL.
#pragma once

#include "tests/filter_graph/support/ColourGraph.h"
#include "tests/support/gl/GLFrameTest.h"

#include <vector>

namespace ORVO::Test {

/// source -> transformers -> sink, in textures.
class GLColourGraph {
public:
    GLColourGraph(OGL::Context const* pContext, FilterGraph::ImageBase* pInput,
                  FilterGraph::ImageBase* pOutput, std::vector<FilterPtr> const& aFilters)
        : aFilters_(aFilters),
          spSource_(makeGLSource(pInput)),
          spSink_(makeGLSink(pOutput)),
          spProcessor_(FilterGraph::createProcessor(spSink_, pContext)) {
        FilterGraph::Connect(spSource_, aFilters_.front());
        for (std::size_t i = 1; i < aFilters_.size(); ++i)
            FilterGraph::Connect(aFilters_[i - 1], aFilters_[i]);
        FilterGraph::Connect(aFilters_.back(), spSink_);
    }

    FilterGraph::IFilter& filter() { return *aFilters_.front(); }
    void frame(OptimizationOptions const& options = glOptions()) { spProcessor_->processFrame(options); }

private:
    std::vector<FilterPtr> aFilters_;
    SourcePtr spSource_;
    SinkPtr spSink_;
    std::shared_ptr<FilterGraph::IProcessor> spProcessor_;
};

} // namespace ORVO::Test
