#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/math/Float.h"
#include "orvo/core/spaces/ExtentInPixelSpace.h"
#include "orvo/core/spaces/PositionExtentInPixelSpace.h"
#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/image_flow/filters/ImageQuad.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/ShaderProgramProxyOGL.h"
#include "orvo/image_runtime/images/ImageGPU.h"

#include <memory>
#include <string>

namespace ORVO {

class ScopedTexture2D;

namespace OGL {
class Framebuffer;
}
namespace ImageFlow::bilateral {
class PixelBuffer;
}

/// The bilateral grid on OpenGL: input "InputImage", output "OutputImage", both in textures.
///
/// Every pixel of the output's region is drawn as a point into its cell of a grid (x, y, intensity), where
/// blending adds it up; the grid is blurred along its three axes and divided by its weights; then each pixel
/// reads its result back between the eight cells around it. The intensity is the luminance, and the result
/// grey, or, with "colorize", the L of Lab, and the result in colour. The alpha of the result is that of the
/// input. Colours are filtered as they stand: whoever wants them weighted by alpha premultiplies before and
/// unpremultiplies after.
///
/// The intensity axis reaches from 0 to 1. Pixels beyond it are filtered as long as their cells lie on the
/// padding of the grid, about 4 range sigmas; those beyond that come out black.
///
/// The grid holds 16-bit floats, thousandths of the sums: with spatial sigmas above some 20 pixels its
/// rounding shows, the more so on drivers that round toward zero.
///
/// Parameters: "spatialSigma" (float2, in pixels, 0.1 to 100, default 10), "rangeSigma" (float, in units of
/// intensity, 0.01 to 1, default 0.15), "colorize" (bool, default false). The bounds inform; a value beyond
/// them runs as far as the driver has textures for its grid.
///
/// The output has four channels, 16-bit floats if the output precision hint asks for these, else 8 bits, on
/// the pixel grid of the input; where the output is bound, the compute region is drawn into the bound image
/// and its other pixels stay untouched.
///
/// Made with a context current that the image runtime knows. Without one, or on a driver without textures of
/// floats that can be drawn to, the filter stands, willRunInHardware() is false, and a run is refused. The
/// context's bindings are as they were; errors of OpenGL that are pending before or after are cleared.
///
/// Threads: as ImageFilter; a run needs the controller's context current.
class ORVO_API FastBilateralFilterGPU : public ImageFilter {
public:
    FastBilateralFilterGPU();
    ~FastBilateralFilterGPU() override;

    DataFlow::IntervalParameter<float2>& spatialSigma();
    DataFlow::IntervalParameter<float>& rangeSigma();
    DataFlow::Parameter<bool>& colorize();

    /// The region (world) outset by ceil(2.146 spatialSigma) in each direction; a sigma of NaN outsets by 0.
    PositionExtentInWorldSpace needed(PositionExtentInWorldSpace const& outputRegion, std::string inputName,
                                      RegionMap const& inputDODs) override;
    /// As needed().
    PositionExtentInWorldSpace changed(PositionExtentInWorldSpace const& inputRegion, std::string inputName,
                                       RegionMap const& inputDODs) override;

    /// Whether the driver could draw to textures of floats and the programs compiled when the filter was
    /// made.
    bool willRunInHardware() override;

    /// Whether the driver has textures large enough for the grid of a region (width and height in world
    /// units) at the present parameters. For hosts that choose between CPU and GPU.
    /// @throws OGL::ExceptionOGL "No OpenGL context is current".
    virtual bool canCreateTextureForRender(PositionExtentInWorldSpace const& region);

protected:
    /// @throws InternalException "Enforce spData_.get() != NULL" without an input image,
    ///         "!outRect.isInfinite()", "Compute region lies outside the bound output image", "Enforce
    ///         pFramebuffer_ != NULL" for a filter that does not run in hardware; OGL::ExceptionOGL and
    ///         ParameterException for what the driver refuses, a grid that is too large for it among that.
    ///         The next run is right then.
    void internalProcess() override;

private:
    void probeFloatTargets();
    void compilePrograms();

    void readParameters();
    void setUpOutput(ImageGPU const& input);
    void setUpQuad(ImageGPU const& input);
    void setUpGrid();
    void setUpBuffers();
    bool hasPixelsToDraw() const;

    void copyDataFromTextureObjectToVBO(ImageGPU const& input);
    std::unique_ptr<ScopedTexture2D> newGrid() const;
    std::unique_ptr<ScopedTexture2D> scatterInput();
    std::unique_ptr<ScopedTexture2D> blurSpace1D(ScopedTexture2D const& source, float2 const& delta);
    std::unique_ptr<ScopedTexture2D> blurRange(ScopedTexture2D const& source);
    std::unique_ptr<ScopedTexture2D> blurInto(ShaderProgramProxyOGL& oProgram, ScopedTexture2D const& source,
                                              float2 const& delta);
    void slice(ScopedTexture2D const& quotientGrid, ImageGPU const& input);
    void clearOutput();

    std::shared_ptr<DataFlow::IntervalParameter<float2>> spSpatialSigma_;
    std::shared_ptr<DataFlow::IntervalParameter<float>> spRangeSigma_;
    std::shared_ptr<DataFlow::Parameter<bool>> spColorize_;
    bool bRunInHardware_;
    DataFlow::ConstInput<ImageGPU> oInput_;
    DataFlow::ConstOutput<ImageGPU> oOutput_;
    std::unique_ptr<OGL::Framebuffer> pFramebuffer_;
    ImageGPU* pOutputImage_;
    ShaderProgramProxyOGL oScatterLuminanceProgram_;
    ShaderProgramProxyOGL oScatterLabProgram_;
    ShaderProgramProxyOGL oSliceLuminanceProgram_;
    ShaderProgramProxyOGL oSliceLabProgram_;
    ShaderProgramProxyOGL oBlurSpaceProgram_;
    ShaderProgramProxyOGL oBlurRangeProgram_;
    /// Size in pixels of the region of the frame; 0 by 0 where the compute region is undefined.
    ExtentInPixelSpace oRenderExtent_;
    /// That region, its texture coordinates those of the input's texture.
    ImageQuad oQuad_;
    unsigned nGridHeight_;
    unsigned nGridWidth_;
    unsigned nGridDepth_;
    float fRangeSigma_;
    float fSigmaX_;
    float fSigmaY_;
    /// Three floats a pixel of the region, read back from the input.
    std::unique_ptr<ImageFlow::bilateral::PixelBuffer> pColorBuffer_;
    /// Two floats a pixel: x and y. Both buffers are kept for the next frame of the same size.
    std::unique_ptr<ImageFlow::bilateral::PixelBuffer> pPositionBuffer_;

    /// Whether the slice programs have the texture unit filter the grid, which was chosen when they were
    /// compiled.
    bool bHardwareFiltersGrid_;
    bool bColorize_;
    /// The pixels of the frame, in pixel space.
    PositionExtentInPixelSpace oDrawnRegion_;
    /// The image of the frame until it is handed on; empty where the output is bound.
    DataFlow::ConstDataPointer<ImageGPU> spNewImage_;
};

} // namespace ORVO
