/// What the current context's state is, so that tests can compare it before and after.
#pragma once

#include <map>
#include <string>
#include <vector>

namespace ORVO::Test {

/// The state that the engine touches: bindings and enables of every unit, viewport, scissor, matrices, clear
/// and current colours, blending, points, generic arrays, pixel store, active unit, program, framebuffer,
/// buffers.
class GLState {
public:
    /// The current context's state.
    static GLState capture();

    /// One line for each value that differs, "<name>: <before> -> <after>"; empty if none does.
    std::string differencesTo(GLState const& after) const;

private:
    std::map<std::string, std::vector<double>> aValues_;
};

} // namespace ORVO::Test
