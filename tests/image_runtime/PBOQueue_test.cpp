#include "orvo/image_runtime/PBOQueue.h"

#include "orvo/ogl/Buffer.h"
#include "tests/image_runtime/support/PoolTest.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/FailEveryCall.h"

#include <epoxy/gl.h>
#include <gtest/gtest.h>

#include <array>

namespace ORVO {
namespace {

using Test::GLCallFailure;
using Test::GLHooks;

constexpr unsigned nStep = 262144;

GLuint activeQuery(GLenum target = GL_SAMPLES_PASSED) {
    GLint nQuery = 0;
    glGetQueryiv(target, GL_CURRENT_QUERY, &nQuery);
    return static_cast<GLuint>(nQuery);
}

/// Queries of the context that is current at construction; deleted by hand, in that context.
struct Queries {
    Queries() { glGenQueries(static_cast<GLsizei>(aNames_.size()), aNames_.data()); }
    void destroy() { glDeleteQueries(static_cast<GLsizei>(aNames_.size()), aNames_.data()); }
    GLuint operator[](std::size_t i) const { return aNames_[i]; }

    std::array<GLuint, 4> aNames_{};
};

class PBOQueueTest : public Test::PoolTest {
protected:
    void SetUp() override {
        PoolTest::SetUp();
        oQueries_ = std::make_unique<Queries>();
    }
    void TearDown() override {
        host().makeCurrent();
        oQueries_->destroy();
        PoolTest::TearDown();
    }

    OGL::Buffer* take(unsigned nBytes, GLuint query) { return pool().getPBOFromQueue(nBytes, query); }
    void giveBack(OGL::Buffer* pBuffer) { pool().returnPBOToQueue(pBuffer); }
    std::size_t size() { return TexturePoolProbe::queue(pool()).size(); }
    std::size_t bytes() { return TexturePoolProbe::queue(pool()).bytes(); }
    GLuint query(std::size_t i) const { return (*oQueries_)[i]; }

    std::unique_ptr<Queries> oQueries_;
};

TEST_F(PBOQueueTest, RoundsSizesUpToSteps) {
    struct Row {
        unsigned nAsked_;
        long long nMade_;
    };
    for (Row const& row :
         {Row{1, nStep}, Row{nStep, nStep}, Row{nStep + 1, 2 * nStep}, Row{4194304, 4194304}, Row{0, 0}}) {
        OGL::Buffer* const pBuffer = take(row.nAsked_, query(0));
        EXPECT_EQ(row.nMade_, pBuffer->size()) << row.nAsked_;
        EXPECT_EQ(static_cast<GLenum>(GL_PIXEL_UNPACK_BUFFER), pBuffer->target());
        giveBack(pBuffer);
        pool().clearPBOQueue();
        EXPECT_EQ(0u, bytes());
        EXPECT_EQ(0u, size());
    }
}

TEST_F(PBOQueueTest, BeginsTheQueryWithTheTakeAndEndsItWithTheReturn) {
    EXPECT_EQ(0u, activeQuery());
    OGL::Buffer* const pBuffer = take(100, query(0));
    EXPECT_EQ(query(0), activeQuery());
    EXPECT_EQ(nStep, bytes());
    giveBack(pBuffer);
    EXPECT_EQ(0u, activeQuery());
    EXPECT_EQ(nStep, bytes());
    GLuint nSamples = 1;
    glGetQueryObjectuiv(query(0), GL_QUERY_RESULT, &nSamples);
    EXPECT_EQ(0u, nSamples);
}

TEST_F(PBOQueueTest, HandsOutABufferThatIsAtMostOneStepLarger) {
    OGL::Buffer* const pBuffer = take(2 * nStep, query(0));
    giveBack(pBuffer);
    struct Row {
        unsigned nAsked_;
        bool bReused_;
    };
    for (Row const& row :
         {Row{2 * nStep, true}, Row{nStep, true}, Row{nStep - 1, false}, Row{2 * nStep + 1, false}}) {
        glFinish();
        OGL::Buffer* const pTaken = take(row.nAsked_, query(1));
        EXPECT_EQ(row.bReused_, pTaken == pBuffer) << row.nAsked_;
        EXPECT_EQ(query(1), activeQuery());
        giveBack(pTaken);
    }
    EXPECT_EQ(3u, size());
    EXPECT_EQ(6u * nStep, bytes());
}

TEST_F(PBOQueueTest, HandsOutTheOneUsedLongestAgo) {
    OGL::Buffer* const pFirst = take(10, query(0));
    OGL::Buffer* const pSecond = take(10, query(1));
    giveBack(pSecond);
    giveBack(pFirst);
    glFinish();
    EXPECT_EQ(pSecond, take(10, query(2)));
    giveBack(pSecond);
    glFinish();
    EXPECT_EQ(pFirst, take(10, query(3)));
    giveBack(pFirst);
    EXPECT_EQ(2u, size());
}

TEST_F(PBOQueueTest, TakesBackTheLastOneTakenFirst) {
    OGL::Buffer* const pFirst = take(10, query(0));
    OGL::Buffer* const pSecond = take(10, query(1));
    EXPECT_NE(pFirst, pSecond);
    // Only one query is active at a time.
    EXPECT_EQ(query(1), activeQuery());
    ORVO_EXPECT_INTERNAL(giveBack(pFirst), "Buffer NOT the last one taken from the queue");
    EXPECT_EQ(query(1), activeQuery());
    EXPECT_EQ(2u, size());
    giveBack(pSecond);
    EXPECT_EQ(0u, activeQuery());
    // The first is in use still, and its query has ended: it is not to be handed out.
    glFinish();
    OGL::Buffer* const pThird = take(10, query(2));
    EXPECT_EQ(pSecond, pThird);
    giveBack(pThird);
    giveBack(pFirst);
    EXPECT_EQ(2u, size());
    EXPECT_EQ(2u * nStep, bytes());
}

TEST_F(PBOQueueTest, RefusesABufferThatItNeverMade) {
    OGL::Buffer own(nStep, OGL::Buffer::TYPE_PIXEL_UNPACK, OGL::Buffer::USAGE_STREAM_DRAW, nullptr);
    ORVO_EXPECT_INTERNAL(giveBack(&own), "Buffer never created in Pool");
    OGL::Buffer* const pBuffer = take(10, query(0));
    ORVO_EXPECT_INTERNAL(giveBack(&own), "Buffer NOT the last one taken from the queue");
    EXPECT_EQ(query(0), activeQuery());
    giveBack(pBuffer);
}

TEST_F(PBOQueueTest, RefusesABoundBufferBeforeAllElse) {
    OGL::Buffer own(nStep, OGL::Buffer::TYPE_PIXEL_UNPACK, OGL::Buffer::USAGE_STREAM_DRAW, nullptr);
    own.bind();
    ORVO_EXPECT_INTERNAL(giveBack(&own), "!pBuffer->isBound()");
    OGL::Buffer* const pBuffer = take(10, query(0));
    pBuffer->bind();
    ORVO_EXPECT_INTERNAL(giveBack(pBuffer), "!pBuffer->isBound()");
    OGL::Buffer::bindDefaultUnpackBuffer();
    giveBack(pBuffer);
}

TEST_F(PBOQueueTest, RefusesAReturnInAnotherContext) {
    char const* const sText = "Context has changed since buffer was taken from Pool";
    OGL::Buffer* const pBuffer = take(10, query(0));
    auto const pOther = host().another(true);
    pOther->makeCurrent();
    ORVO_EXPECT_INTERNAL(giveBack(pBuffer), sText);
    // Also where that context has a query of the same number.
    Queries others;
    glBeginQuery(GL_SAMPLES_PASSED, query(0));
    glEndQuery(GL_SAMPLES_PASSED);
    ORVO_EXPECT_INTERNAL(giveBack(pBuffer), sText);
    EXPECT_EQ(0u, drainErrors());
    others.destroy();
    GLuint const nSame = query(0);
    glDeleteQueries(1, &nSame);
    host().makeCurrent();
    giveBack(pBuffer);
    EXPECT_EQ(0u, activeQuery());
}

TEST_F(PBOQueueTest, RefusesAReturnAfterTheQueryWasDeleted) {
    OGL::Buffer* const pBuffer = take(10, query(0));
    oQueries_->destroy();
    ORVO_EXPECT_INTERNAL(giveBack(pBuffer), "Context has changed since buffer was taken from Pool");
    oQueries_ = std::make_unique<Queries>();
}

TEST_F(PBOQueueTest, NeedsAQueryAndAContext) {
    ORVO_EXPECT_PARAMETER(take(10, 0), "queryID != 0");
    host().release();
    ORVO_EXPECT_OGL(take(10, 1), "No OpenGL context is current");
    host().makeCurrent();
    EXPECT_EQ(0u, size());
    OGL::Buffer* const pBuffer = take(10, query(0));
    host().release();
    ORVO_EXPECT_OGL(giveBack(pBuffer), "No OpenGL context is current");
    host().makeCurrent();
    giveBack(pBuffer);
}

TEST_F(PBOQueueTest, HandsOutInOneContextWhatWasUsedInAnother) {
    OGL::Buffer* const pBuffer = take(10, query(0));
    giveBack(pBuffer);
    auto const pOther = host().another(true);
    pOther->makeCurrent();
    Queries others;
    OGL::Buffer* const pSecond = take(10, others[1]);
    EXPECT_EQ(pBuffer, pSecond);
    EXPECT_EQ(others[1], activeQuery());
    giveBack(pSecond);
    EXPECT_EQ(0u, drainErrors());
    others.destroy();
}

TEST_F(PBOQueueTest, AsksNoQueryOfTheSameNumberInAnotherContext) {
    giveBack(take(10, query(0)));
    auto const pOther = host().another(true);
    pOther->makeCurrent();
    // The host's own, active while the upload runs.
    Queries others;
    ASSERT_EQ(query(0), others[0]);
    glBeginQuery(GL_TIME_ELAPSED, others[0]);
    OGL::Buffer* const pBuffer = take(10, others[1]);
    giveBack(pBuffer);
    EXPECT_EQ(0u, drainErrors());
    EXPECT_EQ(others[0], activeQuery(GL_TIME_ELAPSED));
    glEndQuery(GL_TIME_ELAPSED);
    others.destroy();
}

TEST_F(PBOQueueTest, LeavesSomebodyElsesQueryActive) {
    for (GLenum target : {GL_SAMPLES_PASSED, GL_ANY_SAMPLES_PASSED, GL_ANY_SAMPLES_PASSED_CONSERVATIVE}) {
        Queries own;
        glBeginQuery(target, own[0]);
        OGL::Buffer* const pBuffer = take(10, query(0));
        EXPECT_EQ(own[0], activeQuery(target));
        giveBack(pBuffer);
        EXPECT_EQ(own[0], activeQuery(target));
        EXPECT_EQ(0u, drainErrors());
        // A buffer whose query never began is free at once.
        EXPECT_EQ(pBuffer, take(10, query(1)));
        giveBack(pBuffer);
        glEndQuery(target);
        EXPECT_EQ(0u, drainErrors());
        own.destroy();
        pool().clearPBOQueue();
    }
}

TEST_F(PBOQueueTest, EndsItsOwnQueryBeforeTheNext) {
    OGL::Buffer* const pFirst = take(10, query(0));
    OGL::Buffer* const pSecond = take(10, query(0));
    EXPECT_EQ(query(0), activeQuery());
    EXPECT_EQ(0u, drainErrors());
    giveBack(pSecond);
    giveBack(pFirst);
    EXPECT_EQ(0u, drainErrors());
}

TEST_F(PBOQueueTest, SkipsABufferWhoseQueryIsActive) {
    OGL::Buffer* const pFirst = take(10, query(0));
    giveBack(pFirst);
    glFinish();
    // The same query, begun by its owner for something else.
    glBeginQuery(GL_SAMPLES_PASSED, query(0));
    OGL::Buffer* const pSecond = take(10, query(1));
    EXPECT_NE(pFirst, pSecond);
    EXPECT_EQ(0u, drainErrors());
    giveBack(pSecond);
    if (activeQuery() != 0)
        glEndQuery(GL_SAMPLES_PASSED);
    EXPECT_EQ(0u, drainErrors());
}

TEST_F(PBOQueueTest, KeepsToItsBudgetOldestFirst) {
    // 40 MiB each: the fourth makes 160 MiB.
    constexpr unsigned nBytes = 40u << 20;
    OGL::Buffer* aBuffers[4];
    for (std::size_t i = 0; i < 4; ++i)
        aBuffers[i] = take(nBytes, query(i));
    EXPECT_EQ(4u * nBytes, bytes());
    // Those in use are kept, whatever they hold: the one given back goes.
    giveBack(aBuffers[3]);
    EXPECT_EQ(3u, size());
    EXPECT_EQ(3u * nBytes, bytes());
    for (std::size_t i : {2, 1, 0})
        giveBack(aBuffers[i]);
    EXPECT_EQ(3u, size());
    EXPECT_EQ(0u, drainErrors());
    // In order of last use: 2, 1, 0. One of another size makes 128 MiB and a step: the oldest goes.
    OGL::Buffer* const pOther = take((8u << 20) + 1, query(3));
    EXPECT_EQ((128u << 20) + nStep, bytes());
    giveBack(pOther);
    EXPECT_EQ((88u << 20) + nStep, bytes());
    glFinish();
    EXPECT_EQ(aBuffers[1], take(nBytes, query(0)));
    giveBack(aBuffers[1]);
}

TEST_F(PBOQueueTest, KeepsExactlyItsBudget) {
    OGL::Buffer* const pBuffer = take(128u << 20, query(0));
    giveBack(pBuffer);
    EXPECT_EQ(1u, size());
    OGL::Buffer* const pSmall = take(1, query(1));
    giveBack(pSmall);
    EXPECT_EQ(1u, size());
    EXPECT_EQ(nStep, bytes());
}

TEST_F(PBOQueueTest, ClearsBuffersAndQueries) {
    OGL::Buffer* const pFirst = take(10, query(0));
    giveBack(pFirst);
    take(nStep * 4, query(1));
    auto const before = GLHooks::objects();
    pool().clearPBOQueue();
    EXPECT_EQ(0u, size());
    EXPECT_EQ(0u, bytes());
    EXPECT_EQ(0u, activeQuery());
    EXPECT_FALSE(glIsQuery(query(0)));
    EXPECT_FALSE(glIsQuery(query(1)));
    auto after = GLHooks::objects();
    EXPECT_EQ(before.at("query"), after["query"] + 2);
    EXPECT_EQ(before.at("buffer"), after["buffer"] + 2);
    pool().clearPBOQueue();
    pool().clearAll();
    // The two that were never begun are left for the end of the test.
    EXPECT_EQ(0u, drainErrors());
}

TEST_F(PBOQueueTest, ClearsInAnotherContextWhatIsShared) {
    giveBack(take(10, query(0)));
    auto const pOther = host().another(true);
    pOther->makeCurrent();
    Queries others;
    glBeginQuery(GL_SAMPLES_PASSED, others[0]);
    glEndQuery(GL_SAMPLES_PASSED);
    pool().clearAll();
    EXPECT_EQ(0u, size());
    EXPECT_TRUE(glIsQuery(others[0]));
    others.destroy();
    host().release();
    pool().clearAll();
    host().makeCurrent();
    EXPECT_TRUE(glIsQuery(query(0)));
}

TEST_F(PBOQueueTest, SurvivesEveryFailureOfTheDriver) {
    auto const code = [this] {
        OGL::Buffer* const pFirst = take(10, query(0));
        giveBack(pFirst);
    };
    auto const next = [this] {
        drainErrors();
        OGL::Buffer* const pNext = take(10, query(1));
        EXPECT_EQ(query(1), activeQuery());
        giveBack(pNext);
        EXPECT_EQ(0u, activeQuery());
        pool().clearPBOQueue();
        EXPECT_EQ(0u, drainErrors());
        oQueries_->destroy();
        oQueries_ = std::make_unique<Queries>();
    };
    for (char const* sName : {"glGenBuffers", "glBufferData", "glBeginQuery", "glEndQuery"}) {
        SCOPED_TRACE(sName);
        GLCallFailure const failure(sName, 1);
        EXPECT_THROW(code(), OGL::ExceptionOGL);
        EXPECT_TRUE(failure.hasFired());
        next();
    }
}

TEST_F(PBOQueueTest, LeavesAFailedTakeFree) {
    OGL::Buffer* const pBuffer = take(10, query(0));
    giveBack(pBuffer);
    glFinish();
    {
        GLCallFailure const failure("glBeginQuery", 1);
        ORVO_EXPECT_OGL(take(10, query(1)), "The query of an upload could not be begun (GL_OUT_OF_MEMORY)");
    }
    EXPECT_EQ(pBuffer, take(10, query(1)));
    {
        GLCallFailure const failure("glEndQuery", 1);
        ORVO_EXPECT_OGL(giveBack(pBuffer), "The query of an upload could not be ended (GL_OUT_OF_MEMORY)");
    }
    // Its query is active still: another one is made, and that query ended first.
    OGL::Buffer* const pOther = take(10, query(2));
    EXPECT_NE(pBuffer, pOther);
    EXPECT_EQ(query(2), activeQuery());
    giveBack(pOther);
    EXPECT_EQ(0u, drainErrors());
}

} // namespace
} // namespace ORVO
