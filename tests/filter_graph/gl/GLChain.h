/// What tests of frames on OpenGL run, and how they look at the host's textures.
#pragma once

#include <epoxy/gl.h>

#include <array>
#include <memory>

#include "tests/support/gl/GLFrameTest.h"

namespace ORVO::Test {

inline constexpr int kWidth = 9;
inline constexpr int kHeight = 6;
inline constexpr double kLong = 60.0; // seconds, far beyond what any frame here takes
inline constexpr float kStep = 1.0f / 255.0f;

/// host memory -> add -> host memory, or textures.
struct Chain {
    Chain(FilterGraph::ImageBase* pInput, FilterGraph::ImageBase* pOutput, OGL::Context const* pContext)
        : spSource_(makeGLSource(pInput)),
          spSink_(makeGLSink(pOutput)),
          spProcessor_(createProcessor(spSink_, pContext)) {
        Connect(spSource_, spAdd_);
        Connect(spAdd_, spSink_);
        add(10);
    }

    void add(int steps) { setParameter(*spAdd_, "value", static_cast<float>(steps) * kStep); }

    SourcePtr spSource_;
    FilterPtr spAdd_ = makeAddShader();
    SinkPtr spSink_;
    std::shared_ptr<FilterGraph::IProcessor> spProcessor_;
};

/// How a texture is sampled.
struct Sampling {
    explicit Sampling(OGL::Texture2D const& texture) {
        glBindTexture(GL_TEXTURE_2D, texture.objectID());
        constexpr GLenum aNames[] = {GL_TEXTURE_MIN_FILTER, GL_TEXTURE_MAG_FILTER, GL_TEXTURE_WRAP_S,
                                     GL_TEXTURE_WRAP_T};
        for (std::size_t i = 0; i < 4; ++i) {
            glGetTexParameteriv(GL_TEXTURE_2D, aNames[i], &aModes_[i]);
        }
        glGetTexParameterfv(GL_TEXTURE_2D, GL_TEXTURE_BORDER_COLOR, aBorder_.data());
        glBindTexture(GL_TEXTURE_2D, 0);
    }

    /// Sets a texture to what no filter wants.
    static void makeOdd(OGL::Texture2D const& texture) {
        constexpr float aBorder[] = {0.25f, 0.5f, 0.75f, 1.0f};
        glBindTexture(GL_TEXTURE_2D, texture.objectID());
        glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER, GL_NEAREST);
        glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER, GL_NEAREST);
        glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_WRAP_S, GL_REPEAT);
        glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_WRAP_T, GL_MIRRORED_REPEAT);
        glTexParameterfv(GL_TEXTURE_2D, GL_TEXTURE_BORDER_COLOR, aBorder);
        glBindTexture(GL_TEXTURE_2D, 0);
    }

    friend bool operator==(Sampling const& a, Sampling const& b) {
        return a.aModes_ == b.aModes_ && a.aBorder_ == b.aBorder_;
    }

    std::array<GLint, 4> aModes_{};
    std::array<GLfloat, 4> aBorder_{};
};

} // namespace ORVO::Test
