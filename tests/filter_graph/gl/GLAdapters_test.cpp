// The ends of a compiled graph where the client's images are textures.
#include <atomic>

#include "orvo/filter_graph/internal/ClientTextureSource.h"
#include "orvo/filter_graph/internal/GraphExecutable.h"
#include "orvo/filter_graph/internal/InputAdapter.h"
#include "orvo/filter_graph/internal/InputAdapterExecutableCPU.h"
#include "orvo/filter_graph/internal/InputAdapterExecutableGL.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/filter_graph/internal/OutputAdapterExecutable.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "orvo/image_runtime/images/ImageGPU.h"
#include "tests/filter_graph/gl/GLChain.h"
#include "tests/support/Expect.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using namespace ORVO::Test;

PositionExtentInWorldSpace world(float x, float y, float width, float height) {
    return {PositionInWorldSpace(x, y), ExtentInWorldSpace(width, height)};
}

PositionExtentInPixelSpace pixels(int x, int y, int width, int height) {
    return {PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height)};
}

/// The pixel extent that the node's output takes with the next pass.
PixelExtentInWorldSpace extentOf(ImageFilter& node) {
    struct Open : ImageFilter {
        using ImageFilter::outputPixelExtent;
    };
    node.computePixelExtents();
    return (node.*(&Open::outputPixelExtent))();
}

class GLAdaptersTest : public GLFrameTest {
protected:
    static InputAdapter& adapter(SourcePtr const& spSource) { return dynamic_cast<InputAdapter&>(*spSource); }

    ImageDescriptorGL oDescriptor_{{4, ImageDescriptor::CHANNEL_TYPE_UINT8},
                                   PixelExtentInWorldSpace(0.5f, 2.0f)};
};

TEST_F(GLAdaptersTest, ASourceIsGivenTextureExtentAndRegion) {
    OGL::Texture2D texture(OGL::Texture::INTERNAL_FORMAT_RGBA8, 2, 2, false, nullptr);
    ImageGL image(oDescriptor_, pixels(3, 4, 2, 2), &texture);
    TextureImage output(0, 0, 2, 2);
    SourcePtr const spSource = makeGLSource(&image);
    SinkPtr const spSink = makeGLSink(output.handle());
    Connect(spSource, spSink);
    GraphExecutable graph(spSink->getIFilter(), glOptions(), context());
    for (TargetPlatform const target : {ORVO_TARGET_GL, ORVO_TARGET_CPU}) {
        auto const spExecutable = adapter(spSource).buildFilterExecutable(target, graph);
        auto& executable = dynamic_cast<InputAdapterExecutableGL&>(*spExecutable);
        EXPECT_EQ(executable.getOutputTargetPlatform(), ORVO_TARGET_GL);
        auto& node = dynamic_cast<ImageGPUInput&>(*executable.getImageFlowFilter());
        EXPECT_FALSE(node.isReady()) << "nothing was emitted";
        executable.forwardStuff();
        executable.forwardStuff(); // nothing is owned, so that nothing has to be released
        ASSERT_TRUE(node.getImageGPU());
        EXPECT_EQ(node.getImageGPU()->texture(), &texture);
        EXPECT_TRUE(node.isReady());
        EXPECT_EQ(extentOf(node), PixelExtentInWorldSpace(0.5f, 2.0f));
        EXPECT_EQ(node.generated({}), world(1.5f, 8.0f, 1.0f, 4.0f));
        node.setRegionOfInterest(world(1.0f, 2.0f, 3.0f, 4.0f));
        executable.returnStuff();
        EXPECT_EQ(spSource->getRegionOfInterest(), world(1.0f, 2.0f, 3.0f, 4.0f));
    }
}

TEST_F(GLAdaptersTest, TheEndOfTheGraphIsWhereItsImageLives) {
    TextureImage texture(0, 0, 2, 2);
    ByteImage bytes(0, 0, 2, 2);
    SourcePtr const spSource = makeGLSource(bytes.handle());
    SinkPtr const spSink = makeGLSink(texture.handle());
    Connect(spSource, spSink);
    GraphExecutable graph(spSink->getIFilter(), glOptions(), context());
    OutputAdapterExecutable executable(graph, dynamic_cast<OutputAdapter&>(*spSink));
    EXPECT_EQ(executable.getInputTargetPlatform(), ORVO_TARGET_GL);
    EXPECT_EQ(executable.getOutputTargetPlatform(), ORVO_TARGET_UNSET);
    // A texture is bound to nodes on textures alone.
    GeneratorNode sink;
    executable.bind(&sink);
    ORVO_EXPECT_INTERNAL(executable.forwardStuff(), "outputTarget_ == p->targetPlatform()");
    ImageGPUInput sinkOnTextures;
    executable.bind(&sinkOnTextures);
    executable.forwardStuff();
    EXPECT_TRUE(sinkOnTextures.imageOutput()->bound());
    EXPECT_EQ(sinkOnTextures.outputPrecisionHintParameter().value(), ImageFilter::OUTPUT_PRECISION_8_BIT_INT);
}

TEST_F(GLAdaptersTest, ATextureSourceIsCleanOnlyWhileImageTextureRectangleAndStampStay) {
    OGL::Texture2D first(OGL::Texture::INTERNAL_FORMAT_RGBA8, 2, 2, false, nullptr);
    OGL::Texture2D second(OGL::Texture::INTERNAL_FORMAT_RGBA8, 2, 2, false, nullptr);
    ORVO::ImageGPU image(pixels(0, 0, 2, 2), &first, PixelExtentInWorldSpace());
    ORVO::ImageGPU otherTexture(pixels(0, 0, 2, 2), &second, PixelExtentInWorldSpace());
    ORVO::ImageGPU otherPlace(pixels(1, 0, 2, 2), &second, PixelExtentInWorldSpace());
    ClientTextureSource source;
    auto const changesWith = [&source](ORVO::ImageGPU const* pImage, std::uint64_t stamp) {
        source.noteContent(pImage, stamp);
        source.updateDirtyState();
        return source.isDirty();
    };
    EXPECT_TRUE(changesWith(&image, 7));
    EXPECT_FALSE(changesWith(&image, 7));
    EXPECT_TRUE(changesWith(&image, 8));
    EXPECT_TRUE(changesWith(&otherTexture, 8));
    EXPECT_FALSE(changesWith(&otherTexture, 8));
    EXPECT_TRUE(changesWith(&otherPlace, 8));
    EXPECT_TRUE(changesWith(nullptr, 8));
    EXPECT_TRUE(changesWith(&image, 0));
    EXPECT_TRUE(changesWith(&image, 0));
    for (ORVO::ImageGPU* const pImage : {&image, &otherTexture, &otherPlace}) {
        pImage->forgetTexture();
    }
}

std::atomic<int> nCallbacks{0};

bool countCallback(void*) {
    ++nCallbacks;
    return true;
}

TEST_F(GLAdaptersTest, AnImageOnAnotherTargetRebuilds) {
    ByteImage bytes(0, 0, kWidth, kHeight);
    bytes.write(pattern(kWidth, kHeight));
    TextureImage texture(0, 0, kWidth, kHeight);
    texture.write(plus(pattern(kWidth, kHeight), 1));
    ByteImage bytesOut(0, 0, kWidth, kHeight);
    TextureImage textureOut(0, 0, kWidth, kHeight);
    Chain chain(bytes.handle(), bytesOut.handle(), context());
    // The callback goes with the executable that it was given to.
    auto const keepsCallbackOver = [&chain](auto const& change) {
        nCallbacks = 0;
        chain.spProcessor_->setCompletionCallback(countCallback);
        change();
        chain.spProcessor_->asyncProcessFrame(glOptions());
        EXPECT_EQ(chain.spProcessor_->waitForFrame(kLong, 0.0005), IProcessorBase::FRAME_COMPLETE);
        return nCallbacks == 1;
    };
    chain.spProcessor_->processFrame(glOptions());
    EXPECT_TRUE(keepsCallbackOver([] {}));
    EXPECT_FALSE(keepsCallbackOver([&] { chain.spSource_->setImage(texture.handle()); }));
    EXPECT_EQ(bytesOut.bytes(), plus(pattern(kWidth, kHeight), 11));
    EXPECT_FALSE(keepsCallbackOver([&] { chain.spSink_->setImage(textureOut.handle()); }));
    EXPECT_EQ(textureOut.read(), plus(pattern(kWidth, kHeight), 11));
    EXPECT_TRUE(keepsCallbackOver([] {}));
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
