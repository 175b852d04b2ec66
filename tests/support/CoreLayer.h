#pragma once

#include "orvo/core/CoreLibrary.h"

namespace ORVO::Test {

/// The base library, up for a scope.
struct CoreLayer {
    Core::AutoInitializer oCore_;
};

} // namespace ORVO::Test
