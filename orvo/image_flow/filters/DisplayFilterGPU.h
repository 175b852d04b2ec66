#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/filters/SimpleFilterGPU.h"
#include "orvo/image_runtime/ShaderProgramProxyOGL.h"

namespace ORVO {

namespace OGL {
class Program;
}

/// What the filters for previews on the screen share: one pass with one program, which reads the input
/// "InputImage" on texture unit 0, nearest and clamped to its edge, at the texture coordinates of the output
/// pixel in that input's texture.
///
/// The program is locked and enabled from preProcess() to postProcess(). A pass that throws leaves it
/// unlocked and fixed function enabled.
///
/// Threads: as SimpleFilterGPU. Built with a context current that the image runtime knows; without one, or
/// where the driver refuses the program, the filter stands, and willRunInHardware() is false.
class ORVO_API DisplayFilterGPU : public SimpleFilterGPU {
public:
    ~DisplayFilterGPU() override;

    /// Whether the programs were compiled when the filter was built.
    bool willRunInHardware() override;

protected:
    /// A filter of that name; the subclass compiles its programs.
    explicit DisplayFilterGPU(char const* name);

    /// Fetches the inputs, binds them, enables the program of the pass and sets its uniforms. Throws
    /// InternalException "Enforce pImage != NULL" for an input without data, OGL::ExceptionOGL where the
    /// program cannot be linked.
    void preProcess() override;
    /// Disables the program, drops the inputs, and unlocks the program.
    void postProcess() override;
    /// Unlocks the programs, too.
    void abandonPass() noexcept override;

    /// Gives a proxy its sources: the vertex program that passes on coordinates, and a fragment program.
    static void addSources(ShaderProgramProxyOGL& oProgram, char const* pFragmentSource);
    /// Links a program. Throws OGL::ExceptionOGL, and what ShaderManagerOGL::Instance() throws.
    static void link(ShaderProgramProxyOGL& oProgram);
    /// The image of image input 0. Throws "Enforce pImage != NULL" if it holds none.
    ImageGPU const& inputImage() const;
    /// Binds an image to the unit, nearest and clamped to its edge, unless it is bound already. Answers the
    /// unit that it is bound to.
    static int bindNearest(ImageGPU const& image, unsigned unit);

    /// Binds the images that the program reads. Here: the input, on unit 0.
    virtual void bindInputs();
    /// The program of this pass. Here: oProgram_.
    virtual ShaderProgramProxyOGL& programOfPass();
    /// Sets the uniforms of the program, which is enabled.
    virtual void setUniforms(OGL::Program& program) = 0;

    /// The filter's program, or its first one; the one through which every pass is disabled.
    ShaderProgramProxyOGL oProgram_;
    bool bRunInHardware_;

private:
    void unlockPrograms() noexcept;

    /// The program that a pass has locked, besides oProgram_; null between passes.
    ShaderProgramProxyOGL* pProgramOfPass_;
};

} // namespace ORVO
