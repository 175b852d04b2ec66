#pragma once

#include "orvo/core/Export.h"

#include <string>

namespace ORVO::ColourEngine::Internal {

/// A finite number as GLSL reads it, rounded to a float and exact as such: with a point or an exponent, as
/// the first versions convert no integers, and a negative one in parentheses.
///
/// Threads: any.
ORVO_API std::string shaderNumber(double value);

} // namespace ORVO::ColourEngine::Internal
