#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/filters/SimpleFilterGPU.h"
#include "orvo/image_runtime/ShaderProgramProxyOGL.h"
#include "orvo/image_runtime/UniformArray.h"

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace ORVO {

/// A filter on the GPU that runs one fragment program, given as a string, over any number of named inputs.
///
/// The program finds, of what it declares: for each input `src`
///
///     uniform vec2 src_pixelExtent;        // world size of one of its pixels
///     uniform float src_pixelAspectRatio;  // width / height of it
///     uniform sampler2D src_sampler;       // linear; transparent black outside
///     uniform vec2 src_delta;              // 1 / world size of its texture
///     uniform vec2 src_offset;             // world position of its first pixel
///
/// and for the output `uniform vec2 _outOffset` (world position of its first pixel) and `uniform vec2
/// _outPixelExtent`. `gl_TexCoord[0].xy` counts the output's pixels from its first one, so that the input is
/// read where the output pixel lies in world space with
///
///     texture2D(src_sampler, (gl_TexCoord[0].xy*_outPixelExtent+_outOffset-src_offset)*src_delta)
///
/// A subclass that has uniforms of its own sets them in its preProcess(), after this class's, with the
/// program locked and enabled.
///
/// Inputs take the texture units from 1 on, uniform arrays those behind them.
///
/// Threads: as SimpleFilterGPU. Built with a context current that the image runtime knows; without one the
/// filter stands, and willRunInHardware() is false.
class ORVO_API BasicGLShaderFilter : public SimpleFilterGPU {
public:
    /// Compiles the program unless the source is empty; a failure shows in willRunInHardware() alone. The
    /// subclass adds the inputs.
    /// @param fragmentSource copied; null counts as empty.
    /// @param numChannelsOutput channels of the output image, 1 and 2 of which become 3; 0 takes those of the
    ///        producer of input 0.
    BasicGLShaderFilter(char const* name, char const* fragmentSource, int numChannelsOutput);
    ~BasicGLShaderFilter() override;

    /// Whether the program was compiled when the filter was built.
    bool willRunInHardware() override;

    /// Adds an image input; its name is the prefix of its uniforms.
    void addInput(char const* name);
    /// Adds a parameter to the node. Throws InternalException "Enforce spParameter.get() != NULL".
    void addParameter(std::shared_ptr<DataFlow::ParameterBase> const& spParameter);
    /// Hands the program an array of count floats for one pass, as UniformArray does: to be called between
    /// this class's preProcess() and its internalProcess(), which drops the array.
    void addUniformArray(char const* name, float* data, unsigned count);

protected:
    /// Fetches the inputs, makes the output image, binds each input's image to a unit and sets its uniforms.
    /// Throws InternalException as allocateOutputImageGPU(), and "Enforce pImage != NULL" for an input
    /// without data.
    void preProcess() override;
    /// Draws, unbinds the inputs, drops the uniform arrays, and hands the image on. A program that does not
    /// validate draws all the same. Throws as renderAndTearDown(), and "texUnitCount_ == firstTexUnit".
    void internalProcess() override;

    /// Makes the output image of the pass, or takes the bound one. The image has the pixel extent of input 0
    /// (1 by 1 without one) and at least three channels; 16-bit hints give 16-bit formats, every other hint,
    /// 32-bit float included, 8-bit ones. Throws "!outRect.isInfinite()", "Not implemented: Only 1/2/3/4
    /// channels supported", "Not implemented: Only 1/2/3/4 channels supported in
    /// GlyphcastFilterGPU::internalProcess()", "Compute region lies outside the bound output image".
    void allocateOutputImageGPU();
    /// Adds the source to the program and links it. Throws OGL::ExceptionOGL, and what
    /// ShaderManagerOGL::Instance() throws.
    void compilePrograms();
    bool hasUnfinishedPass() const noexcept override;
    void abandonPass() noexcept override;

    static constexpr int firstTexUnit = 1;

    ShaderProgramProxyOGL oProgram_;
    std::string sFragmentSource_;
    bool bCompiled_;
    bool bExactOutput_;
    std::vector<std::shared_ptr<DataFlow::ParameterBase>> vspParameters_;
    std::vector<DataFlow::ConstInput<ImageGPU>*> vpInputs_;
    std::vector<std::shared_ptr<UniformArray>> vspUniformArrays_;
    int texUnitCount_;

private:
    /// Where the uniforms of an input are in the linked program; -1 for those that it does not have.
    struct InputUniforms {
        int iPixelExtent_;
        int iPixelAspectRatio_;
        int iSampler_;
        int iDelta_;
        int iOffset_;
    };

    void lookUpUniforms(OGL::Program const& program);
    void bindInput(ImageGPU const& image, InputUniforms const& uniforms, OGL::Program& program);
    void draw(OGL::Program& program);
    void releaseUnits();

    std::vector<InputUniforms> aInputUniforms_;
    int iOutOffset_;
    int iOutPixelExtent_;
    /// Which link of which program the locations are of; 0 for none.
    std::uint64_t nUniformsOfLink_;

public:
    /// For subclasses that derive values from their parameters. Does nothing here.
    virtual void evaluateParameters();
};

} // namespace ORVO
