#include "orvo/ogl/Buffer.h"

#include <epoxy/gl.h>

#include <array>
#include <cstring>
#include <memory>
#include <type_traits>

#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/FailEveryCall.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;
using OGL::Buffer;

static_assert(std::has_virtual_destructor_v<Buffer>);

class BufferTest : public ORVO::Test::GLTest {};

TEST_F(BufferTest, HoldsACopyOfTheData) {
    constexpr std::array<int, 3> aData{1, 2, 3};
    for (int i = 0; i < 4; ++i) {
        SCOPED_TRACE(i);
        auto const type = static_cast<Buffer::Type>(i);
        Buffer buffer(sizeof aData, type, Buffer::USAGE_DYNAMIC_READ, aData.data());
        EXPECT_EQ(12, buffer.size());
        EXPECT_EQ(Buffer::Type2GL(type), buffer.target());
        EXPECT_FALSE(buffer.isBound());
        buffer.bind();
        EXPECT_TRUE(buffer.isBound());
        EXPECT_EQ(buffer.objectID(), buffer.getBoundID());
        GLint nUsage = 0;
        glGetBufferParameteriv(buffer.target(), GL_BUFFER_USAGE, &nUsage);
        EXPECT_EQ(GL_DYNAMIC_READ, nUsage);
        std::array<int, 3> aRead{};
        std::memcpy(aRead.data(), buffer.map(GL_READ_ONLY), sizeof aRead);
        buffer.unmap();
        EXPECT_EQ(aData, aRead);
        glBindBuffer(buffer.target(), 0);
    }
}

TEST_F(BufferTest, IsWrittenThroughItsMemory) {
    Buffer buffer(4, Buffer::TYPE_PIXEL_UNPACK, Buffer::USAGE_STREAM_DRAW, nullptr);
    buffer.bind();
    std::memcpy(buffer.map(GL_WRITE_ONLY), "abc", 4);
    buffer.unmap();
    std::array<char, 4> aRead{};
    glGetBufferSubData(GL_PIXEL_UNPACK_BUFFER, 0, 4, aRead.data());
    EXPECT_STREQ("abc", aRead.data());
    Buffer::bindDefaultUnpackBuffer();
    EXPECT_FALSE(buffer.isBound());
    EXPECT_EQ(0U, buffer.getBoundID());
}

TEST_F(BufferTest, KeepsWhatIsBoundWhereItIsMade) {
    Buffer first(4, Buffer::TYPE_ARRAY, Buffer::USAGE_STATIC_DRAW, nullptr);
    first.bind();
    Buffer const second(4, Buffer::TYPE_ARRAY, Buffer::USAGE_STATIC_DRAW, nullptr);
    EXPECT_TRUE(first.isBound());
    glBindBuffer(GL_ARRAY_BUFFER, 0);
}

TEST_F(BufferTest, MayBeEmpty) {
    Buffer const buffer(0, Buffer::TYPE_PIXEL_UNPACK, Buffer::USAGE_STREAM_DRAW, nullptr);
    EXPECT_EQ(0, buffer.size());
}

TEST_F(BufferTest, RefusesWhatIsNoBuffer) {
    ORVO_EXPECT_PARAMETER(Buffer(-1, Buffer::TYPE_ARRAY, Buffer::USAGE_STATIC_DRAW, nullptr), "size >= 0");
    ORVO_EXPECT_OGL(Buffer(1, static_cast<Buffer::Type>(4), Buffer::USAGE_STATIC_DRAW, nullptr),
                    "Unknown buffer type 4");
    ORVO_EXPECT_OGL(Buffer(1, Buffer::TYPE_ARRAY, static_cast<Buffer::Usage>(9), nullptr),
                    "Unknown buffer usage 9");
}

TEST_F(BufferTest, IsMappedOnlyWhileBound) {
    Buffer buffer(4, Buffer::TYPE_PIXEL_UNPACK, Buffer::USAGE_STREAM_DRAW, nullptr);
    ORVO_EXPECT_INTERNAL(buffer.map(GL_WRITE_ONLY), "isBound()");
    ORVO_EXPECT_INTERNAL(buffer.unmap(), "isBound()");
    buffer.bind();
    buffer.map(GL_WRITE_ONLY);
    ORVO_EXPECT_OGL(buffer.map(GL_WRITE_ONLY), "The buffer could not be mapped (GL_INVALID_OPERATION)");
    buffer.unmap();
    ORVO_EXPECT_OGL(buffer.unmap(), "The buffer could not be unmapped (GL_INVALID_OPERATION)");
    Buffer::bindDefaultUnpackBuffer();
}

TEST_F(BufferTest, DiesWhileMapped) {
    auto pBuffer = std::make_unique<Buffer>(4, Buffer::TYPE_PIXEL_UNPACK, Buffer::USAGE_STREAM_DRAW, nullptr);
    pBuffer->bind();
    pBuffer->map(GL_WRITE_ONLY);
    pBuffer.reset();
    GLint nBound = -1;
    glGetIntegerv(GL_PIXEL_UNPACK_BUFFER_BINDING, &nBound);
    EXPECT_EQ(0, nBound);
}

TEST_F(BufferTest, ReportsLostContents) {
    Buffer buffer(4, Buffer::TYPE_PIXEL_UNPACK, Buffer::USAGE_STREAM_DRAW, nullptr);
    buffer.bind();
    buffer.map(GL_WRITE_ONLY);
    auto const pDriver = epoxy_glUnmapBuffer;
    epoxy_glUnmapBuffer = [](GLenum) -> GLboolean { return GL_FALSE; };
    ORVO_EXPECT_OGL(buffer.unmap(), "The buffer's contents were lost while it was mapped");
    epoxy_glUnmapBuffer = pDriver;
    buffer.unmap();
    Buffer::bindDefaultUnpackBuffer();
}

TEST_F(BufferTest, LeavesNothingWhereACallFails) {
    auto const use = [] {
        Buffer buffer(16, Buffer::TYPE_PIXEL_UNPACK, Buffer::USAGE_STREAM_DRAW, nullptr);
        buffer.bind();
        buffer.map(GL_WRITE_ONLY);
        buffer.unmap();
    };
    auto const cleanUp = [] {
        drainErrors();
        Buffer::bindDefaultUnpackBuffer();
    };
    auto const aFailed = ORVO::Test::failEveryCall(use, cleanUp);
    EXPECT_EQ((std::set<std::string>{"glFenceSync", "glGenBuffers", "glBufferData", "glMapBuffer",
                                     "glUnmapBuffer"}),
              aFailed);
}

TEST_F(BufferTest, LeavesForeignBuffersAloneWhereItDiesInAForeignContext) {
    auto pBuffer = std::make_unique<Buffer>(4, Buffer::TYPE_ARRAY, Buffer::USAGE_STATIC_DRAW, nullptr);
    auto const pForeign = host().another(false);
    pForeign->makeCurrent();
    auto pOther = std::make_unique<Buffer>(4, Buffer::TYPE_ARRAY, Buffer::USAGE_STATIC_DRAW, nullptr);
    pOther->bind();
    EXPECT_EQ(pBuffer->objectID(), pOther->objectID());
    pBuffer.reset();
    EXPECT_EQ(GL_TRUE, glIsBuffer(pOther->objectID()));
    pOther.reset();
    pForeign->destroyContext();
    loseHost();
    ORVO::Test::GLHooks::forgetObjects();
}

TEST_F(BufferTest, NeedsAContext) {
    Buffer buffer(4, Buffer::TYPE_ARRAY, Buffer::USAGE_STATIC_DRAW, nullptr);
    host().release();
    constexpr char const* pNone = "No OpenGL context is current";
    ORVO_EXPECT_OGL(Buffer(4, Buffer::TYPE_ARRAY, Buffer::USAGE_STATIC_DRAW, nullptr), pNone);
    ORVO_EXPECT_OGL(buffer.bind(), pNone);
    ORVO_EXPECT_OGL(buffer.map(GL_READ_ONLY), pNone);
    ORVO_EXPECT_OGL(buffer.unmap(), pNone);
    ORVO_EXPECT_OGL(Buffer::bindDefaultUnpackBuffer(), pNone);
    host().makeCurrent();
}

} // namespace
