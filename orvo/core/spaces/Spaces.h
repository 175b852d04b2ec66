/// The classes of both coordinate spaces and their conversions.
#pragma once

#include "orvo/core/spaces/Conversions.h"
#include "orvo/core/spaces/ExtentInPixelSpace.h"
#include "orvo/core/spaces/ExtentInWorldSpace.h"
#include "orvo/core/spaces/PixelExtentInWorldSpace.h"
#include "orvo/core/spaces/PositionExtentInPixelSpace.h"
#include "orvo/core/spaces/PositionExtentInWorldSpace.h"
#include "orvo/core/spaces/PositionInPixelSpace.h"
#include "orvo/core/spaces/PositionInWorldSpace.h"
