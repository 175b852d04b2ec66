#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/filters/ImageQuad.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/images/ImageGPU.h"

#include <memory>

namespace ORVO {

namespace OGL {
class Framebuffer;
}

/// The frame of filters on the GPU that run one pass over the whole output: preRender() makes the output
/// image and attaches it to the controller's framebuffer, the subclass sets up its shader and binds its
/// inputs, renderAndTearDown() draws the quad and hands the image on. As it stands the filter draws with
/// fixed function.
///
///     void MyFilter::internalProcess() {
///         preRender();
///         ... enable a program, bind inputs, set uniforms ...
///         renderAndTearDown();
///         ... disable the program ...
///     }
///
/// Regions are in world space and become pixels on the grid of the output image. Where the output is bound,
/// the compute region is drawn into the bound image and its other pixels stay untouched.
///
/// A pass that throws hands nothing on, unbinds what it bound, and leaves the next one right. Failures are
/// InternalExceptions with the stated texts unless another type is named.
///
/// Threads: as ImageFilter; a run needs the controller's context current.
class ORVO_API SimpleFilterGPU : public ImageFilter {
public:
    /// A filter with the image input "InputImage" and the output "OutputImage", whose precision is that of
    /// the input.
    explicit SimpleFilterGPU(char const* name);
    /// The same, but for its input, which is named "zInputName", is no image input and is never used: the
    /// subclass adds its own inputs. The flag has no meaning.
    SimpleFilterGPU(char const* name, bool bAddsOwnInputs);
    ~SimpleFilterGPU() override;

    /// Drops the output image of a pass that did not end, too.
    void flush() override;

protected:
    /// preRender(), then renderAndTearDown().
    void internalProcess() override;

    /// Makes the output image of the pass, or takes the bound one. If there are pixels to draw: attaches it
    /// to the controller's framebuffer, clears what the texture has beyond the image, and sets up matrices,
    /// viewport, and the quad, whose texture coordinates address the texture of image input 0.
    ///
    /// A new image has the pixel extent of image input 0 (1 by 1 without one) and four channels of the
    /// precision that the hint names; the default hint keeps the format of image input 0, or takes
    /// PIXEL_FORMAT_RGBA8. Throws "!outRect.isInfinite()", "Not implemented: Unknown outputPrecisionHint" for
    /// 32-bit float and undefined, "Compute region lies outside the bound output image", and "Enforce
    /// pFramebuffer_ != NULL" for a controller without a context.
    void preRender();

    /// Draws the quad if there are pixels, hands the image to the output unless that is bound, and unbinds
    /// the images of all inputs. Throws OGL::ExceptionOGL "Unsupported format (<target>,<format>) for
    /// framebuffer object rendering." or "Framebuffer attachment error: <status>" if the framebuffer is not
    /// complete.
    void renderAndTearDown();

    /// The image of an image input on the GPU, if it holds one; else null.
    ImageGPU const* inputImageGPU(std::size_t iImageInput) const;
    /// The compute region on the grid of the given pixel extent; 0 by 0 at its position if it is undefined.
    /// Throws "!outRect.isInfinite()".
    PositionExtentInPixelSpace outputRectangle(PixelExtentInWorldSpace const& pixelExtent);
    /// If the output is bound: makes the bound image the one of this pass, with the compute region as
    /// oDrawnRegion_, and answers true. Throws "Compute region lies outside the bound output image".
    bool takeBoundImage();
    /// Makes a new image the one of this pass, all of which is oDrawnRegion_.
    void setNewOutputImage(PositionExtentInPixelSpace const& rectangle, ImageGPU::tePixelFormat ePixelFormat,
                           PixelExtentInWorldSpace const& pixelExtent, bool exact);
    /// Whether there is anything to draw.
    bool hasPixelsToDraw() const;
    /// Binds the controller's framebuffer and attaches the output image to it.
    void attachOutput();
    /// Makes what the texture of a new image has beyond the image transparent black.
    void clearBeyondNewImage();
    /// Throws as renderAndTearDown() if the framebuffer is not complete.
    void requireCompleteFramebuffer() const;
    /// Takes the output image off the framebuffer and unbinds that.
    void detachOutput();
    /// Gives a new image to the output; a bound output has it already.
    void handOnOutput();
    /// Whether a pass began and neither ended nor was abandoned: a subclass threw in its midst.
    virtual bool hasUnfinishedPass() const noexcept;
    /// Abandons such a pass.
    void dropUnfinishedPass() noexcept;
    /// What a pass that throws does instead of its end. Nothing leaves it.
    virtual void abandonPass() noexcept;

    DataFlow::ConstInput<ImageGPU> oInput_;
    DataFlow::ConstOutput<ImageGPU> oOutput_;
    OGL::Framebuffer* pFramebuffer_;
    ImageGPU* pOutputImage_;
    ImageQuad o_Rectangle;
    /// The pixels that the pass draws, in pixel space: all of a new image, the compute region in a bound one.
    PositionExtentInPixelSpace oDrawnRegion_;

private:
    ImageGPU::tePixelFormat outputFormat();
    void setUpQuad();
    void unbindInputs();
    /// An image of a client's would otherwise count as bound, for ever, to a unit of a context that is gone.
    void forgetBindings() const noexcept;

    /// The image of this pass until it is handed on; empty where the output is bound.
    DataFlow::ConstDataPointer<ImageGPU> spNewImage_;
};

} // namespace ORVO
