#include "orvo/image_flow/nodes/ImageFilter.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "orvo/image_runtime/BlankSIMDOptimizedImageCPU.h"
#include "orvo/image_runtime/images/ImageGPU.h"

#include <algorithm>
#include <cstdint>
#include <memory>
#include <ostream>
#include <string>

namespace ORVO {

namespace {

using DataFlow::InputConnector;
using DataFlow::OutputConnector;

using ImageOutput = DataFlow::OutputTemplate<ImageCPU>;
using ImageOutputGPU = DataFlow::OutputTemplate<ImageGPU>;

bool hasPixels(PositionExtentInPixelSpace const& region) {
    return region.extent().isDefined() && region.extent().width() > 0 && region.extent().height() > 0;
}

/// The pixels of the image that its storage has room for.
PositionExtentInPixelSpace storedRegion(ImageBase const& image) {
    ExtentInPixelSpace const capacity = image.capacityExtent();
    return {image.position(), ExtentInPixelSpace(std::min(image.extent().width(), capacity.width()),
                                                 std::min(image.extent().height(), capacity.height()))};
}

/// The image under the address that a connector of its platform keeps.
void const* dataOf(ImageBase* pImage, TargetPlatform target) {
    if (target == ORVO_TARGET_CPU) {
        return static_cast<ImageCPU*>(pImage);
    }
    return target == ORVO_TARGET_GL ? static_cast<ImageGPU*>(pImage) : nullptr;
}

/// A further output of a node on the platform; null where there is no class for it.
OutputConnector* newOutput(TargetPlatform target, std::string const& name, DataFlow::Node* pNode) {
    if (target == ORVO_TARGET_CPU) {
        return ORVO_NEW DataFlow::ConstOutput<ImageCPU>(name, pNode);
    }
    return target == ORVO_TARGET_GL ? ORVO_NEW DataFlow::ConstOutput<ImageGPU>(name, pNode) : nullptr;
}

template <typename Output>
void share(OutputConnector& from, OutputConnector& to) {
    static_cast<Output&>(to).setData(static_cast<Output&>(from).dataPointer());
}

} // namespace

ImageFilter::ImageFilter(char const* name, teOutputPrecisionHint hint)
    : Node(name),
      inputTarget_(ORVO_TARGET_UNSET),
      outputTarget_(ORVO_TARGET_UNSET),
      bPreparedForRender_(false),
      nForcedChannels_(0),
      nChannels_(0),
      spComputeRegion_(DataFlow::Parameter<PositionExtentInWorldSpace>::create(PositionExtentInWorldSpace(),
                                                                               "ComputeRegion")),
      spOutputPrecision_(DataFlow::Parameter<teOutputPrecisionHint>::create(hint, "OutputPrecisionHint")),
      oOutputPixelExtent_(1.0f, 1.0f),
      bUseDefaultPixelExtent_(true),
      bImageDescInfoFromSource_(false),
      pImageOutput_(nullptr),
      spPixelExtentSet_(std::make_shared<InputOutputImagePixelExtentSet>()) {
    registerParameter(spComputeRegion_.get());
    registerParameter(spOutputPrecision_.get());
}

ImageFilter::~ImageFilter() {
    for (OutputConnector* pClone : aClonedImageOutputs_) {
        ORVODeleter<OutputConnector>{}(pClone);
    }
}

void ImageFilter::debugWrite(std::ostream& stream) const {
    Node::debugWrite(stream);
    stream << "  ROI: " << regionOfInterest() << '\n';
    stream << "  DOD: " << domainOfDefinition() << '\n';
    if (bUseDefaultPixelExtent_) {
        stream << "  use the default output pixel extent\n";
    } else {
        stream << "  forced output pixel extent " << oOutputPixelExtent_ << '\n';
    }
    stream << "Pixel extent set:\n" << *spPixelExtentSet_;
}

void ImageFilter::flush() {
    spOutputImage_.reset();
    bPreparedForRender_ = false;
    Node::flush();
}

ImageFilter const* ImageFilter::asImageFilter() const { return this; }

ImageFilter* ImageFilter::asImageFilter() { return this; }

DataFlow::Node::BlockedRange ImageFilter::rangeToProcess() {
    BlockedRange range;
    if (hasPixels(oOutputRegionInPixels_)) {
        range.unitsPerItem = static_cast<std::uint64_t>(oOutputRegionInPixels_.extent().width());
        range.items = static_cast<std::uint64_t>(oOutputRegionInPixels_.extent().height());
    }
    return range;
}

bool ImageFilter::willRunInHardware() { return false; }

bool ImageFilter::isSIMD() const { return false; }

void ImageFilter::setBoundOutputImage(ImageBase* image) {
    ImageBase* const p = image;
    ORVO_CHECK(p == nullptr || outputTarget_ == p->targetPlatform(), "outputTarget_ == p->targetPlatform()");
    ORVO_ENFORCE(pImageOutput_);
    // The connectors keep the address of the typed object.
    void const* const pData = dataOf(p, outputTarget_);
    // An image taken earlier may be the one that was bound until now.
    spOutputImage_.reset();
    bPreparedForRender_ = false;
    pImageOutput_->setBoundData(pData);
    for (OutputConnector* pClone : aClonedImageOutputs_) {
        pClone->setBoundData(pData);
    }
}

void ImageFilter::prepareForRender() {
    if (bPreparedForRender_) {
        return;
    }
    if (outputTarget_ == ORVO_TARGET_CPU) {
        allocateOutputImage();
    }
    bPreparedForRender_ = true;
}

void ImageFilter::updateOutputRegionInPixels() {
    oOutputRegionInPixels_ = worldToPixelSpace(computeRegionParameter().value(), outputPixelExtent());
}

bool ImageFilter::takeBoundOutputImage() {
    if (pImageOutput_ == nullptr || !pImageOutput_->bound()) {
        return false;
    }
    spOutputImage_.reset();
    // The bound object is the client's image, which the client gave to be written.
    auto* const pBoundImage = const_cast<ImageCPU*>(static_cast<ImageCPU const*>(pImageOutput_->data()));
    ORVO_ENFORCE(pBoundImage);
    ORVO_CHECK(isInside(oOutputRegionInPixels_, storedRegion(*pBoundImage)),
               "Compute region lies outside the bound output image");
    spOutputImage_.setDataWithNoOwnership(pBoundImage);
    return true;
}

ImageGPU* ImageFilter::boundOutputImageGPU() const {
    if (pImageOutput_ == nullptr || !pImageOutput_->bound()) {
        return nullptr;
    }
    auto* const pBoundImage = const_cast<ImageGPU*>(static_cast<ImageGPU const*>(pImageOutput_->data()));
    ORVO_ENFORCE(pBoundImage);
    ORVO_CHECK(isInside(oOutputRegionInPixels_, storedRegion(*pBoundImage)),
               "Compute region lies outside the bound output image");
    return pBoundImage;
}

bool ImageFilter::isInside(PositionExtentInPixelSpace const& inner, PositionExtentInPixelSpace const& outer) {
    if (!hasPixels(inner)) {
        return true;
    }
    auto const begins = [](int a, int b) { return a >= b; };
    auto const ends = [](int a, int aLength, int b, int bLength) {
        return std::int64_t(a) + aLength <= std::int64_t(b) + bLength;
    };
    return hasPixels(outer) && begins(inner.position().x(), outer.position().x()) &&
           begins(inner.position().y(), outer.position().y()) &&
           ends(inner.position().x(), inner.extent().width(), outer.position().x(), outer.extent().width()) &&
           ends(inner.position().y(), inner.extent().height(), outer.position().y(), outer.extent().height());
}

bool ImageFilter::outputsAreFree() const {
    for (std::size_t iOutput = 0; iOutput < numberOfOutputs(); ++iOutput) {
        OutputConnector const& oOutput = *output(iOutput);
        if (!oOutput.bound() && oOutput.hasData()) {
            return false;
        }
    }
    return true;
}

bool ImageFilter::hasOutputImage() const {
    return spOutputImage_.get() != nullptr &&
           isInside(oOutputRegionInPixels_, spOutputImage_->positionExtent());
}

void ImageFilter::allocateOutputImage() {
    updateOutputRegionInPixels();
    if (outputTarget_ == ORVO_TARGET_GL) {
        boundOutputImageGPU();
    }
    if (outputTarget_ != ORVO_TARGET_CPU || pImageOutput_ == nullptr || takeBoundOutputImage()) {
        return;
    }
    if (hasOutputImage()) {
        return;
    }
    spOutputImage_.reset();
    ImageCPU::tePixelFormat const format = chooseOutputFormat();
    PixelExtentInWorldSpace const pixelExtent = outputPixelExtent();
    ImageCPU* const pImage =
        channelSizeBits(format) == 32
            ? ImageRuntime::getBlankSIMDOptimized32FFormat(format, oOutputRegionInPixels_.extent(),
                                                           pixelExtent, oOutputRegionInPixels_.position())
            : ORVO_NEW ImageCPU(format, oOutputRegionInPixels_, pixelExtent, ExtentInPixelSpace());
    spOutputImage_.setDataWithReleasableOwnership(pImage);
}

ImageCPU::tePixelFormat ImageFilter::chooseOutputFormat() {
    bool const bInputOnCPU = inputTarget_ == ORVO_TARGET_CPU && !aImageInputs_.empty();
    if (bImageDescInfoFromSource_ && bInputOnCPU && aImageInputs_.front()->hasData()) {
        auto format = static_cast<ImageCPU const*>(aImageInputs_.front()->data())->pixelFormat();
        std::size_t channels = ORVO::nChannels(format);
        if (std::size_t const known = getNumChannelsOutput(); known != 0) {
            channels = known;
        }
        nChannels_ = channels;
        if (outputPrecisionHintParameter().value() != OUTPUT_PRECISION_DEFAULT) {
            format = pixelFormatFor(outputPrecisionHint(), channels);
        }
        if (format != ImageCPU::PIXEL_FORMAT_UNDEFINED) {
            return format;
        }
    }
    return pixelFormatFor(outputPrecisionHint(), getNumChannelsOutput());
}

ImageCPU::tePixelFormat ImageFilter::pixelFormatFor(teOutputPrecisionHint hint, std::size_t channels) {
    static constexpr ImageCPU::tePixelFormat aFormats[4][4] = {
        {ImageCPU::PIXEL_FORMAT_LUMINANCE8, ImageCPU::PIXEL_FORMAT_LUMINANCE16,
         ImageCPU::PIXEL_FORMAT_LUMINANCE16F, ImageCPU::PIXEL_FORMAT_LUMINANCE32F},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16,
         ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F},
        {ImageCPU::PIXEL_FORMAT_RGB8, ImageCPU::PIXEL_FORMAT_RGB16, ImageCPU::PIXEL_FORMAT_RGB16F,
         ImageCPU::PIXEL_FORMAT_RGB32F},
        {ImageCPU::PIXEL_FORMAT_RGBA8, ImageCPU::PIXEL_FORMAT_RGBA16, ImageCPU::PIXEL_FORMAT_RGBA16F,
         ImageCPU::PIXEL_FORMAT_RGBA32F}};
    ORVO_CHECK(channels >= 1 && channels <= 4,
               "Not implemented: pixelFormat not supported in ImageFilter::allocateOutputImage()");
    ORVO_CHECK(hint >= OUTPUT_PRECISION_8_BIT_INT && hint <= OUTPUT_PRECISION_32_BIT_FLOAT,
               "Not implemented: Data type not supported in ImageFilter::allocateOutputImage()");
    return aFormats[channels - 1][hint];
}

std::size_t ImageFilter::getNumChannelsOutput() {
    return nForcedChannels_ != 0 ? nForcedChannels_ : nChannels_;
}

ImageFilter::teOutputPrecisionHint ImageFilter::outputPrecisionHint() {
    return outputPrecisionHintParameter().value();
}

void ImageFilter::internalProcess() {
    prepareForRender();
    bPreparedForRender_ = false;
    ImageFlowController* const pController = imageFlowController();
    ORVO_ENFORCE(pController);
    pController->processSlices(this);
    bool const bHandOn = outputTarget_ == ORVO_TARGET_CPU && pImageOutput_ != nullptr &&
                         pImageOutput_->connectedInput() != nullptr;
    if (bHandOn && !pImageOutput_->bound()) {
        static_cast<ImageOutput*>(pImageOutput_)->setData(spOutputImage_);
    }
    spOutputImage_.reset();
}

void ImageFilter::postProcess() {
    for (OutputConnector* pClone : aClonedImageOutputs_) {
        ORVO_CHECK(outputTarget_ == ORVO_TARGET_CPU || outputTarget_ == ORVO_TARGET_GL, "false");
        if (pClone->bound()) {
            continue;
        }
        if (outputTarget_ == ORVO_TARGET_CPU) {
            share<ImageOutput>(*pImageOutput_, *pClone);
        } else {
            share<ImageOutputGPU>(*pImageOutput_, *pClone);
        }
    }
    Node::postProcess();
}

InputConnector* ImageFilter::imageInput(std::size_t iImageInput) {
    ORVO_CHECK(iImageInput < aImageInputs_.size(), "Range error: iImageInput < numberOfImageInputs()");
    return aImageInputs_[iImageInput];
}

InputConnector const* ImageFilter::imageInput(std::size_t iImageInput) const {
    ORVO_CHECK(iImageInput < aImageInputs_.size(), "Range error: iImageInput < numberOfImageInputs()");
    return aImageInputs_[iImageInput];
}

InputConnector* ImageFilter::imageInput(std::string const& name) { return input(name); }

InputConnector const* ImageFilter::imageInput(std::string const& name) const { return input(name); }

OutputConnector* ImageFilter::imageOutput() { return pImageOutput_; }

OutputConnector const* ImageFilter::imageOutput() const { return pImageOutput_; }

std::size_t ImageFilter::numberOfImageInputs() const { return aImageInputs_.size(); }

std::size_t ImageFilter::numberOfImageOutputs_DEPRECATED_1_0() const {
    return pImageOutput_ == nullptr ? 0 : 1;
}

std::size_t ImageFilter::numberOfClonedImageOutputs() const { return aClonedImageOutputs_.size(); }

std::size_t ImageFilter::totalNumberOfAllImageOutputs() const {
    return aClonedImageOutputs_.size() + numberOfImageOutputs_DEPRECATED_1_0();
}

OutputConnector* ImageFilter::clonedImageOutput(std::size_t iImageOutput) {
    ORVO_CHECK(iImageOutput < aClonedImageOutputs_.size(),
               "Range error: iImageOutput < numberOfClonedImageOutputs()");
    return aClonedImageOutputs_[iImageOutput];
}

OutputConnector const* ImageFilter::clonedImageOutput(std::size_t iImageOutput) const {
    ORVO_CHECK(iImageOutput < aClonedImageOutputs_.size(),
               "Range error: iImageOutput < numberOfClonedImageOutputs()");
    return aClonedImageOutputs_[iImageOutput];
}

OutputConnector* ImageFilter::cloneImageOutput() {
    ORVO_ENFORCE(pImageOutput_);
    aClonedImageOutputs_.reserve(aClonedImageOutputs_.size() + 1);
    std::unique_ptr<OutputConnector, ORVODeleter<OutputConnector>> upClone(
        newOutput(outputTarget_, pImageOutput_->name(), this));
    if (upClone == nullptr) {
        return nullptr;
    }
    if (pImageOutput_->bound()) {
        upClone->setBoundData(pImageOutput_->data());
    }
    addOutput(upClone.get());
    aClonedImageOutputs_.push_back(upClone.get());
    return upClone.release();
}

DataFlow::Parameter<PositionExtentInWorldSpace>& ImageFilter::computeRegionParameter() {
    ORVO_ENFORCE(spComputeRegion_.get());
    return *spComputeRegion_;
}

DataFlow::Parameter<ImageFilter::teOutputPrecisionHint>& ImageFilter::outputPrecisionHintParameter() {
    ORVO_ENFORCE(spOutputPrecision_.get());
    return *spOutputPrecision_;
}

TargetPlatform ImageFilter::getInputTargetPlatform() const { return inputTarget_; }

TargetPlatform ImageFilter::getOutputTargetPlatform() const { return outputTarget_; }

ImageFlowController* ImageFilter::imageFlowController() const {
    return static_cast<ImageFlowController*>(controller());
}

void ImageFilter::setImageDescInfoFromSource(bool fromSource) { bImageDescInfoFromSource_ = fromSource; }

bool ImageFilter::getImageDescInfoFromSource() const { return bImageDescInfoFromSource_; }

void ImageFilter::computeImageDescriptorInfo(teOutputPrecisionHint hint) {
    if (outputPrecisionHint() == OUTPUT_PRECISION_DEFAULT) {
        outputPrecisionHintParameter().setValue(hint);
    }
    if (!aImageInputs_.empty() && pImageOutput_ != nullptr && getNumChannelsOutput() == 0) {
        nChannels_ = producerOf(*aImageInputs_.front())->getNumChannelsOutput();
    } else {
        nChannels_ = getNumChannelsOutput();
    }
}

void ImageFilter::addImageInput(InputConnector* input) {
    addInput(input);
    aImageInputs_.push_back(input);
}

void ImageFilter::setImageOutput(OutputConnector* output) {
    addOutput(output);
    pImageOutput_ = output;
}

bool ImageFilter::preparedForRender() const { return bPreparedForRender_; }

std::shared_ptr<InputOutputImagePixelExtentSet> const& ImageFilter::spPixelExtentSet() const {
    return spPixelExtentSet_;
}

std::ostream& operator<<(std::ostream& stream, ImageFilter::teOutputPrecisionHint hint) {
    static constexpr char const* aNames[] = {"OUTPUT_PRECISION_8_BIT_INT",    "OUTPUT_PRECISION_16_BIT_INT",
                                             "OUTPUT_PRECISION_16_BIT_FLOAT", "OUTPUT_PRECISION_32_BIT_FLOAT",
                                             "OUTPUT_PRECISION_DEFAULT",      "OUTPUT_PRECISION_UNDEFINED"};
    ORVO_CHECK(hint >= ImageFilter::OUTPUT_PRECISION_8_BIT_INT &&
                   hint <= ImageFilter::OUTPUT_PRECISION_UNDEFINED,
               "Unknown outputPrecisionHint");
    return stream << aNames[hint];
}

} // namespace ORVO
