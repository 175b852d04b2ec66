#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/TargetPlatform.h"
#include "orvo/core/spaces/Spaces.h"
#include "orvo/data_flow/data/ConstDataPointer.h"
#include "orvo/data_flow/nodes/Node.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/image_flow/nodes/ImageConnectors.h"
#include "orvo/image_flow/nodes/InputOutputImagePixelExtentSet.h"
#include "orvo/image_runtime/images/ImageCPU.h"

#include <cstddef>
#include <cstdint>
#include <iosfwd>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace ORVO {

class ImageBase;
class ImageFlowController;
class ImageGPU;

/// The node of the image layer: every image source, sink and algorithm derives from it. It adds to
/// `DataFlow::Node` the geometry of a frame, the platforms of input and output, the output image in the
/// making and the output precision. A filter has any number of image inputs and at most one true image
/// output, plus clones of that output for fan-out (one connector feeds one partner).
///
/// The words of the geometry:
/// - world space: float scene coordinates, independent of resolution; pixel space: integers on the pixel
/// grid;
/// - pixel extent: the world size of one pixel, per connector, so a chain may change resolution;
/// - domain of definition (DOD): the world rectangle where the output has content; undefined means none
/// known;
/// - region of interest (ROI): the world rectangle that the consumers ask for;
/// - compute region: DOD intersected with ROI (world), what the node computes and what its output image
/// covers.
///   It may be undefined or empty (nothing is computed); an infinite one is refused by the controller.
///
/// A subclass sets `inputTarget_` and `outputTarget_`, makes its connectors, and calls `addImageInput` and
/// `setImageOutput` in its constructor. It implements `processSlice` (rows of the output image, counted from
/// the top of `oOutputRegionInPixels_`), and, if its geometry is not that of a point operation, `needed` and
/// `changed`. A subclass that replaces `internalProcess` must clear `bPreparedForRender_` and
/// `spOutputImage_` as the base does.
///
/// Failures are `InternalException`s with the stated texts unless another type is named.
///
/// Threads: built, wired, run and destroyed by one thread at a time; `processSlice` alone runs on many
/// threads at once, and writes nothing but its own rows.
class ORVO_API ImageFilter : public DataFlow::Node {
public:
    /// The precision of the channels of the output image.
    enum teOutputPrecisionHint : std::int32_t {
        OUTPUT_PRECISION_8_BIT_INT = 0,
        OUTPUT_PRECISION_16_BIT_INT = 1, ///< 0..32768 for 0.0 to 1.0
        OUTPUT_PRECISION_16_BIT_FLOAT = 2,
        OUTPUT_PRECISION_32_BIT_FLOAT = 3,
        OUTPUT_PRECISION_DEFAULT = 4, ///< taken from the sink or from the source
        OUTPUT_PRECISION_UNDEFINED = 5
    };

    /// World rectangles by the name of the image input whose producer defines them.
    using RegionMap = std::map<std::string, PositionExtentInWorldSpace>;

    /// A node with the parameters "ComputeRegion" (undefined) and "OutputPrecisionHint" (`hint`), in this
    /// order.
    ImageFilter(char const* name, teOutputPrecisionHint hint);
    /// Deletes the cloned outputs; all connectors must be disconnected by then.
    ~ImageFilter() override;

    ImageFilter(ImageFilter const&) = delete;
    ImageFilter& operator=(ImageFilter const&) = delete;

    /// The base's dump, then ROI, DOD, whether an output pixel extent is forced, and the pixel extent set.
    void debugWrite(std::ostream& stream) const override;
    /// Drops the output image in the making and the prepared state, then what `Node::flush` drops.
    void flush() override;
    /// This node.
    ImageFilter const* asImageFilter() const override;
    ImageFilter* asImageFilter() override;
    /// Width (units), height (items) and 0, of the output region in pixels; all zero where it is empty or
    /// undefined.
    BlockedRange rangeToProcess() override;

    /// \name Geometry that subclasses define
    /// @{

    /// The part of the named input (world) that is needed to compute `outputRegion` (world). Base:
    /// `outputRegion` itself, also where it is undefined or infinite. `inputDODs`: the producers' DODs by
    /// input name.
    virtual PositionExtentInWorldSpace needed(PositionExtentInWorldSpace const& outputRegion,
                                              std::string inputName, RegionMap const& inputDODs);
    /// The part of the output (world) that changes when `inputRegion` (world) of the named input does. Base:
    /// `inputRegion` itself, also where it is undefined or infinite.
    virtual PositionExtentInWorldSpace changed(PositionExtentInWorldSpace const& inputRegion,
                                               std::string inputName, RegionMap const& inputDODs);
    /// The DOD (world): the union of `changed` over the producers' DODs in the order of the input names, and,
    /// where there is an image output, of `generated`. Undefined where all of these are. The producers' DODs
    /// must be set. Throws "Enforce pOutput != NULL" or "Enforce pSource != NULL" for an unconnected image
    /// input.
    virtual PositionExtentInWorldSpace computeDomainOfDefinition();
    /// Hands `needed` of the own ROI to the producer of each image input, by `setParentROI`, in index order.
    /// Throws as `computeDomainOfDefinition`, with nothing handed on, and as `setParentROI`, the inputs
    /// before the failing one having handed on.
    virtual void computeAndSetChildROIs();
    /// The world rectangle that the node fills without any input. Base: the region of `setGeneratedRegion`.
    virtual PositionExtentInWorldSpace generated(RegionMap const& inputDODs);
    /// The DOD of the last pass (world); undefined at first.
    virtual PositionExtentInWorldSpace const& domainOfDefinition() const;
    /// The ROI of the last pass (world); undefined at first.
    virtual PositionExtentInWorldSpace const& regionOfInterest() const;
    /// Stores what `generated` answers (world).
    virtual void setGeneratedRegion(PositionExtentInWorldSpace const& region);
    /// @}

    /// Whether the node runs on the GPU. Base: false.
    virtual bool willRunInHardware();
    /// Whether the node wants its CPU images in the SIMD-optimised layout. Base: false.
    virtual bool isSIMD() const;

    /// Makes the true output and its clones write into `image`, which stays the caller's and must outlive the
    /// frames. Null takes the pixels away again: the outputs stay bound, to nothing, and a run fails "Enforce
    /// pBoundImage != NULL". Throws "outputTarget_ == p->targetPlatform()" where the image lives elsewhere,
    /// "Enforce pImageOutput_ != NULL" where the node has no image output.
    virtual void setBoundOutputImage(ImageBase* image);
    /// Allocates the output image unless that has been done since the last run. A client may call it before
    /// the frame; `internalProcess` calls it in any case. Throws as `allocateOutputImage`; the node is not
    /// prepared then.
    virtual void prepareForRender();
    /// Computes `oOutputRegionInPixels_` from "ComputeRegion", and, on the CPU, sees that `spOutputImage_`
    /// holds an image: the bound one, the one that is there, or a new one that covers the region, in the
    /// format of input 0's image or of hint and channel count. 32-bit float images are in the SIMD-optimised
    /// layout. New pixels are not cleared. A node without an image output allocates nothing.
    ///
    /// On the GPU the subclass makes the image.
    ///
    /// Throws "Compute region lies outside the bound output image" (nothing is written then), "Not
    /// implemented: Data type not supported in ImageFilter::allocateOutputImage()" for hints above 3 and "Not
    /// implemented: pixelFormat not supported in ImageFilter::allocateOutputImage()" for channel counts
    /// outside 1 to 4. After a failure the node holds no image.
    virtual void allocateOutputImage();

protected:
    /// The forced channel count, or, where it is 0, the one derived from upstream (0 where neither is known).
    virtual std::size_t getNumChannelsOutput();
    /// The value of "OutputPrecisionHint".
    virtual teOutputPrecisionHint outputPrecisionHint();

public:
    /// \name Connectors
    /// @{

    /// The image inputs in the order of `addImageInput`. Throws "Range error: iImageInput <
    /// numberOfImageInputs()".
    DataFlow::InputConnector* imageInput(std::size_t iImageInput);
    DataFlow::InputConnector const* imageInput(std::size_t iImageInput) const;
    /// The first input of that name; null if there is none.
    DataFlow::InputConnector* imageInput(std::string const& name);
    DataFlow::InputConnector const* imageInput(std::string const& name) const;
    /// The true image output; null for sinks.
    DataFlow::OutputConnector* imageOutput();
    DataFlow::OutputConnector const* imageOutput() const;
    /// Inputs that carry images; parameter inputs do not count.
    std::size_t numberOfImageInputs() const;
    /// 1 if there is a true image output, else 0.
    std::size_t numberOfImageOutputs_DEPRECATED_1_0() const;
    /// Outputs made by `cloneImageOutput`.
    std::size_t numberOfClonedImageOutputs() const;
    /// The clones in the order in which they were made. Throws "Range error: iImageOutput <
    /// numberOfClonedImageOutputs()".
    DataFlow::OutputConnector* clonedImageOutput(std::size_t iImageOutput);
    DataFlow::OutputConnector const* clonedImageOutput(std::size_t iImageOutput) const;
    /// A further output, owned by the node, that bears the true output's name, shares its object after each
    /// run and is bound to the same image if that is bound. Null, and nothing happens, where the output lives
    /// neither on the CPU nor on the GPU. Throws "Enforce pImageOutput_ != NULL".
    DataFlow::OutputConnector* cloneImageOutput();
    /// @}

    /// \name Regions
    /// @{
    /// Stores what `domainOfDefinition` answers (world).
    void setDomainOfDefinition(PositionExtentInWorldSpace const& region);
    /// Stores what `regionOfInterest` answers (world).
    void setRegionOfInterest(PositionExtentInWorldSpace const& region);
    /// Adds the region (world) that one consumer asks for. Throws
    /// "aParentROIs_.size() < totalNumberOfAllImageOutputs()" when more arrive than the node has outputs.
    void setParentROI(PositionExtentInWorldSpace const& region);
    /// Forgets the regions that consumers asked for.
    void clearParentROIs();
    /// Makes the ROI the union of the consumers' regions and forgets these; without any, the ROI stays.
    /// Throws "aParentROIs_.size() == totalNumberOfAllImageOutputs()" unless there is one for each output,
    /// with nothing changed.
    void computeUnionOfParentROIs();
    /// The parameter "ComputeRegion". Throws "Enforce spComputeRegion_.get() != NULL".
    DataFlow::Parameter<PositionExtentInWorldSpace>& computeRegionParameter();
    /// The parameter "OutputPrecisionHint". Throws "Enforce spOutputPrecision_.get() != NULL".
    DataFlow::Parameter<teOutputPrecisionHint>& outputPrecisionHintParameter();
    /// Forces the output's pixel extent (world units a pixel) from the next pixel extent pass on.
    void setOutputPixelExtent(PixelExtentInWorldSpace const& pixelExtent);
    /// Takes each input's extent from its producer's output, and the output's from input 0 unless it is
    /// forced or there is no image input: then it is the forced one, (1, 1) at first. The producers must have
    /// done so before. Throws "Enforce pOutput != NULL" or "Enforce pSource != NULL" for an unconnected image
    /// input.
    void computePixelExtents();
    /// @}

    /// Where the images of the inputs live; `ORVO_TARGET_UNSET` where the subclass does not say.
    TargetPlatform getInputTargetPlatform() const;
    /// Where the image of the output lives; `ORVO_TARGET_UNSET` where the subclass does not say.
    TargetPlatform getOutputTargetPlatform() const;
    /// The controller that runs the node, which is the one of the image layer; null before it was added to
    /// one.
    ImageFlowController* imageFlowController() const;

    /// True: the format of the output image follows that of the first input's image.
    void setImageDescInfoFromSource(bool fromSource);
    /// Whether it does; false at first.
    bool getImageDescInfoFromSource() const;
    /// Replaces a default precision hint by `hint` and derives the channel count from the producer of input
    /// 0, where nothing else fixes it; the producer must have done so before. Throws "Enforce pOutput !=
    /// NULL" or "Enforce pSource != NULL" where that input is unconnected.
    void computeImageDescriptorInfo(teOutputPrecisionHint hint);

protected:
    /// Adds an input that carries images; it stays the subclass's.
    void addImageInput(DataFlow::InputConnector* input);
    /// Sets the true image output; it stays the subclass's. On the CPU it is an `OutputTemplate<ImageCPU>`,
    /// on the GPU an `OutputTemplate<ImageGPU>`.
    void setImageOutput(DataFlow::OutputConnector* output);
    /// Whether `prepareForRender` has prepared the next run.
    bool preparedForRender() const;
    /// The pixel extents (world units a pixel) of the last pixel extent pass; never null.
    std::shared_ptr<InputOutputImagePixelExtentSet> const& spPixelExtentSet() const;

    /// The pixel extent (world units a pixel) of the image output; (1, 1) before the pixel extent pass.
    PixelExtentInWorldSpace outputPixelExtent() const;
    /// The pixel format of a channel count and a precision hint. Throws as `allocateOutputImage`.
    static ImageCPU::tePixelFormat pixelFormatFor(teOutputPrecisionHint hint, std::size_t channels);
    /// Whether all pixels of `inner` lie in `outer`; a rectangle without pixels lies everywhere.
    static bool isInside(PositionExtentInPixelSpace const& inner, PositionExtentInPixelSpace const& outer);
    /// Sets `oOutputRegionInPixels_` to the compute region on the output's pixel grid.
    void updateOutputRegionInPixels();
    /// If the image output is bound: checks that `oOutputRegionInPixels_` lies in the bound image, makes
    /// `spOutputImage_` point to it without owning it, and answers true. Otherwise false. Throws "Compute
    /// region lies outside the bound output image" and "Enforce pBoundImage != NULL", and leaves the node
    /// without an image then.
    bool takeBoundOutputImage();
    /// The image that is bound on the image output of a node of the GPU; null if the output is not bound.
    /// `oOutputRegionInPixels_` must be up to date. Throws "Compute region lies outside the bound output
    /// image" and "Enforce pBoundImage != NULL".
    ImageGPU* boundOutputImageGPU() const;
    /// Whether no output of the node, but for bound ones, holds data.
    bool outputsAreFree() const;
    /// Whether `spOutputImage_` holds an image that covers `oOutputRegionInPixels_`.
    bool hasOutputImage() const;

    /// Prepares, runs the slices, and hands the image to the output if that has a consumer; otherwise the
    /// image dies, unless it is the client's. Throws as `prepareForRender` and
    /// `DataFlow::Controller::processSlices`, and "Enforce pController != NULL" before the node was added to
    /// a controller.
    void internalProcess() override;
    /// Lets the clones share the true output's image, then drops the inputs' data. Throws "false" where there
    /// is a clone and the output does not live on the CPU.
    void postProcess() override;

    PositionExtentInWorldSpace oDomainOfDefinition_;
    std::vector<PositionExtentInWorldSpace> aParentROIs_;
    PositionExtentInWorldSpace oRegionOfInterest_;
    TargetPlatform inputTarget_;
    TargetPlatform outputTarget_;
    bool bPreparedForRender_;
    PositionExtentInPixelSpace oOutputRegionInPixels_;
    std::uint64_t nForcedChannels_;
    std::uint64_t nChannels_;
    DataFlow::ConstDataPointer<ImageCPU> spOutputImage_;
    std::shared_ptr<DataFlow::Parameter<PositionExtentInWorldSpace>> spComputeRegion_;
    std::shared_ptr<DataFlow::Parameter<teOutputPrecisionHint>> spOutputPrecision_;
    PositionExtentInWorldSpace oGeneratedRegion_;
    PixelExtentInWorldSpace oOutputPixelExtent_;
    bool bUseDefaultPixelExtent_;
    bool bImageDescInfoFromSource_;
    DataFlow::OutputConnector* pImageOutput_;
    std::vector<DataFlow::OutputConnector*> aClonedImageOutputs_;
    std::vector<DataFlow::InputConnector*> aImageInputs_;
    std::shared_ptr<InputOutputImagePixelExtentSet> spPixelExtentSet_;

private:
    std::size_t totalNumberOfAllImageOutputs() const;
    ImageFilter* producerOf(DataFlow::InputConnector const& input) const;
    RegionMap inputDomainsOfDefinition() const;
    ImageCPU::tePixelFormat chooseOutputFormat();
};

/// Writes the name of the hint, such as "OUTPUT_PRECISION_8_BIT_INT". Throws `InternalException` "Unknown
/// outputPrecisionHint" for any other value.
ORVO_API std::ostream& operator<<(std::ostream& stream, ImageFilter::teOutputPrecisionHint hint);

} // namespace ORVO

ORVO_DECLARE_PARAMETER(ORVO::ImageFilter::teOutputPrecisionHint)
