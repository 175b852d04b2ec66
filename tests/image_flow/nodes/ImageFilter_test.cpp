#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"
#include "tests/support/Slots.h"

#include <sstream>
#include <typeinfo>

namespace ORVO {

namespace {

using Test::feed;
using Test::floatImage;
using Test::pixelAt;
using Test::pixels;
using Test::TestFilter;
using Test::world;

class ImageFilterTest : public testing::Test {
protected:
    ORVO::Test::ImageFlowLayers oLayers_;
};

/// An image that claims to live on the GPU.
class FakeGPUImage : public ImageBase {
public:
    FakeGPUImage() { eTargetPlatform_ = ORVO_TARGET_GL; }
    ExtentInPixelSpace capacityExtent() const override { return {}; }
    void initializeToTransparentBlack() override {}
};

/// A filter that never says where it runs.
class HomelessFilter : public ImageFilter {
public:
    HomelessFilter() : ImageFilter("homeless", OUTPUT_PRECISION_DEFAULT), oOutput_("out", this) {
        setImageOutput(&oOutput_);
    }
    DataFlow::ConstOutput<ImageCPU> oOutput_;
};

/// Hands its input on as it is, and lets it be changed.
class MutatingFilter : public ImageFilter {
public:
    MutatingFilter()
        : ImageFilter("mutating", OUTPUT_PRECISION_DEFAULT), oInput_("in0", this), oOutput_("out", this) {
        inputTarget_ = ORVO_TARGET_CPU;
        outputTarget_ = ORVO_TARGET_CPU;
        addImageInput(&oInput_);
        setImageOutput(&oOutput_);
    }
    ~MutatingFilter() override { disconnect(); }
    void internalProcess() override {
        bPreparedForRender_ = false;
        *pixelAt(*oInput_.get(), 0, 0) = 99.0f;
        oInput_.moveTo(oOutput_);
    }
    DataFlow::Input<ImageCPU> oInput_;
    DataFlow::Output<ImageCPU> oOutput_;
};

std::string dumpOf(ImageFilter::teOutputPrecisionHint hint) {
    std::ostringstream stream;
    stream << hint;
    return stream.str();
}

TEST_F(ImageFilterTest, addsItsOperationsInOrder) {
    using ORVO::Test::constSlotOf;
    using ORVO::Test::slotOf;
    std::ptrdiff_t slot = slotOf(&TestFilter::postProcess); // the base's last
    EXPECT_EQ(++slot, slotOf(&ImageFilter::needed));
    EXPECT_EQ(++slot, slotOf(&ImageFilter::changed));
    EXPECT_EQ(++slot, slotOf(&ImageFilter::computeDomainOfDefinition));
    EXPECT_EQ(++slot, slotOf(&ImageFilter::computeAndSetChildROIs));
    EXPECT_EQ(++slot, slotOf(&ImageFilter::generated));
    EXPECT_EQ(++slot, constSlotOf(&ImageFilter::domainOfDefinition));
    EXPECT_EQ(++slot, constSlotOf(&ImageFilter::regionOfInterest));
    EXPECT_EQ(++slot, slotOf(&ImageFilter::setGeneratedRegion));
    EXPECT_EQ(++slot, slotOf(&ImageFilter::willRunInHardware));
    EXPECT_EQ(++slot, constSlotOf(&ImageFilter::isSIMD));
    EXPECT_EQ(++slot, slotOf(&ImageFilter::setBoundOutputImage));
    EXPECT_EQ(++slot, slotOf(&ImageFilter::prepareForRender));
    EXPECT_EQ(++slot, slotOf(&ImageFilter::allocateOutputImage));
    EXPECT_EQ(++slot, slotOf(&TestFilter::getNumChannelsOutput));
    EXPECT_EQ(++slot, slotOf(&TestFilter::outputPrecisionHint));
}

TEST_F(ImageFilterTest, hintsWriteTheirNames) {
    struct Row {
        int value;
        char const* name;
    };
    for (Row const& row : {Row{0, "OUTPUT_PRECISION_8_BIT_INT"}, Row{1, "OUTPUT_PRECISION_16_BIT_INT"},
                           Row{2, "OUTPUT_PRECISION_16_BIT_FLOAT"}, Row{3, "OUTPUT_PRECISION_32_BIT_FLOAT"},
                           Row{4, "OUTPUT_PRECISION_DEFAULT"}, Row{5, "OUTPUT_PRECISION_UNDEFINED"}}) {
        EXPECT_EQ(row.name, dumpOf(static_cast<ImageFilter::teOutputPrecisionHint>(row.value)));
    }
    ORVO_EXPECT_INTERNAL(dumpOf(static_cast<ImageFilter::teOutputPrecisionHint>(6)),
                         "Unknown outputPrecisionHint");
    ORVO_EXPECT_INTERNAL(dumpOf(static_cast<ImageFilter::teOutputPrecisionHint>(-1)),
                         "Unknown outputPrecisionHint");
}

TEST_F(ImageFilterTest, startsWithoutGeometryAndWithTwoParameters) {
    HomelessFilter filter;
    EXPECT_EQ("homeless", filter.name());
    EXPECT_EQ(4, filter.getInputTargetPlatform());
    EXPECT_EQ(4, filter.getOutputTargetPlatform());
    EXPECT_FALSE(filter.domainOfDefinition().extent().isDefined());
    EXPECT_FALSE(filter.regionOfInterest().extent().isDefined());
    EXPECT_FALSE(filter.generated({}).extent().isDefined());
    EXPECT_FALSE(filter.willRunInHardware());
    EXPECT_FALSE(filter.isSIMD());
    EXPECT_FALSE(filter.getImageDescInfoFromSource());
    EXPECT_EQ(nullptr, filter.imageFlowController());
    ASSERT_EQ(2u, filter.numberOfParameters());
    EXPECT_EQ("ComputeRegion", filter.parameter(std::size_t(0))->name());
    EXPECT_EQ("OutputPrecisionHint", filter.parameter(std::size_t(1))->name());
    EXPECT_EQ(filter.parameter(std::size_t(0)), &filter.computeRegionParameter());
    EXPECT_FALSE(filter.computeRegionParameter().value().extent().isDefined());
    EXPECT_EQ(ImageFilter::OUTPUT_PRECISION_DEFAULT, filter.outputPrecisionHintParameter().value());
    EXPECT_EQ(&filter, filter.asImageFilter());
    EXPECT_EQ(&filter, static_cast<ImageFilter const&>(filter).asImageFilter());
}

TEST_F(ImageFilterTest, missingParametersAreReported) {
    TestFilter filter;
    auto const spRegion = filter.spComputeRegion_;
    auto const spHint = filter.spOutputPrecision_;
    filter.spComputeRegion_.reset();
    filter.spOutputPrecision_.reset();
    ORVO_EXPECT_INTERNAL(filter.computeRegionParameter(), "Enforce spComputeRegion_.get() != NULL");
    ORVO_EXPECT_INTERNAL(filter.outputPrecisionHintParameter(), "Enforce spOutputPrecision_.get() != NULL");
    filter.spComputeRegion_ = spRegion;
    filter.spOutputPrecision_ = spHint;
}

TEST_F(ImageFilterTest, findsItsConnectors) {
    TestFilter filter(2);
    TestFilter const& constant = filter;
    EXPECT_EQ(2u, filter.numberOfImageInputs());
    EXPECT_EQ(&filter.in(1), filter.imageInput(1));
    EXPECT_EQ(&filter.in(1), constant.imageInput(1));
    EXPECT_EQ(&filter.in(0), filter.imageInput("in0"));
    EXPECT_EQ(&filter.in(0), constant.imageInput(std::string("in0")));
    EXPECT_EQ(nullptr, filter.imageInput("in9"));
    EXPECT_EQ(&filter.oOutput_, filter.imageOutput());
    EXPECT_EQ(&filter.oOutput_, constant.imageOutput());
    EXPECT_EQ(1u, filter.numberOfImageOutputs_DEPRECATED_1_0());
    EXPECT_EQ(0u, TestFilter(1, false).numberOfImageOutputs_DEPRECATED_1_0());
    EXPECT_EQ(nullptr, TestFilter(1, false).imageOutput());
    ORVO_EXPECT_INTERNAL(filter.imageInput(2), "Range error: iImageInput < numberOfImageInputs()");
    ORVO_EXPECT_INTERNAL(constant.imageInput(2), "Range error: iImageInput < numberOfImageInputs()");
    ORVO_EXPECT_INTERNAL(filter.clonedImageOutput(0),
                         "Range error: iImageOutput < numberOfClonedImageOutputs()");
    ORVO_EXPECT_INTERNAL(constant.clonedImageOutput(0),
                         "Range error: iImageOutput < numberOfClonedImageOutputs()");
}

TEST_F(ImageFilterTest, clonesBearTheNameOfTheOutput) {
    TestFilter filter;
    DataFlow::OutputConnector* const pClone = filter.cloneImageOutput();
    ASSERT_NE(nullptr, pClone);
    EXPECT_EQ("out", pClone->name());
    EXPECT_EQ(&filter, pClone->node());
    EXPECT_FALSE(pClone->bound());
    EXPECT_EQ(1u, filter.numberOfClonedImageOutputs());
    EXPECT_EQ(pClone, filter.clonedImageOutput(0));
    EXPECT_EQ(pClone, static_cast<TestFilter const&>(filter).clonedImageOutput(0));
    EXPECT_EQ(2u, filter.numberOfOutputs());
    EXPECT_EQ(pClone, filter.output(std::size_t(1)));
    EXPECT_EQ(&filter.oOutput_, filter.imageOutput());
}

TEST_F(ImageFilterTest, nothingIsClonedWithoutAHomeOrAnOutput) {
    HomelessFilter homeless;
    EXPECT_EQ(nullptr, homeless.cloneImageOutput());
    EXPECT_EQ(0u, homeless.numberOfClonedImageOutputs());
    EXPECT_EQ(1u, homeless.numberOfOutputs());
    TestFilter sink(1, false);
    ORVO_EXPECT_INTERNAL(sink.cloneImageOutput(), "Enforce pImageOutput_ != NULL");
}

TEST_F(ImageFilterTest, aCloneOfABoundOutputIsBoundToTheSameImage) {
    TestFilter filter;
    auto const upImage = floatImage(pixels(0, 0, 2, 2), [](int, int) { return 0.0f; });
    filter.setBoundOutputImage(upImage.get());
    DataFlow::OutputConnector const* const pClone = filter.cloneImageOutput();
    EXPECT_TRUE(pClone->bound());
    EXPECT_EQ(upImage.get(), pClone->data());
}

TEST_F(ImageFilterTest, bindsAllOutputsToTheImage) {
    TestFilter filter;
    filter.cloneImageOutput();
    auto const upImage = floatImage(pixels(0, 0, 2, 2), [](int, int) { return 0.0f; });
    filter.setBoundOutputImage(upImage.get());
    EXPECT_TRUE(filter.imageOutput()->bound());
    EXPECT_EQ(upImage.get(), filter.imageOutput()->data());
    EXPECT_TRUE(filter.clonedImageOutput(0)->bound());
    EXPECT_EQ(upImage.get(), filter.clonedImageOutput(0)->data());
}

TEST_F(ImageFilterTest, refusesToBindAnImageThatLivesElsewhere) {
    TestFilter filter;
    FakeGPUImage image;
    ORVO_EXPECT_INTERNAL(filter.setBoundOutputImage(&image), "outputTarget_ == p->targetPlatform()");
    EXPECT_FALSE(filter.imageOutput()->bound());
    auto const upImage = floatImage(pixels(0, 0, 2, 2), [](int, int) { return 0.0f; });
    HomelessFilter homeless;
    ORVO_EXPECT_INTERNAL(homeless.setBoundOutputImage(upImage.get()), "outputTarget_ == p->targetPlatform()");
    TestFilter sink(1, false);
    ORVO_EXPECT_INTERNAL(sink.setBoundOutputImage(upImage.get()), "Enforce pImageOutput_ != NULL");
    ORVO_EXPECT_INTERNAL(sink.setBoundOutputImage(&image), "outputTarget_ == p->targetPlatform()");
}

TEST_F(ImageFilterTest, aTakenAwayImageIsNeverWrittenAgain) {
    TestFilter filter(0);
    auto const upImage = floatImage(pixels(0, 0, 2, 2), [](int, int) { return 5.0f; });
    filter.setBoundOutputImage(upImage.get());
    filter.computeRegionParameter().setValue(world(0, 0, 2, 2));
    filter.prepareForRender();
    filter.setBoundOutputImage(nullptr);
    EXPECT_FALSE(filter.imageOutput()->hasData());
    EXPECT_FALSE(filter.preparedForRender());
    EXPECT_EQ(nullptr, filter.spOutputImage_.get());
    ImageFlowController controller;
    controller.addNode(&filter);
    ORVO_EXPECT_INTERNAL(filter.internalProcess(), "Enforce pBoundImage != NULL");
    EXPECT_EQ(5.0f, *pixelAt(*upImage, 1, 1));
}

TEST_F(ImageFilterTest, runningWithoutAControllerIsReported) {
    TestFilter filter(0);
    filter.computeRegionParameter().setValue(world(0, 0, 2, 2));
    ORVO_EXPECT_INTERNAL(filter.internalProcess(), "Enforce pController != NULL");
}

TEST_F(ImageFilterTest, preparesOnceForEachRun) {
    TestFilter filter(0);
    filter.oOffset_.setValue(3.0f);
    ImageFlowController controller;
    controller.addNode(&filter);
    filter.computeRegionParameter().setValue(world(0, 0, 3, 2));
    filter.prepareForRender();
    EXPECT_TRUE(filter.preparedForRender());
    ImageCPU const* const pImage = filter.spOutputImage_.get();
    ASSERT_NE(nullptr, pImage);
    filter.prepareForRender();
    EXPECT_EQ(pImage, filter.spOutputImage_.get());
    TestFilter consumer(1, false);
    feed(consumer, 0, filter);
    filter.internalProcess();
    EXPECT_FALSE(filter.preparedForRender());
    EXPECT_EQ(nullptr, filter.spOutputImage_.get());
    EXPECT_EQ(pImage, filter.oOutput_.get());
    EXPECT_EQ(pImage, filter.oOutput_.data());
    EXPECT_EQ(2u, filter.nRows_);
    EXPECT_EQ(3.0f, *pixelAt(*pImage, 2, 1));
    filter.flushOutputs();
}

TEST_F(ImageFilterTest, anImageThatNobodyTakesDies) {
    TestFilter filter(0);
    ImageFlowController controller;
    controller.addNode(&filter);
    filter.computeRegionParameter().setValue(world(0, 0, 3, 2));
    filter.internalProcess();
    EXPECT_FALSE(filter.oOutput_.hasData());
    EXPECT_EQ(nullptr, filter.spOutputImage_.get());
}

TEST_F(ImageFilterTest, theRangeIsTheOutputRegion) {
    TestFilter filter(0);
    EXPECT_EQ(0u, filter.rangeToProcess().items);
    EXPECT_EQ(0u, filter.rangeToProcess().unitsPerItem);
    filter.computeRegionParameter().setValue(world(-3, 4, 7, 5));
    filter.allocateOutputImage();
    auto const range = filter.rangeToProcess();
    EXPECT_EQ(7u, range.unitsPerItem);
    EXPECT_EQ(5u, range.items);
    EXPECT_EQ(0u, range.reserved);
}

TEST_F(ImageFilterTest, flushForgetsWhatWasPrepared) {
    TestFilter filter(0);
    filter.computeRegionParameter().setValue(world(0, 0, 3, 2));
    filter.prepareForRender();
    filter.setProcessing(true);
    filter.flush();
    EXPECT_FALSE(filter.preparedForRender());
    EXPECT_EQ(nullptr, filter.spOutputImage_.get());
    EXPECT_FALSE(filter.isProcessing());
}

TEST_F(ImageFilterTest, consumersOfClonesShareTheImage) {
    TestFilter producer(0);
    TestFilter first(1, false);
    TestFilter second(1, false);
    feed(first, 0, producer);
    feed(second, 0, producer);
    ASSERT_EQ(1u, producer.numberOfClonedImageOutputs());
    ImageFlowController controller;
    controller.addNode(&producer);
    producer.computeRegionParameter().setValue(world(0, 0, 2, 2));
    producer.process();
    EXPECT_EQ(producer.oOutput_.data(), producer.clonedImageOutput(0)->data());
    first.preProcess();
    second.preProcess();
    ASSERT_NE(nullptr, first.in().get());
    EXPECT_EQ(first.in().get(), second.in().get());
    first.postProcess();
    second.postProcess();
    EXPECT_FALSE(producer.oOutput_.hasData());
}

TEST_F(ImageFilterTest, aConsumerThatChangesTheImageGetsACopyOfItsOwn) {
    TestFilter producer(0);
    producer.oOffset_.setValue(1.0f);
    TestFilter reader(1, false);
    MutatingFilter writer;
    feed(reader, 0, producer);
    feed(writer, 0, producer);
    ImageFlowController controller;
    controller.addNode(&producer);
    producer.computeRegionParameter().setValue(world(0, 0, 2, 2));
    producer.process();
    reader.preProcess();
    writer.process();
    EXPECT_EQ(1.0f, *pixelAt(*reader.in(), 0, 0));
    EXPECT_EQ(99.0f, *pixelAt(*writer.oOutput_.get(), 0, 0));
    reader.postProcess();
}

TEST_F(ImageFilterTest, aCloneOfANodeWithoutAPlatformIsRefused) {
    TestFilter filter(0);
    filter.cloneImageOutput();
    filter.outputTarget_ = ORVO_TARGET_UNSET;
    ORVO_EXPECT_INTERNAL(filter.postProcess(), "false");
    filter.outputTarget_ = ORVO_TARGET_CPU;
}

TEST_F(ImageFilterTest, dumpsItsGeometry) {
    TestFilter filter(0, true, "blur");
    filter.setRegionOfInterest(world(1, 2, 3, 4));
    filter.setDomainOfDefinition(world(5, 6, 7, 8));
    filter.computePixelExtents();
    std::ostringstream stream;
    stream << filter;
    EXPECT_EQ("Node blur [0]\n"
              "  0 inputs\n"
              "  1 outputs\n"
              "  blur [0] : out -> \n"
              "  ROI: (1, 2) (3, 4)\n"
              "  DOD: (5, 6) (7, 8)\n"
              "  use the default output pixel extent\n"
              "Pixel extent set:\n"
              "Input images:\n"
              "\n"
              "Output images:\n"
              "out  (1, 1)\n"
              "\n",
              stream.str());
    filter.setOutputPixelExtent(PixelExtentInWorldSpace(2, 0.5f));
    stream.str("");
    filter.debugWrite(stream);
    EXPECT_NE(std::string::npos, stream.str().find("  forced output pixel extent (2, 0.5)\n"));
    EXPECT_EQ(std::string::npos, stream.str().find("use the default"));
}

TEST_F(ImageFilterTest, thePixelExtentSetWritesInputsAndOutputs) {
    InputOutputImagePixelExtentSet set;
    set.aInputPixelExtents_["b"] = PixelExtentInWorldSpace(1, 2);
    set.aInputPixelExtents_["a"] = PixelExtentInWorldSpace(3, 4);
    set.aOutputPixelExtents_["out"] = PixelExtentInWorldSpace(0.5f, 0.25f);
    std::ostringstream stream;
    stream << set;
    EXPECT_EQ("Input images:\na  (3, 4)\nb  (1, 2)\n\nOutput images:\nout  (0.5, 0.25)\n\n", stream.str());
}

TEST_F(ImageFilterTest, descriptorInfoReplacesADefaultHintOnly) {
    TestFilter filter(1, true, "f", ImageFilter::OUTPUT_PRECISION_DEFAULT);
    TestFilter producer(0);
    feed(filter, 0, producer);
    filter.computeImageDescriptorInfo(ImageFilter::OUTPUT_PRECISION_16_BIT_INT);
    EXPECT_EQ(ImageFilter::OUTPUT_PRECISION_16_BIT_INT, filter.outputPrecisionHint());
    filter.computeImageDescriptorInfo(ImageFilter::OUTPUT_PRECISION_8_BIT_INT);
    EXPECT_EQ(ImageFilter::OUTPUT_PRECISION_16_BIT_INT, filter.outputPrecisionHint());
}

TEST_F(ImageFilterTest, channelCountsComeFromTheFirstProducer) {
    TestFilter first(0);
    TestFilter second(0);
    TestFilter filter(2);
    first.nForcedChannels_ = 3;
    second.nForcedChannels_ = 2;
    filter.nForcedChannels_ = 0;
    ORVO_EXPECT_INTERNAL(filter.computeImageDescriptorInfo(ImageFilter::OUTPUT_PRECISION_8_BIT_INT),
                         "Enforce pOutput != NULL");
    DataFlow::ConstOutput<ImageCPU> orphan("out", nullptr);
    DataFlow::Connect(filter.in(), orphan);
    ORVO_EXPECT_INTERNAL(filter.computeImageDescriptorInfo(ImageFilter::OUTPUT_PRECISION_8_BIT_INT),
                         "Enforce pSource != NULL");
    filter.disconnect();
    feed(filter, 0, first);
    feed(filter, 1, second);
    filter.computeImageDescriptorInfo(ImageFilter::OUTPUT_PRECISION_8_BIT_INT);
    EXPECT_EQ(3u, filter.nChannels_);
    EXPECT_EQ(3u, filter.getNumChannelsOutput());
    filter.nForcedChannels_ = 4;
    filter.computeImageDescriptorInfo(ImageFilter::OUTPUT_PRECISION_8_BIT_INT);
    EXPECT_EQ(4u, filter.nChannels_);
    TestFilter sink(1, false);
    sink.nForcedChannels_ = 0;
    feed(sink, 0, filter);
    sink.computeImageDescriptorInfo(ImageFilter::OUTPUT_PRECISION_8_BIT_INT);
    EXPECT_EQ(0u, sink.nChannels_);
}

} // namespace

} // namespace ORVO
