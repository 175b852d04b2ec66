/// Everything of the colour engine's interface.
#pragma once

#include "orvo/colour_engine/EmbeddedEngine.h"
#include "orvo/colour_engine/EngineStatistics.h"
#include "orvo/colour_engine/ProfileCodes.h"
#include "orvo/colour_engine/ProfileRegistry.h"
#include "orvo/colour_engine/QuorProcedures.h"
#include "orvo/colour_engine/VantleHandles.h"
#include "orvo/colour_engine/VantlePackingSpec.h"
#include "orvo/colour_engine/VantleProcedures.h"
#include "orvo/colour_engine/VantleShaderParameterData.h"
