#pragma once

#include <string>

namespace ORVO::FilterGraph::Internal::Filters {

/// The text of a fragment shader that computes each pixel from the pixel at the same place of the input
/// "src". `expression` is a GLSL expression of type vec4 in which `src` is that pixel, in R, G, B, A order on
/// the scale 0..1; outside the input it is transparent black.
std::string pointKernel(std::string const& expression);

} // namespace ORVO::FilterGraph::Internal::Filters
