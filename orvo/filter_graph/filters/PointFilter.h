#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/filters/BasicGLShaderFilter.h"

#include <string>

namespace ORVO::FilterGraph::Internal::Filters {

/// A shader filter of the input "src" whose result depends on the texel of the same place alone. Where the
/// output lies on the pixel grid of the input, it reads just that texel: linear filtering would add a trace
/// of a neighbour, which a division by alpha can make anything of. Elsewhere it reads between texels.
///
/// Threads: as `BasicGLShaderFilter`.
class ORVO_API PointFilter : public BasicGLShaderFilter {
public:
    ~PointFilter() override;

protected:
    /// @param expression the result as pointKernel() takes it.
    PointFilter(char const* name, std::string const& expression, int numChannels);

    void preProcess() override;
};

} // namespace ORVO::FilterGraph::Internal::Filters
