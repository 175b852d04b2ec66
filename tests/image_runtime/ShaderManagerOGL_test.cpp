#include "orvo/image_runtime/ShaderManagerOGL.h"

#include <cstddef>
#include <limits>
#include <memory>
#include <type_traits>
#include <vector>

#include "orvo/image_runtime/ShaderProgramProxyOGL.h"
#include "orvo/image_runtime/ShaderProgramProxyOGLAutoLock.h"
#include "orvo/ogl/Program.h"
#include "tests/image_runtime/support/ShaderTest.h"

namespace {

using namespace ORVO;
using ORVO::Test::GLHooks;

constexpr char const* pWhite = "void main() { gl_FragColor = vec4(1.0); }";

static_assert(!std::is_copy_constructible_v<ShaderManagerOGL>);
static_assert(std::has_virtual_destructor_v<ShaderManagerOGL>);

/// A manager of its own, with what proxies alone may call made public.
class OpenManager : public ShaderManagerOGL {
public:
    using ShaderManagerOGL::clearProgram;
    using ShaderManagerOGL::SetTimeStamp;
    using ShaderManagerOGL::UnRegisterShaderProgram;
};

class ShaderManagerOGLTest : public ORVO::Test::ShaderTest {
protected:
    static ShaderManagerOGL& manager() { return *ShaderManagerOGL::Instance(); }

    /// Proxies with one fragment source each, the first `n` of them locked once and unlocked.
    static std::vector<std::unique_ptr<ShaderProgramProxyOGL>> linkedProxies(std::size_t n) {
        std::vector<std::unique_ptr<ShaderProgramProxyOGL>> vpProxies;
        for (std::size_t i = 0; i < n; ++i) {
            vpProxies.push_back(std::make_unique<ShaderProgramProxyOGL>());
            vpProxies.back()->add(FragmentShaderSourceOGL(pWhite));
            vpProxies.back()->LockOglProgram();
            vpProxies.back()->UnlockOglProgram();
        }
        return vpProxies;
    }

    /// Whether locking the proxy takes no link.
    static bool hasProgram(ShaderProgramProxyOGL& proxy) {
        auto const nBefore = GLHooks::calls("glLinkProgram");
        proxy.LockOglProgram();
        proxy.UnlockOglProgram();
        return GLHooks::calls("glLinkProgram") == nBefore;
    }
};

TEST_F(ShaderManagerOGLTest, StartsWithTheStatedLimits) {
    EXPECT_EQ(128U, manager().GetMaxNumShaders());
    EXPECT_EQ(98U, manager().GetShaderThreshold());
    EXPECT_EQ(60.0, manager().GetMaxShaderAge());
    EXPECT_EQ(0U, manager().GetNumShaders());
    manager().SetMaxNumShaders(7);
    manager().GetShaderThreshold(5);
    manager().SetMaxShaderAge(0.25);
    EXPECT_EQ(7U, manager().GetMaxNumShaders());
    EXPECT_EQ(5U, manager().GetShaderThreshold());
    EXPECT_EQ(0.25, manager().GetMaxShaderAge());
}

TEST_F(ShaderManagerOGLTest, LinksAProgramForEachProxyAlsoOfTheSameText) {
    auto const vpProxies = linkedProxies(2);
    EXPECT_EQ(2U, manager().GetNumShaders());
    EXPECT_EQ(2, programs());
    OGL::Program* const pFirst = vpProxies[0]->LockOglProgram();
    OGL::Program* const pSecond = vpProxies[1]->LockOglProgram();
    EXPECT_NE(pFirst, pSecond);
    EXPECT_NE(pFirst->objectID(), pSecond->objectID());
    EXPECT_EQ(2, programs());
}

TEST_F(ShaderManagerOGLTest, RefusesAProxyThatHasAProgramAndNone) {
    auto const vpProxies = linkedProxies(1);
    ORVO_EXPECT_INTERNAL(manager().RegisterShaderProgram(vpProxies[0].get()), "!pProxy->p_ProgramObject");
    ORVO_EXPECT_INTERNAL(manager().RegisterShaderProgram(nullptr), "Enforce pProxy != NULL");
    EXPECT_EQ(1U, manager().GetNumShaders());
}

TEST_F(ShaderManagerOGLTest, RegistersAProxyUnlocked) {
    ShaderProgramProxyOGL proxy;
    proxy.add(FragmentShaderSourceOGL(pWhite));
    manager().RegisterShaderProgram(&proxy);
    EXPECT_EQ(1U, manager().GetNumShaders());
    manager().clearAll();
    EXPECT_EQ(0U, manager().GetNumShaders());
    EXPECT_EQ(0, programs());
}

TEST_F(ShaderManagerOGLTest, RemovesNothingYoungHoweverManyThereAre) {
    auto const vpProxies = linkedProxies(129);
    EXPECT_EQ(129U, manager().GetNumShaders());
    EXPECT_EQ(129, programs());
}

TEST_F(ShaderManagerOGLTest, RemovesAgedProgramsDownToTheThresholdTheLongestRegisteredFirst) {
    auto vpProxies = linkedProxies(128);
    vpProxies[0]->LockOglProgram(); // locked ones are passed over
    manager().SetMaxShaderAge(0.0);
    ShaderProgramProxyOGL proxy;
    proxy.add(FragmentShaderSourceOGL(pWhite));
    proxy.LockOglProgram();
    EXPECT_EQ(99U, manager().GetNumShaders()); // 98 and the new one
    EXPECT_EQ(99, programs());
    manager().SetMaxShaderAge(60.0);
    EXPECT_TRUE(hasProgram(*vpProxies[0]));
    for (std::size_t i = 31; i < 128; ++i)
        EXPECT_TRUE(hasProgram(*vpProxies[i])) << i;
    for (std::size_t i = 1; i < 31; ++i)
        EXPECT_FALSE(hasProgram(*vpProxies[i])) << i;
}

TEST_F(ShaderManagerOGLTest, BelowTheMaximumRemovesNothing) {
    manager().SetMaxNumShaders(4);
    manager().GetShaderThreshold(2);
    manager().SetMaxShaderAge(0.0);
    auto vpProxies = linkedProxies(4);
    EXPECT_EQ(4U, manager().GetNumShaders());
    auto const vpOther = linkedProxies(1);
    EXPECT_EQ(3U, manager().GetNumShaders());
    EXPECT_FALSE(hasProgram(*vpProxies[0]));
}

TEST_F(ShaderManagerOGLTest, KeepsAProxysPlaceInTheOrderThroughARemoval) {
    manager().SetMaxNumShaders(3);
    manager().GetShaderThreshold(2);
    manager().SetMaxShaderAge(0.0);
    auto vpProxies = linkedProxies(3);
    auto const vpFourth = linkedProxies(1); // takes the first one's program
    EXPECT_EQ(3U, manager().GetNumShaders());
    EXPECT_FALSE(hasProgram(*vpProxies[0])); // linked again, which takes the second one's
    EXPECT_FALSE(hasProgram(*vpProxies[1])); // which takes the first one's again: it still comes first
    EXPECT_TRUE(hasProgram(*vpProxies[2]));
    EXPECT_TRUE(hasProgram(*vpFourth[0]));
}

TEST_F(ShaderManagerOGLTest, OneUnlockUndoesAllLocks) {
    auto const vpProxies = linkedProxies(1);
    vpProxies[0]->LockOglProgram();
    vpProxies[0]->LockOglProgram();
    manager().clearAll();
    EXPECT_EQ(1U, manager().GetNumShaders());
    vpProxies[0]->UnlockOglProgram();
    manager().clearAll();
    EXPECT_EQ(0U, manager().GetNumShaders());
    EXPECT_EQ(0, programs());
}

TEST_F(ShaderManagerOGLTest, ClearsAllButLockedPrograms) {
    auto const vpProxies = linkedProxies(3);
    vpProxies[1]->LockOglProgram();
    manager().clearAll();
    EXPECT_EQ(1U, manager().GetNumShaders());
    EXPECT_TRUE(hasProgram(*vpProxies[1]));
    EXPECT_FALSE(hasProgram(*vpProxies[0]));
}

TEST_F(ShaderManagerOGLTest, ClearProgramAsksForAnUnlockedProxy) {
    OpenManager own;
    ShaderProgramProxyOGL proxy;
    own.clearProgram(&proxy); // without a program nothing happens
    EXPECT_EQ(0U, own.GetNumShaders());
    ORVO_EXPECT_INTERNAL(own.clearProgram(nullptr), "Enforce pProxy != NULL");
    ORVO_EXPECT_INTERNAL(own.SetTimeStamp(nullptr), "Enforce pProxy != NULL");
    ORVO_EXPECT_INTERNAL(own.UnRegisterShaderProgram(nullptr), "Enforce pProxy != NULL");

    proxy.add(FragmentShaderSourceOGL(pWhite));
    proxy.LockOglProgram();
    ORVO_EXPECT_INTERNAL(own.clearProgram(&proxy), "pProxy->n_LockCount == 0");
    proxy.UnlockOglProgram();
    EXPECT_EQ(1, programs());
}

TEST_F(ShaderManagerOGLTest, CountsEveryProxyThatDies) {
    { auto const vpProxies = linkedProxies(2); }
    EXPECT_EQ(0U, manager().GetNumShaders());
    { ShaderProgramProxyOGL proxy; }
    EXPECT_EQ(std::numeric_limits<std::uint32_t>::max(), manager().GetNumShaders());
    auto const vpProxies = linkedProxies(1);
    EXPECT_EQ(0U, manager().GetNumShaders());
    EXPECT_EQ(1, programs());
}

TEST_F(ShaderManagerOGLTest, ForgetsAProxyThatDies) {
    auto vpProxies = linkedProxies(3);
    vpProxies[1]->LockOglProgram();
    vpProxies.erase(vpProxies.begin() + 1);
    EXPECT_EQ(2, programs());
    EXPECT_EQ(2U, manager().GetNumShaders());
    manager().clearAll();
    EXPECT_EQ(0, programs());
}

TEST_F(ShaderManagerOGLTest, TakesTheProgramsOfUnlockedProxiesAlongAndLeavesTheProxies) {
    auto vpProxies = linkedProxies(2);
    vpProxies[1]->LockOglProgram();
    stopRuntime();
    EXPECT_EQ(1, programs());
    vpProxies[1]->UnlockOglProgram();
    startRuntime();
    EXPECT_FALSE(hasProgram(*vpProxies[0]));
    EXPECT_FALSE(hasProgram(*vpProxies[1])); // what the old manager linked is discarded
    EXPECT_EQ(2, programs());
    EXPECT_EQ(2U, manager().GetNumShaders());
}

TEST_F(ShaderManagerOGLTest, LeavesNothingBehindWhenACallFails) {
    ShaderProgramProxyOGL proxy;
    proxy.add(VertexShaderSourceOGL("void main() { gl_Position = ftransform(); }"));
    proxy.add(FragmentShaderSourceOGL(pWhite));
    auto const aFailed = ORVO::Test::failEveryCall(
        [&] {
            proxy.LockOglProgram();
            proxy.UnlockOglProgram();
        },
        [&] {
            drainErrors();
            EXPECT_EQ(0U, manager().GetNumShaders());
        });
    EXPECT_EQ(1U, aFailed.count("glCreateProgram"));
    EXPECT_EQ(1U, aFailed.count("glCreateShader"));
    EXPECT_EQ(1U, aFailed.count("glCompileShader"));
    EXPECT_EQ(1U, aFailed.count("glLinkProgram"));
    EXPECT_EQ(1U, manager().GetNumShaders());
}

} // namespace
