#pragma once

#include "orvo/core/Export.h"

namespace ORVO::OGL {

/// The name of an OpenGL token for messages, such as "GL_RGBA8"; 0 is "GL_NONE". A number that is no token of
/// this layer reads as a hexadecimal number, such as "0x00001234". The text is valid for the rest of the
/// process. Threads: any.
ORVO_API char const* TokenName(unsigned token);

} // namespace ORVO::OGL
