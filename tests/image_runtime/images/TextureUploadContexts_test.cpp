// Names of an upload in several contexts, queries and buffers of the host's, failures of the driver.
#include <epoxy/gl.h>

#include <memory>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/image_runtime/images/TextureUpload.h"
#include "orvo/ogl/Buffer.h"
#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/Texture2D.h"
#include "tests/image_runtime/support/GLRuntimeTest.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/FailEveryCall.h"

namespace {

using namespace ORVO;
using Bytes = std::vector<unsigned char>;
using ORVO::Test::GLHooks;

long countOf(char const* pKind) {
    auto const counts = GLHooks::objects();
    auto const known = counts.find(pKind);
    return known != counts.end() ? known->second : 0;
}

GLuint activeQuery() {
    GLint nQuery = 0;
    glGetQueryiv(GL_SAMPLES_PASSED, GL_CURRENT_QUERY, &nQuery);
    return static_cast<GLuint>(nQuery);
}

/// As on a software driver, which the parameter says, and as on a GPU.
class TextureUploadContexts : public ORVO::Test::GLRuntimeTest, public testing::WithParamInterface<bool> {
protected:
    void SetUp() override {
        GLRuntimeTest::SetUp();
        OGL::ExtensionManager::Instance()->overrideSoftwareDriver(GetParam());
        pTexture_ =
            std::make_unique<OGL::Texture2D>(OGL::Texture::INTERNAL_FORMAT_LUMINANCE8, 3, 2, false, nullptr);
    }
    void TearDown() override {
        if (pTexture_ != nullptr) {
            host().makeCurrent();
            pTexture_.reset();
        }
        GLRuntimeTest::TearDown();
    }

    void put(TextureUpload& upload, Bytes const& aPixels) {
        upload.asyncUpload(pTexture_.get(), 0, {{0, 0}, {3, 2}}, OGL::Texture::FORMAT_LUMINANCE,
                           OGL::Texture::TYPE_UNSIGNED_BYTE, aPixels.data(), 0);
    }
    Bytes get() const {
        Bytes aRead(6);
        glBindTexture(GL_TEXTURE_2D, pTexture_->objectID());
        pTexture_->getPixelData(aRead.data(), 0, OGL::Texture::FORMAT_LUMINANCE,
                                OGL::Texture::TYPE_UNSIGNED_BYTE, 1);
        glBindTexture(GL_TEXTURE_2D, 0);
        return aRead;
    }

    Bytes const aPixels_{1, 2, 3, 4, 5, 6};
    Bytes const aOthers_{9, 8, 7, 6, 5, 4};
    std::unique_ptr<OGL::Texture2D> pTexture_;
};

TEST_P(TextureUploadContexts, MakesItsNamesOnFirstUse) {
    auto const nQueries = countOf("query");
    auto const nTextures = countOf("texture");
    host().release();
    auto pUpload = std::make_unique<TextureUpload>();
    host().makeCurrent();
    EXPECT_EQ(nQueries, countOf("query"));
    put(*pUpload, aPixels_);
    EXPECT_EQ(nQueries + 16, countOf("query"));
    EXPECT_EQ(nTextures + 4, countOf("texture"));
    put(*pUpload, aOthers_);
    EXPECT_EQ(nQueries + 16, countOf("query"));
    pUpload.reset();
    EXPECT_EQ(nQueries, countOf("query"));
    EXPECT_EQ(nTextures, countOf("texture"));
    EXPECT_EQ(aOthers_, get());
}

TEST_P(TextureUploadContexts, GivesEachQueryAResultAtFirst) {
    std::uint64_t const nBegun = GLHooks::calls("glBeginQuery");
    std::uint64_t const nFinished = GLHooks::calls("glFinish");
    TextureUpload upload;
    put(upload, aPixels_);
    EXPECT_EQ(17U, GLHooks::calls("glBeginQuery") - nBegun); // and one for the band
    EXPECT_EQ(1U, GLHooks::calls("glFinish") - nFinished);
    put(upload, aPixels_);
    EXPECT_EQ(18U, GLHooks::calls("glBeginQuery") - nBegun);
    EXPECT_EQ(1U, GLHooks::calls("glFinish") - nFinished);
}

TEST_P(TextureUploadContexts, HasNamesInEachContext) {
    auto const nQueries = countOf("query");
    auto const pSharing = host().another(true);
    {
        TextureUpload upload;
        put(upload, aPixels_);
        EXPECT_EQ(aPixels_, get());
        pSharing->makeCurrent();
        put(upload, aOthers_);
        EXPECT_EQ(nQueries + 32, countOf("query"));
        EXPECT_EQ(aOthers_, get());
        EXPECT_EQ(0U, drainErrors());
        host().makeCurrent();
        put(upload, aPixels_);
        EXPECT_EQ(nQueries + 32, countOf("query"));
        EXPECT_EQ(aPixels_, get());
        pSharing->makeCurrent();
    }
    // Those of the host's context wait for it.
    EXPECT_EQ(nQueries + 16, countOf("query"));
    host().makeCurrent();
    OGL::Context::adoptCurrent()->makeCurrent();
    TextureUpload next;
    put(next, aPixels_);
    EXPECT_EQ(nQueries + 16, countOf("query"));
}

TEST_P(TextureUploadContexts, UploadsOnAnotherThread) {
    auto const pSharing = host().another(true);
    auto pUpload = std::make_unique<TextureUpload>();
    put(*pUpload, aPixels_);
    std::thread thread([&] {
        pSharing->makeCurrent();
        put(*pUpload, aOthers_);
        EXPECT_EQ(aOthers_, get());
        EXPECT_EQ(0U, drainErrors());
        pSharing->release();
    });
    thread.join();
    EXPECT_EQ(aOthers_, get());
    put(*pUpload, aPixels_);
    EXPECT_EQ(aPixels_, get());
    // Each context's names go while it is current.
    pSharing->makeCurrent();
    pUpload.reset();
    host().makeCurrent();
    TextureUpload next;
    put(next, aPixels_);
}

TEST_P(TextureUploadContexts, KeepsNamesOfADeadUploadUntilTheirContextIsCurrent) {
    auto const nQueries = countOf("query");
    OGL::ContextOffscreen const offscreen(context());
    {
        TextureUpload upload;
        offscreen.makeCurrent();
        put(upload, aPixels_);
        EXPECT_EQ(nQueries + 16, countOf("query"));
        host().release();
    }
    EXPECT_EQ(nQueries + 16, countOf("query"));
    offscreen.makeCurrent();
    EXPECT_EQ(nQueries, countOf("query"));
    host().makeCurrent();
}

TEST_P(TextureUploadContexts, MakesNewNamesAfterAContextHasDied) {
    {
        TextureUpload upload;
        auto pSharing = host().another(true);
        for (int i = 0; i < 3; ++i) {
            pSharing->makeCurrent();
            put(upload, i % 2 == 0 ? aPixels_ : aOthers_);
            EXPECT_EQ(i % 2 == 0 ? aPixels_ : aOthers_, get());
            EXPECT_EQ(0U, drainErrors());
            host().makeCurrent();
            pSharing.reset(); // the next one is often made at the same address
            pSharing = host().another(true);
        }
    }
    EXPECT_EQ(0U, drainErrors());
    // The names of the dead contexts went with them, uncounted.
    pTexture_.reset();
    loseHost();
    GLHooks::forgetObjects();
}

TEST_P(TextureUploadContexts, LeavesAQueryOfTheHostsAlone) {
    GLuint nQuery = 0;
    glGenQueries(1, &nQuery);
    for (GLenum const nTarget : {GL_SAMPLES_PASSED, GL_ANY_SAMPLES_PASSED}) {
        glBeginQuery(nTarget, nQuery);
        {
            TextureUpload upload;
            put(upload, aPixels_);
            put(upload, aOthers_);
            EXPECT_EQ(0U, drainErrors());
        }
        GLint nActive = 0;
        glGetQueryiv(nTarget, GL_CURRENT_QUERY, &nActive);
        EXPECT_EQ(nQuery, static_cast<GLuint>(nActive));
        glEndQuery(nTarget);
        EXPECT_EQ(aOthers_, get());
        EXPECT_EQ(0U, drainErrors());
        glDeleteQueries(1, &nQuery);
        glGenQueries(1, &nQuery);
    }
    glDeleteQueries(1, &nQuery);
}

TEST_P(TextureUploadContexts, WorksWhenItsFirstUseWasBesideAQueryOfTheHosts) {
    TextureUpload upload;
    GLuint nQuery = 0;
    glGenQueries(1, &nQuery);
    glBeginQuery(GL_SAMPLES_PASSED, nQuery);
    put(upload, aPixels_);
    glEndQuery(GL_SAMPLES_PASSED);
    glDeleteQueries(1, &nQuery);
    auto const nQueries = countOf("query");
    for (int i = 0; i < 20; ++i) {
        put(upload, aOthers_);
        EXPECT_EQ(0U, activeQuery());
    }
    EXPECT_EQ(nQueries, countOf("query"));
    EXPECT_EQ(aOthers_, get());
}

TEST_P(TextureUploadContexts, GoesOnWhenThePoolHasDeletedItsQueries) {
    auto const nQueries = countOf("query");
    {
        TextureUpload upload;
        put(upload, aPixels_);
        TexturePool::Instance()->clearPBOQueue();
        for (int i = 0; i < 17; ++i)
            put(upload, i == 16 ? aOthers_ : aPixels_);
        EXPECT_EQ(aOthers_, get());
        EXPECT_EQ(0U, drainErrors());
    }
    EXPECT_EQ(nQueries, countOf("query"));
}

TEST_P(TextureUploadContexts, LeavesTheHostsBufferBound) {
    OGL::Buffer buffer(6, OGL::Buffer::TYPE_PIXEL_UNPACK, OGL::Buffer::USAGE_STREAM_DRAW, aOthers_.data());
    buffer.bind();
    for (bool const bBuffers : {true, false}) {
        if (!bBuffers) {
            OGL::ExtensionManager::Instance()->overrideSupport(OGL::EXTENSION_ARB_PIXEL_BUFFER_OBJECT, false);
            OGL::ExtensionManager::Instance()->overrideSupport(OGL::EXTENSION_EXT_PIXEL_BUFFER_OBJECT, false);
        }
        auto const before = ORVO::Test::GLState::capture();
        TextureUpload upload;
        put(upload, bBuffers ? aPixels_ : aOthers_);
        EXPECT_EQ("", before.differencesTo(ORVO::Test::GLState::capture()));
        EXPECT_TRUE(buffer.isBound());
        EXPECT_EQ(bBuffers ? aPixels_ : aOthers_, get());
    }
    OGL::Buffer::bindDefaultUnpackBuffer();
}

TEST_P(TextureUploadContexts, ReusesTheBufferOfTheLastUpload) {
    TextureUpload upload;
    put(upload, aPixels_);
    auto const nBuffers = countOf("buffer");
    for (int i = 0; i < 5; ++i) {
        glFinish();
        put(upload, aPixels_);
    }
    EXPECT_EQ(nBuffers, countOf("buffer"));
}

TEST_P(TextureUploadContexts, BeginsAQueryForEachBandOrForAll) {
    // Rows of 128 KiB, 32 of them a band.
    constexpr int nWidth = 1 << 13, nHeight = 65;
    OGL::Texture2D texture(OGL::Texture::INTERNAL_FORMAT_RGBA32F, nWidth, nHeight, false, nullptr);
    std::vector<float> const aRows(std::size_t{nWidth} * nHeight * 4, 0.5F);
    TextureUpload upload;
    put(upload, aPixels_);
    std::uint64_t const nBegun = GLHooks::calls("glBeginQuery");
    std::uint64_t const nEnded = GLHooks::calls("glEndQuery");
    auto const nBuffers = countOf("buffer");
    upload.asyncUpload(&texture, 0, {{0, 0}, {nWidth, nHeight}}, OGL::Texture::FORMAT_RGBA,
                       OGL::Texture::TYPE_FLOAT, aRows.data(), 0);
    EXPECT_EQ(GetParam() ? 1U : 3U, GLHooks::calls("glBeginQuery") - nBegun);
    EXPECT_EQ(GLHooks::calls("glBeginQuery") - nBegun, GLHooks::calls("glEndQuery") - nEnded);
    if (GetParam()) {
        // One for the bands; the last row takes the one of the first upload.
        EXPECT_EQ(nBuffers + 1, countOf("buffer"));
    }
    EXPECT_EQ(0U, activeQuery());
}

/// Empties the queue of buffers at the end of a scope, also after an exception.
struct EmptyQueue {
    ~EmptyQueue() {
        try {
            TexturePool::Instance()->clearPBOQueue();
        } catch (OGL::ExceptionOGL const&) {
            // The failure that was played fell on this.
            TexturePool::Instance()->clearPBOQueue();
        }
    }
};

TEST_P(TextureUploadContexts, LeavesNothingWhereTheDriverFails) {
    auto const state = ORVO::Test::GLState::capture();
    auto const aFailed = ORVO::Test::failEveryCall(
        [this] {
            EmptyQueue const emptyQueue;
            TextureUpload upload;
            put(upload, aPixels_);
        },
        [&] {
            host().makeCurrent();
            drainErrors();
            EXPECT_EQ(0U, activeQuery());
            EXPECT_EQ("", state.differencesTo(ORVO::Test::GLState::capture()));
            TextureUpload next;
            put(next, aOthers_);
            EXPECT_EQ(aOthers_, get());
            TexturePool::Instance()->clearPBOQueue();
        },
        {"eglMakeCurrent"});
    for (char const* const pCall :
         {"glGenQueries", "glGenTextures", "glGenBuffers", "glBufferData", "glMapBuffer", "glUnmapBuffer",
          "glTexSubImage2D", "glFenceSync", "glBeginQuery", "glEndQuery", "glFinish"})
        EXPECT_EQ(1U, aFailed.count(pCall)) << pCall;
}

TEST_P(TextureUploadContexts, GoesOnAfterAFailure) {
    TextureUpload upload;
    put(upload, aPixels_);
    for (char const* const pCall : {"glMapBuffer", "glUnmapBuffer", "glTexSubImage2D", "glBeginQuery"}) {
        {
            ORVO::Test::GLCallFailure const failure(pCall, 1);
            EXPECT_THROW(put(upload, aPixels_), OGL::ExceptionOGL) << pCall;
            EXPECT_TRUE(failure.hasFired()) << pCall;
        }
        EXPECT_EQ(0U, activeQuery()) << pCall;
        EXPECT_EQ(0U, drainErrors()) << pCall;
        put(upload, aOthers_);
        EXPECT_EQ(aOthers_, get()) << pCall;
    }
}

TEST_P(TextureUploadContexts, SaysWhatTheDriverRefused) {
    TextureUpload upload;
    put(upload, aPixels_);
    struct Row {
        char const* pCall;
        char const* pText;
    };
    for (Row const& row : {Row{"glMapBuffer", "The buffer could not be mapped (GL_OUT_OF_MEMORY)"},
                           Row{"glTexSubImage2D", "The pixels could not be uploaded (GL_OUT_OF_MEMORY)"}}) {
        ORVO::Test::GLCallFailure const failure(row.pCall, 1);
        ORVO_EXPECT_OGL(put(upload, aPixels_), row.pText);
    }
    {
        TextureUpload fresh;
        ORVO::Test::GLCallFailure const failure("glGenQueries", 1);
        ORVO_EXPECT_OGL(put(fresh, aPixels_), "The queries could not be created");
    }
    {
        TextureUpload fresh;
        ORVO::Test::GLCallFailure const failure("glFinish", 1);
        ORVO_EXPECT_OGL(put(fresh, aPixels_), "The queries could not be prepared (GL_OUT_OF_MEMORY)");
    }
    {
        TextureUpload fresh;
        ORVO::Test::GLCallFailure const failure("glGenTextures", 1);
        ORVO_EXPECT_OGL(put(fresh, aPixels_), "The texture names could not be created");
    }
    drainErrors();
    OGL::ExtensionManager::Instance()->overrideSupport(OGL::EXTENSION_ARB_PIXEL_BUFFER_OBJECT, false);
    OGL::ExtensionManager::Instance()->overrideSupport(OGL::EXTENSION_EXT_PIXEL_BUFFER_OBJECT, false);
    ORVO::Test::GLCallFailure const failure("glTexSubImage2D", 1);
    ORVO_EXPECT_OGL(put(upload, aPixels_), "The pixels could not be uploaded (GL_OUT_OF_MEMORY)");
}

TEST_P(TextureUploadContexts, NeedsAPoolThatServesTheContext) {
    TextureUpload upload;
    stopLibrary();
    ORVO_EXPECT_INTERNAL(put(upload, aPixels_), "Enforce pvDeviceObject_ != NULL");
    ImageRuntime::AutoInitializer const cpuOnly(nullptr, VideoMemory::Configuration());
    ORVO_EXPECT_INTERNAL(put(upload, aPixels_), "Enforce TexturePool::Instance() != NULL");
}

std::string driverName(testing::TestParamInfo<bool> const& bSoftware) {
    return bSoftware.param ? "Software" : "GPU";
}

INSTANTIATE_TEST_SUITE_P(, TextureUploadContexts, testing::Bool(), driverName);

} // namespace
