#pragma once

#include "common/Picture.h"

#include <memory>

namespace ORVO {
namespace FilterGraph {
class IFilter;
} // namespace FilterGraph
namespace OGL {
class Context;
} // namespace OGL
} // namespace ORVO

namespace example {

/// How frames are run.
struct FrameSettings {
    ORVO::OGL::Context const* context = nullptr; ///< frames run on OpenGL in it; null: on the CPU
    int repeat = 1;
    bool async = false;
};

/// Runs repeat frames of input -> filter -> output and prints the milliseconds of each where there are
/// several. With async, frames run as tasks that are polled, with a progress line if standard error is a
/// terminal. Gives false, and leaves result unspecified, if the user interrupted the work. Throws what the
/// engine throws.
///
/// On OpenGL pictures are of 8-bit or float channels, and float pictures are computed in 16-bit floats.
/// Pictures without alpha get an opaque one for the frame.
bool runFrames(std::shared_ptr<ORVO::FilterGraph::IFilter> const& filter, Picture const& source,
               Picture& result, FrameSettings const& settings);

/// Whether frames of the filter on the CPU are of 16 bits from end to end; where they are not, runFrames
/// computes 16-bit pictures in floats. Found out by a frame of a few pixels.
[[nodiscard]] bool takesSixteenBits(std::shared_ptr<ORVO::FilterGraph::IFilter> const& filter);

/// Whether the filter runs on the CPU, for a null context, or on OpenGL in this context: found out by a frame
/// of a few pixels.
[[nodiscard]] bool runsOn(ORVO::OGL::Context const* context,
                          std::shared_ptr<ORVO::FilterGraph::IFilter> const& filter);

} // namespace example
