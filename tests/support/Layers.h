/// All fixtures that bring layers up. A test of a lower layer includes the fixture it needs alone.
#pragma once

#include "tests/support/CoreLayer.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/FilterGraphLayers.h"
#include "tests/support/ImageFlowLayers.h"
