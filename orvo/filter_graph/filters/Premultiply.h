#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/filters/BasicGLShaderFilter.h"

namespace ORVO::FilterGraph::Internal::Filters {

/// Multiplies the colour of the input "src" by its alpha.
///
/// Threads: as `BasicGLShaderFilter`.
class ORVO_API Premultiply : public BasicGLShaderFilter {
public:
    Premultiply();
    ~Premultiply() override;
};

} // namespace ORVO::FilterGraph::Internal::Filters
