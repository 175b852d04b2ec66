// A host with a window: a photograph in a texture of its own, a shader filter of its own, and a result that
// is drawn from the texture that the engine drew into. Nothing is read back, but for --screenshot.
#include "common/Picture.h"
#include "orvo/filter_graph/internal/ImageFlowFilter.h"
#include "orvo/orvo.h"

#include <GLFW/glfw3.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <stdexcept>
#include <utility>

namespace FG = ORVO::FilterGraph;
using FloatParameter = ORVO::DataFlow::Parameter<float>;

namespace {

// Warms the picture's middle and darkens its corners. `radius` is 0 in the middle and 1 in the corners.
char const warmVignetteText[] = R"(
uniform vec2 _outOffset, _outPixelExtent, src_offset, src_delta;
uniform sampler2D src_sampler;
uniform vec4 picture; // position and size in world space
uniform float strength; // 0 changes nothing
void main() {
    vec2 place = gl_TexCoord[0].xy*_outPixelExtent + _outOffset;
    vec4 src = texture2D(src_sampler, (place - src_offset)*src_delta);
    float radius = length((place - picture.xy)/picture.zw - 0.5)*sqrt(2.0);
    vec3 gain = mix(vec3(1.0), vec3(1.15, 1.0, 0.8)*(1.0 - 0.8*radius*radius), strength);
    gl_FragData[0] = vec4(src.rgb*gain, src.a);
}
)";

class WarmVignette : public ORVO::BasicGLShaderFilter {
public:
    WarmVignette() : BasicGLShaderFilter("WarmVignette", warmVignetteText, 4) {
        addInput("src");
        addParameter(strength_);
    }

    void preProcess() override {
        BasicGLShaderFilter::preProcess();
        ORVO::ShaderProgramProxyOGLAutoLock const lock(oProgram_);
        ORVO::OGL::Program& program = *lock.getProgram();
        ORVO::PositionExtentInWorldSpace const& all = domainOfDefinition();
        program.enable();
        program.setUniform("picture", all.position().x(), all.position().y(), all.extent().width(),
                           all.extent().height());
        program.setUniform("strength", strength_->value());
    }

private:
    std::shared_ptr<FloatParameter> strength_ = std::make_shared<FloatParameter>(1.0F, "strength");
};

// A window whose context is current on this thread.
GLFWwindow* openWindow(int width, int height) {
    glfwInit();
    std::atexit(glfwTerminate);
    glfwWindowHint(GLFW_CONTEXT_VERSION_MAJOR, 3);
    glfwWindowHint(GLFW_CONTEXT_VERSION_MINOR, 2);
    glfwWindowHint(GLFW_OPENGL_PROFILE, GLFW_OPENGL_COMPAT_PROFILE);
    glfwWindowHint(GLFW_RESIZABLE, GLFW_FALSE);
    GLFWwindow* const window = glfwCreateWindow(width, height, "gl_host", nullptr, nullptr);
    if (!window)
        throw std::runtime_error("There is no display with OpenGL in the compatibility profile");
    glfwMakeContextCurrent(window);
    return window;
}

// Draws the texture over the whole window, its first row on top.
void draw(ORVO::OGL::Texture2D const& texture) {
    glEnable(GL_TEXTURE_2D);
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    glBegin(GL_QUADS);
    for (auto const& [x, y] : {std::pair(0, 0), {0, 1}, {1, 1}, {1, 0}}) {
        glTexCoord2i(x, y);
        glVertex2i(2 * x - 1, 1 - 2 * y);
    }
    glEnd();
    glBindTexture(GL_TEXTURE_2D, 0);
}

void run(char const* file, char const* screenshot) {
    auto picture = example::withAlpha(example::readPicture(file, example::Depth::uint8));
    ORVO::ExtentInPixelSpace const size(static_cast<int>(picture.width), static_cast<int>(picture.height));
    GLFWwindow* const window = openWindow(size.width(), size.height());

    // The layers, started with the window's context. The engine works in one of its own that shares with it.
    ORVO::Core::AutoInitializer core;
    ORVO::OGL::AutoInitializer ogl;
    auto const context = ORVO::OGL::Context::adoptCurrent();
    ORVO::ImageRuntime::AutoInitializer runtime(context.get(), ORVO::VideoMemory::Configuration());
    ORVO::DataFlow::AutoInitializer dataFlow;
    ORVO::ImageFlow::AutoInitializer imageFlow(true);
    FG::AutoInitializer filterGraph{FG::Library::InitializationOptions()};
    FG::IFilter::Identifier const id("WarmVignette", "example", "gl_host", 1);
    FG::FilterFactory::Instance()->insert(
        FG::Internal::ImageFlowFilter<WarmVignette>(id, ORVO::ORVO_TARGET_GL));

    // The host's textures, of 8 bits and four channels, and what the engine is told of them.
    auto const format = ORVO::OGL::Texture::INTERNAL_FORMAT_RGBA8;
    ORVO::OGL::Texture2D source(format, picture.width, picture.height, false, picture.pixels.data());
    ORVO::OGL::Texture2D result(format, picture.width, picture.height, false, nullptr);
    FG::ImageDescriptorGL const descriptor({4, FG::ImageDescriptor::CHANNEL_TYPE_UINT8}, {});
    ORVO::PositionExtentInPixelSpace const rectangle(size);
    FG::ImageGL sourceImage(descriptor, rectangle, &source);
    FG::ImageGL resultImage(descriptor, rectangle, &result);

    auto const input = FG::createInputAdapter(FG::IAdapter::REGION_SYNC_FROM_IMAGE);
    auto const filter = FG::FilterFactory::Instance()->create(id);
    auto const output = FG::createOutputAdapter(FG::IAdapter::REGION_SYNC_FROM_IMAGE);
    FG::Connect(input, filter);
    FG::Connect(filter, output);
    input->setImage(&sourceImage);
    output->setImage(&resultImage);
    auto const processor = FG::createProcessor(output, context.get());

    filter->parameter("strength")->as<float>().setValue(0.75F);
    processor->processFrame(FG::OptimizationOptions());
    draw(result);
    if (screenshot) {
        glReadPixels(0, 0, size.width(), size.height(), GL_RGBA, GL_UNSIGNED_BYTE, picture.pixels.data());
        return example::writePicture(screenshot, example::upsideDown(example::withoutAlpha(picture)));
    }
    for (; glfwWindowShouldClose(window) == GLFW_FALSE; glfwWaitEvents()) {
        draw(result);
        glfwSwapBuffers(window);
    }
}

} // namespace

int main(int argc, char** argv) {
    try {
        bool const shoots = argc == 4 && std::strcmp(argv[2], "--screenshot") == 0;
        if (argc != 2 && !shoots)
            throw std::runtime_error("Usage: gl_host PICTURE [--screenshot FILE]");
        run(argv[1], shoots ? argv[3] : nullptr);
        return 0;
    } catch (std::exception const& failure) {
        std::fprintf(stderr, "gl_host: %s\n", failure.what());
        return 1;
    }
}
