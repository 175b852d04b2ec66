#pragma once

#include "orvo/colour_engine/VantleShaderParameterData.h"
#include "orvo/core/Export.h"

#include <cstddef>
#include <string>
#include <vector>

namespace ORVO::ColourEngine::Internal {

class ResolvedTransform;

/// A transform as GLSL: an entry function with the code that it needs, and the tables and matrices that the
/// code reads as uniforms. The engine's shader procedures serve it: `Strings` gives entryPoint() and code(),
/// `NumParameters` the size of parameters(), `Parameter` the record with a string for the name and a pointer
/// to the data, `CopyData` the data.
///
/// Curves and a matrix, with every curve in closed form that ShaderCurve can compute, become text alone,
/// without parameters. Where a curve has to be a table, of 4096 entries, the matrix is a parameter too.
/// Anything else becomes a cube in a 3D texture, with curves as tables before and behind it where these help.
/// Samples below 0 count as 0 and samples above 1 as 1, and
/// results are from 0 to 1; what NaN gives is the driver's, some colour in that range, as GLSL leaves it open
/// what clamp() makes of it (Mesa: 0). Alpha stays as it is.
///
/// Threads: immutable: any, at once.
class ORVO_API ShaderDescription {
public:
    struct Parameter {
        std::string sName_; ///< the uniform
        /// All but `name` and `data`, which the engine fills in for each caller.
        _t_Vantle_ShaderParameterData record_;
        std::vector<float> aData_; ///< texels, or the matrix by columns
    };

    explicit ShaderDescription(ResolvedTransform const& transform);

    /// Name of the function that transforms an inout vec4; under 1024 bytes.
    std::string const& entryPoint() const noexcept { return sEntryPoint_; }
    /// GLSL text; under 8192 bytes.
    std::string const& code() const noexcept { return sCode_; }
    std::vector<Parameter> const& parameters() const noexcept { return aParameters_; }

private:
    std::string sEntryPoint_;
    std::string sCode_;
    std::vector<Parameter> aParameters_;
};

} // namespace ORVO::ColourEngine::Internal
