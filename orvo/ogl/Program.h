#pragma once

#include <cstdint>
#include <memory>

#include "orvo/ogl/GLSLObject.h"

namespace ORVO::OGL {

/// A program of the shading language.
///
///     OGL::Program program;
///     program.loadFragmentShader(1, &pSource, nullptr);
///     program.link(true);
///     program.enable();
///     program.setUniform("gain", 0.5f);
///
/// Every operation that speaks to OpenGL throws ExceptionOGL "No OpenGL context is current" if there is none.
/// Locations and types of uniforms are read once after a link.
///
/// Threads: as GLSLObject.
class ORVO_API Program : public GLSLObject {
public:
    /// An empty program. Throws ExceptionOGL.
    Program();
    /// Deletes the program and shaders that were kept, if a context of its share group is current. A program
    /// that is enabled lives until it is disabled.
    ~Program() override;

    /// Compile one stage from count strings, which the driver reads as one text; a null array of lengths, or
    /// a negative length, means that a string ends at its null character. The strings are copied. A stage may
    /// be loaded from several shaders. Throws InternalException "Enforce ppSources != NULL", ExceptionOGL
    /// "Vertex shader did not compile: ..." or "Fragment shader did not compile: ..." with the driver's log
    /// and the source line that it names; the program is then as before.
    void loadVertexShader(unsigned count, char const** ppSources, int* pLengths);
    void loadFragmentShader(unsigned count, char const** ppSources, int* pLengths);

    /// Links what was loaded; with bReleaseShaders the compiled shaders are given up, also when that fails,
    /// else they stay for a later link. Throws ExceptionOGL "Program did not link: ..." with the driver's log
    /// and the source line, if it names one.
    void link(bool bReleaseShaders);

    /// Whether the program can run in the present state: glValidateProgram's answer.
    bool validate() const;

    /// Makes it the current program.
    void enable();
    /// Makes fixed function current.
    void disable();

    /// Location of a uniform; -1 if the program has none of that name or is not linked.
    int getUniformLocation(char const* pName) const;

    // Setters that verify: each throws ExceptionOGL "Program is not enabled", "Uniform <name> does not
    // exist", or "Uniform <name> is of another type".

    void setUniform(char const* pName, bool value);
    void setUniform(char const* pName, float x);
    void setUniform(char const* pName, float x, float y);
    void setUniform(char const* pName, float x, float y, float z);
    void setUniform(char const* pName, float x, float y, float z, float w);
    /// The texture unit that a sampler2D reads.
    void setUniformSampler2D(char const* pName, int unit);

    // Setters that verify nothing: the program must be enabled; a uniform that is absent (-1) is left out.

    void setUniform_Unsafe(int location, float x);
    void setUniform_Unsafe(int location, float x, float y);
    void setUniform_Unsafe(int location, float x, float y, float z);
    void setUniform_Unsafe(char const* pName, float x);
    void setUniform_Unsafe(char const* pName, float x, float y);
    void setUniform_Unsafe(char const* pName, float x, float y, float z);
    void setUniformSampler1D_Unsafe(int location, int unit);
    void setUniformSampler1D_Unsafe(char const* pName, int unit);
    void setUniformSampler2D_Unsafe(int location, int unit);
    void setUniformSampler2D_Unsafe(char const* pName, int unit);
    void setUniformSampler3D_Unsafe(int location, int unit);
    void setUniformSampler3D_Unsafe(char const* pName, int unit);
    /// 9 or 16 floats, column by column, or row by row with transpose.
    void setUniformMatrix3_Unsafe(char const* pName, float const* pValues, unsigned char transpose);
    void setUniformMatrix4_Unsafe(char const* pName, float const* pValues, unsigned char transpose);

    /// A number that no other link of any program has; 0 before the first link that succeeds. Locations of
    /// uniforms hold for as long as it stays.
    std::uint64_t linkNumber() const noexcept { return nLink_; }

    /// Whether the driver has programs of the shading language.
    static bool isSupported();

private:
    struct Details;

    void loadShader(unsigned nStage, unsigned count, char const* const* ppSources, int const* pLengths);
    void releaseShaders() noexcept;
    void readUniforms();
    int verifiedLocation(char const* pName, unsigned nType) const;

    std::unique_ptr<Details> pDetails_;
    std::uint64_t nLink_ = 0;
};

} // namespace ORVO::OGL
