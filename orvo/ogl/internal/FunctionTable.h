#pragma once

#include "orvo/ogl/FunctionTable.h"

namespace ORVO::OGL::Internal {

/// The table whose entries go through the loader's pointers, so that they can be replaced.
FunctionTable const& functionTable() noexcept;

} // namespace ORVO::OGL::Internal
