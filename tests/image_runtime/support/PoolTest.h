#pragma once

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/Context.h"
#include "orvo/ogl/ExceptionOGL.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/Texture3D.h"
#include "orvo/ogl/TextureRECT.h"
#include "tests/support/gl/GLTest.h"

#include <cstdint>
#include <memory>
#include <set>
#include <string>
#include <utility>
#include <vector>

namespace ORVO {

/// Makes a pool as the library does, and looks at what it counts.
class TexturePoolProbe {
public:
    static std::unique_ptr<TexturePool> create(TexturePool::Configuration const& configuration) {
        return std::unique_ptr<TexturePool>(new TexturePool(configuration));
    }
    static std::size_t freeListBytes(TexturePool const& pool) { return pool.nFreeListBytes_; }
    static void setFreeListBytes(TexturePool& pool, std::size_t nBytes) { pool.nFreeListBytes_ = nBytes; }
    static std::size_t evictionTarget(std::size_t nMaximum) { return TexturePool::evictionTarget(nMaximum); }
    static PBOQueue& queue(TexturePool& pool) { return pool.oPBOQueue_; }
    static unsigned framebuffer(TexturePool const& pool) { return pool.nFramebufferID_; }
    static std::shared_ptr<OGL::ContextOffscreen>& context(TexturePool& pool) { return pool.spContext_; }
    static void prepare(TexturePool& pool) { pool.prepareOpenGLContext(); }
};

namespace Test {

/// Keeps what a pool tells.
class RecordingListener : public VideoMemory::VideoMemoryListener {
public:
    using Event = std::pair<std::string, std::size_t>;

    void impendingMemoryAllcation(std::size_t nBytes) override { aEvents_.emplace_back("impending", nBytes); }
    void memoryFreed(std::size_t nBytes) override { aEvents_.emplace_back("freed", nBytes); }
    void memoryAllocated(std::size_t nBytes) override { aEvents_.emplace_back("allocated", nBytes); }

    std::vector<Event> take() { return std::exchange(aEvents_, {}); }

private:
    std::vector<Event> aEvents_;
};

/// Runs the code once for each call in it that can fail, with that call failing, and then its end with none
/// failing: what belongs to a hidden context is not deleted by name where that cannot be made current. Each
/// run must throw ExceptionOGL or, where the entry point is named in mayPass, may pass; none leaves an object
/// behind. Returns the entry points that have failed.
template <typename Code, typename End>
std::set<std::string> failEveryCallBefore(Code code, End end, std::set<std::string> const& mayPass) {
    std::set<std::string> aFailed;
    ObjectCounts const before = GLHooks::objects();
    for (std::uint64_t n = 1; n < 1000; ++n) {
        bool bThrown = false;
        auto pFailure = std::make_unique<GLCallFailure>(n);
        try {
            code();
        } catch (OGL::ExceptionOGL const&) {
            bThrown = true;
        }
        std::string const sName = pFailure->name();
        pFailure.reset();
        end();
        EXPECT_EQ(before, GLHooks::objects()) << "after a failed " << sName;
        if (sName.empty())
            return aFailed;
        aFailed.insert(sName);
        EXPECT_TRUE(bThrown || mayPass.count(sName) != 0) << sName << " failed unseen";
    }
    ADD_FAILURE() << "The code never ended without a failure";
    return aFailed;
}

using Events = std::vector<RecordingListener::Event>;

/// A pool of its own in a host's context.
class PoolTest : public GLTest {
protected:
    void SetUp() override {
        GLTest::SetUp();
        pContext_ = OGL::Context::adoptCurrent();
        oConfiguration_.setContext(pContext_.get());
        oConfiguration_.setVideoMemoryListener(&oListener_);
        remake();
    }

    void TearDown() override {
        if (pPool_ != nullptr)
            host().makeCurrent();
        pPool_.reset();
        pContext_.reset();
        GLTest::TearDown();
    }

    /// A new pool with the configuration as it is now.
    void remake() {
        pPool_.reset();
        pPool_ = TexturePoolProbe::create(oConfiguration_);
        oListener_.take();
    }

    TexturePool& pool() { return *pPool_; }
    std::size_t freeBytes() { return TexturePoolProbe::freeListBytes(pool()); }

    /// A 2D texture of one byte a pixel, in exact size.
    OGL::Texture2D* takeBytes(unsigned width, unsigned height = 1) {
        return pool().getTexture2DFromPool(width, height, OGL::Texture::INTERNAL_FORMAT_LUMINANCE8, true);
    }

    RecordingListener oListener_;
    TexturePool::Configuration oConfiguration_;
    std::unique_ptr<OGL::Context> pContext_;
    std::unique_ptr<TexturePool> pPool_;
};

} // namespace Test
} // namespace ORVO
