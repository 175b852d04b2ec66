// Objects that die where their name cannot be deleted: it is deleted later.
#include "orvo/ogl/Object.h"

#include <epoxy/gl.h>

#include <memory>
#include <thread>
#include <vector>

#include "orvo/ogl/Buffer.h"
#include "orvo/ogl/Context.h"
#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/Program.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/Texture3D.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;
using ORVO::Test::GLHooks;
using ORVO::Test::ObjectCounts;

/// Objects of every kind, a program with shaders of its own among them.
class Things {
public:
    Things()
        : oBuffer_(4, OGL::Buffer::TYPE_ARRAY, OGL::Buffer::USAGE_STATIC_DRAW, nullptr),
          oFlat_(OGL::Texture::INTERNAL_FORMAT_RGBA8, 2, 2, false, nullptr),
          oDeep_(OGL::Texture::INTERNAL_FORMAT_RGBA8, 2, 2, 2, false) {
        char const* pSource = "void main() { gl_FragColor = vec4(1.0); }";
        oLinked_.loadFragmentShader(1, &pSource, nullptr);
        oLinked_.link(true);
        oUnlinked_.loadFragmentShader(1, &pSource, nullptr);
    }

    /// What there is of each kind.
    static ObjectCounts counts() { return {{"buffer", 1}, {"texture", 2}, {"program", 2}, {"shader", 1}}; }

private:
    OGL::Buffer oBuffer_;
    OGL::Texture2D oFlat_;
    OGL::Texture3D oDeep_;
    OGL::Program oLinked_;
    OGL::Program oUnlinked_;
};

/// The objects that are alive beside those that contexts have for themselves.
ObjectCounts shared() {
    ObjectCounts counts = GLHooks::objects();
    for (auto iKind = counts.begin(); iKind != counts.end();)
        iKind = iKind->second == 0 || Things::counts().count(iKind->first) == 0 ? counts.erase(iKind)
                                                                                : std::next(iKind);
    return counts;
}

class ObjectTest : public ORVO::Test::GLTestOnEachInterface {};

TEST_P(ObjectTest, IsDeletedLaterWhereItDiesWithoutAContext) {
    auto const pHost = OGL::Context::adoptCurrent();
    auto pThings = std::make_unique<Things>();
    EXPECT_EQ(Things::counts(), shared());
    host().release();
    pThings.reset();
    EXPECT_EQ(Things::counts(), shared());
    // A host's own switch of contexts is not seen.
    host().makeCurrent();
    EXPECT_EQ(Things::counts(), shared());
    pHost->makeCurrent();
    EXPECT_EQ(ObjectCounts(), shared());
}

TEST_P(ObjectTest, IsDeletedWhereAnotherOneIsMade) {
    auto const pHost = OGL::Context::adoptCurrent();
    auto pThings = std::make_unique<Things>();
    host().release();
    pThings.reset();
    host().makeCurrent();
    { OGL::Buffer const next(4, OGL::Buffer::TYPE_ARRAY, OGL::Buffer::USAGE_STATIC_DRAW, nullptr); }
    EXPECT_EQ(ObjectCounts(), shared());
}

TEST_P(ObjectTest, IsDeletedInAnyContextOfItsGroupAndInNoOther) {
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const sharing(pHost.get());
    auto const pForeign = host().another(false);
    auto pThings = std::make_unique<Things>();
    pForeign->makeCurrent();
    auto const pForeignContext = OGL::Context::adoptCurrent();
    {
        // On drivers that count names in each group they bear the same numbers.
        Things const foreign;
        pThings.reset();
        ObjectCounts twice = Things::counts();
        for (auto& [sKind, nObjects] : twice)
            nObjects *= 2;
        EXPECT_EQ(twice, shared());
        pForeignContext->makeCurrent();
        EXPECT_EQ(twice, shared());
    }
    EXPECT_EQ(Things::counts(), shared());
    sharing.makeCurrent();
    EXPECT_EQ(ObjectCounts(), shared());
    host().makeCurrent();
}

TEST_P(ObjectTest, IsDeletedWithTheLastContextOfTheLibrary) {
    auto pHost = OGL::Context::adoptCurrent();
    auto pThings = std::make_unique<Things>();
    host().release();
    pThings.reset();
    pHost.reset(); // makes the context current for the moment
    EXPECT_EQ(ObjectCounts(), shared());
    host().makeCurrent();
}

TEST_P(ObjectTest, MayDieOnAThreadWithoutAContext) {
    auto const pHost = OGL::Context::adoptCurrent();
    std::vector<std::unique_ptr<Things>> aThings;
    for (int i = 0; i < 4; ++i)
        aThings.push_back(std::make_unique<Things>());
    std::vector<std::thread> aThreads;
    for (auto& pThings : aThings)
        aThreads.emplace_back([&pThings] { pThings.reset(); });
    for (std::thread& thread : aThreads)
        thread.join();
    pHost->makeCurrent();
    EXPECT_EQ(ObjectCounts(), shared());
}

ORVO_INSTANTIATE_ON_EACH_INTERFACE(ObjectTest);

} // namespace
