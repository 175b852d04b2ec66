#pragma once

#include "orvo/core/Export.h"

#include <string>

namespace ORVO {

/// The text of one part of a shader's stage. The derived classes say which stage.
///
/// Threads: a plain value.
class ORVO_API ShaderSourceOGL {
public:
    /// @param sSource the text, copied; it may be one of several that make up a stage.
    explicit ShaderSourceOGL(std::string sSource);
    ShaderSourceOGL(ShaderSourceOGL const&);
    ShaderSourceOGL(ShaderSourceOGL&&) noexcept;
    ShaderSourceOGL& operator=(ShaderSourceOGL const&);
    ShaderSourceOGL& operator=(ShaderSourceOGL&&) noexcept;
    virtual ~ShaderSourceOGL();

    /// The text, valid for as long as the object lives and is not assigned to.
    char const* c_str() const noexcept { return sSource_.c_str(); }

private:
    std::string sSource_;
};

} // namespace ORVO
