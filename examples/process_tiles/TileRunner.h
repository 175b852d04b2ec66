#pragma once

#include "process_tiles/TileOptions.h"

#include <stdexcept>

namespace ORVO::OGL {
class Context;
}

namespace example {

/// Runs what the options ask for. Gives false, and leaves no output, if the user interrupted the work. Throws
/// UsageError, ValueError, PictureError and what the engine throws, and leaves no output then.
bool processTiles(TileOptions const& options, ORVO::OGL::Context const* context);

} // namespace example
