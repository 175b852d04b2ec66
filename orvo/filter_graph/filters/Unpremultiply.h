#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/filters/BasicGLShaderFilter.h"

namespace ORVO::FilterGraph::Internal::Filters {

/// Divides the colour of the input "src" by its alpha; where alpha is 0 the result is transparent black.
///
/// Threads: as `BasicGLShaderFilter`.
class ORVO_API Unpremultiply : public BasicGLShaderFilter {
public:
    Unpremultiply();
    ~Unpremultiply() override;
};

} // namespace ORVO::FilterGraph::Internal::Filters
