#include "orvo/ogl/Program.h"

#include <epoxy/gl.h>

#include <array>
#include <cstdint>
#include <cstring>
#include <functional>
#include <memory>
#include <string>
#include <type_traits>

#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/NativeContext.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/FailEveryCall.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;
using OGL::Program;

static_assert(std::is_base_of_v<OGL::GLSLObject, Program>);
static_assert(std::has_virtual_destructor_v<Program>);

constexpr char const* pVertex = "void main() { gl_Position = ftransform(); }\n";
constexpr char const* pUniforms = R"(uniform float a;
uniform vec2 b;
uniform vec3 c;
uniform vec4 d;
uniform bool e;
uniform sampler1D line;
uniform sampler2D plane;
uniform sampler3D box;
uniform mat3 three;
uniform mat4 four;
uniform float many[3];
void main() {
    vec4 sum = vec4(a) + vec4(b, 0.0, 0.0) + vec4(c, 0.0) + d + texture1D(line, a) + texture2D(plane, b) +
               texture3D(box, c) + four * vec4(three * c, 1.0) + vec4(many[0] + many[2]);
    gl_FragColor = e ? sum : -sum;
}
)";

void load(Program& program, char const* pFragment) {
    program.loadVertexShader(1, const_cast<char const**>(&pVertex), nullptr);
    program.loadFragmentShader(1, &pFragment, nullptr);
}

std::string failureOf(std::function<void()> const& code) {
    try {
        code();
    } catch (OGL::ExceptionOGL const& exception) {
        return exception.message();
    }
    return "nothing was thrown";
}

class ProgramTest : public ORVO::Test::GLTest {
protected:
    void TearDown() override {
        if (OGL::NativeContext::currentHandle() != nullptr)
            glUseProgram(0);
        GLTest::TearDown();
    }

    static float floatOf(Program const& program, char const* pName, int iComponent = 0) {
        std::array<float, 16> aValues{};
        glGetUniformfv(program.objectID(), program.getUniformLocation(pName), aValues.data());
        return aValues[static_cast<std::size_t>(iComponent)];
    }
    static int integerOf(Program const& program, char const* pName) {
        GLint value = -1;
        glGetUniformiv(program.objectID(), program.getUniformLocation(pName), &value);
        return value;
    }
};

TEST_F(ProgramTest, IsCompiledLinkedAndEnabled) {
    EXPECT_TRUE(Program::isSupported());
    Program program;
    EXPECT_NE(0U, program.objectID());
    load(program, "void main() { gl_FragColor = vec4(1.0); }");
    program.link(true);
    EXPECT_TRUE(program.validate());
    program.enable();
    GLint nCurrent = 0;
    glGetIntegerv(GL_CURRENT_PROGRAM, &nCurrent);
    EXPECT_EQ(program.objectID(), static_cast<unsigned>(nCurrent));
    program.disable();
    glGetIntegerv(GL_CURRENT_PROGRAM, &nCurrent);
    EXPECT_EQ(0, nCurrent);
}

TEST_F(ProgramTest, NumbersEveryLink) {
    Program program;
    EXPECT_EQ(0U, program.linkNumber());
    load(program, "void main() { gl_FragColor = vec4(1.0); }");
    program.link(false);
    std::uint64_t const nFirst = program.linkNumber();
    EXPECT_NE(0U, nFirst);
    program.link(true);
    EXPECT_LT(nFirst, program.linkNumber());
    Program other;
    load(other, "void main() { gl_FragColor = vec4(1.0); }");
    other.link(true);
    EXPECT_LT(program.linkNumber(), other.linkNumber());
}

TEST_F(ProgramTest, TakesAStageInPiecesWithAndWithoutLengths) {
    char const* aPieces[] = {"uniform float gain;\n",
                             "void main() { gl_FragColor = vec4(gain); }THE REST IS NOT READ"};
    int aLengths[] = {-1, static_cast<int>(std::strlen("void main() { gl_FragColor = vec4(gain); }"))};
    Program program;
    program.loadFragmentShader(2, aPieces, aLengths);
    program.link(true);
    EXPECT_LE(0, program.getUniformLocation("gain"));
}

TEST_F(ProgramTest, KeepsShadersForALaterLinkUnlessTheyAreReleased) {
    Program program;
    load(program, "void main() { gl_FragColor = vec4(1.0); }");
    EXPECT_EQ(2, ORVO::Test::GLHooks::objects()["shader"]);
    program.link(false);
    EXPECT_EQ(2, ORVO::Test::GLHooks::objects()["shader"]);
    program.link(true);
    EXPECT_EQ(0, ORVO::Test::GLHooks::objects()["shader"]);
    program.enable();
}

TEST_F(ProgramTest, NamesTheSourceLineOfAFailedCompile) {
    Program program;
    char const* pFragment = "uniform float gain;\nvoid main() {\n    gl_FragColor = nonsense * gain;\n}\n";
    std::string const sFailure = failureOf([&] { program.loadFragmentShader(1, &pFragment, nullptr); });
    EXPECT_EQ(0U, sFailure.find("Fragment shader did not compile: ")) << sFailure;
    EXPECT_NE(std::string::npos, sFailure.find("nonsense"));
    EXPECT_NE(std::string::npos, sFailure.find("\n0:3:     gl_FragColor = nonsense * gain;")) << sFailure;
    char const* pBad = "void main() {\ngl_Position = absent();\n}";
    std::string const sVertexFailure = failureOf([&] { program.loadVertexShader(1, &pBad, nullptr); });
    EXPECT_EQ(0U, sVertexFailure.find("Vertex shader did not compile: ")) << sVertexFailure;
    EXPECT_NE(std::string::npos, sVertexFailure.find("\n0:2: gl_Position = absent();")) << sVertexFailure;
    // The program is as before, and works with a shader that compiles.
    EXPECT_EQ(0, ORVO::Test::GLHooks::objects()["shader"]);
    load(program, "void main() { gl_FragColor = vec4(1.0); }");
    program.link(true);
}

TEST_F(ProgramTest, FindsLinesOfLaterPieces) {
    Program program;
    char const* aPieces[] = {"uniform float a;\n", "uniform float b;\n",
                             "void main() { gl_FragColor = oops; }\n"};
    std::string const sFailure = failureOf([&] { program.loadFragmentShader(3, aPieces, nullptr); });
    EXPECT_NE(std::string::npos, sFailure.find(": void main() { gl_FragColor = oops; }")) << sFailure;
}

/// Logs of other drivers, given out by a replaced entry point.
std::string sGivenLog;

class ProgramLog : public ProgramTest {
protected:
    void SetUp() override {
        ProgramTest::SetUp();
        pGetShaderiv_ = epoxy_glGetShaderiv;
        pGetLog_ = epoxy_glGetShaderInfoLog;
        epoxy_glGetShaderiv = [](GLuint, GLenum what, GLint* pValue) {
            *pValue = what == GL_INFO_LOG_LENGTH ? static_cast<GLint>(sGivenLog.size()) + 1 : GL_FALSE;
        };
        epoxy_glGetShaderInfoLog = [](GLuint, GLsizei nRoom, GLsizei* pLength, GLchar* pLog) {
            std::strncpy(pLog, sGivenLog.c_str(), static_cast<std::size_t>(nRoom));
            *pLength = static_cast<GLsizei>(sGivenLog.size());
        };
    }
    void TearDown() override {
        epoxy_glGetShaderiv = pGetShaderiv_;
        epoxy_glGetShaderInfoLog = pGetLog_;
        ProgramTest::TearDown();
    }

    static std::string failureWith(std::string const& sLog) {
        sGivenLog = sLog;
        char const* aPieces[] = {"first\nsecond\n", "third\nfourth"};
        Program program;
        return failureOf([&] { program.loadFragmentShader(2, aPieces, nullptr); });
    }

private:
    decltype(epoxy_glGetShaderiv) pGetShaderiv_ = nullptr;
    decltype(epoxy_glGetShaderInfoLog) pGetLog_ = nullptr;
};

TEST_F(ProgramLog, IsReadInTheFormsOfAllDrivers) {
    struct Row {
        char const* pLog;
        char const* pAddition;
    };
    constexpr Row aRows[] = {
        {"0:2(1): error: bad", "\n0:2: second"},
        {"0(1) : error C1008: bad", "\n0:1: first"},
        {"0(2): error C1008: bad", "\n0:2: second"},
        {"ERROR: 0:2: 'x' : bad", "\n0:2: second"},
        {"WARNING: 0:1: odd", "\n0:1: first"},
        // A line of the second string, and one of all strings taken as one.
        {"ERROR: 1:2: bad", "\n1:2: fourth"},
        {"0:4(1): error: bad", "\n0:4: fourth"},
        // The first place counts.
        {"0:1(9): warning: odd\n0:2(1): error: bad", "\n0:1: first"},
        // No place, or none that exists.
        {"something is wrong", ""},
        {"0:9(1): error: bad", ""},
        {"0:0(0): error: bad", ""},
        {"99999999999(1): error: bad", ""},
        {"about 3:2: bad", ""},
        {"", ""},
    };
    for (Row const& row : aRows)
        EXPECT_EQ(std::string("Fragment shader did not compile: ") + row.pLog + row.pAddition,
                  failureWith(row.pLog));
    EXPECT_EQ("Fragment shader did not compile: bad", failureWith("bad\n\n"));
}

TEST_F(ProgramTest, CarriesTheLogOfAFailedLink) {
    Program program;
    char const* pFragment =
        "varying vec4 colour;\nvoid absent();\nvoid main() { absent(); gl_FragColor = colour; }";
    load(program, pFragment);
    std::string const sFailure = failureOf([&] { program.link(true); });
    EXPECT_EQ(0U, sFailure.find("Program did not link: ")) << sFailure;
    EXPECT_NE(std::string::npos, sFailure.find("absent")) << sFailure;
    EXPECT_EQ(0, ORVO::Test::GLHooks::objects()["shader"]);
    ORVO_EXPECT_OGL(program.enable(), "Program is not linked");
    EXPECT_EQ(-1, program.getUniformLocation("colour"));
}

TEST_F(ProgramTest, NamesTheSourceLineOfAFailedLink) {
    Program program;
    char const* pFragment = "// first\nvoid main() { gl_FragColor = vec4(0.0); }";
    load(program, pFragment);
    auto const pStatus = epoxy_glGetProgramiv;
    auto const pLog = epoxy_glGetProgramInfoLog;
    epoxy_glGetProgramiv = [](GLuint, GLenum what, GLint* pValue) {
        *pValue = what == GL_INFO_LOG_LENGTH ? 100 : GL_FALSE;
    };
    epoxy_glGetProgramInfoLog = [](GLuint, GLsizei, GLsizei* pLength, GLchar* pText) {
        std::strcpy(pText, "Fragment info\n0(1) : error C3001: bad");
        *pLength = static_cast<GLsizei>(std::strlen(pText));
    };
    std::string const sFragment = failureOf([&] { program.link(false); });
    epoxy_glGetProgramInfoLog = [](GLuint, GLsizei, GLsizei* pLength, GLchar* pText) {
        std::strcpy(pText, "Vertex info\n0(1) : error C3001: bad");
        *pLength = static_cast<GLsizei>(std::strlen(pText));
    };
    std::string const sVertex = failureOf([&] { program.link(false); });
    epoxy_glGetProgramiv = pStatus;
    epoxy_glGetProgramInfoLog = pLog;
    EXPECT_EQ("Program did not link: Fragment info\n0(1) : error C3001: bad\n0:1: // first", sFragment);
    EXPECT_EQ("Program did not link: Vertex info\n0(1) : error C3001: bad\n0:1: "
              "void main() { gl_Position = ftransform(); }",
              sVertex);
}

TEST_F(ProgramTest, FindsItsUniforms) {
    Program program;
    load(program, pUniforms);
    EXPECT_EQ(-1, program.getUniformLocation("a"));
    program.link(true);
    for (char const* const pName :
         {"a", "b", "c", "d", "e", "line", "plane", "box", "three", "four", "many", "many[0]", "many[2]"}) {
        EXPECT_LE(0, program.getUniformLocation(pName)) << pName;
        EXPECT_EQ(glGetUniformLocation(program.objectID(), pName), program.getUniformLocation(pName))
            << pName;
    }
    for (char const* const pName : {"absent", "", "gl_ModelViewMatrix", "many[7]", "a[0"})
        EXPECT_EQ(-1, program.getUniformLocation(pName)) << pName;
    ORVO_EXPECT_INTERNAL(program.getUniformLocation(nullptr), "Enforce pName != NULL");
    // Names are looked up once, not at every question.
    std::uint64_t const nCalls = ORVO::Test::GLHooks::calls("glGetUniformLocation");
    program.getUniformLocation("a");
    program.getUniformLocation("absent");
    EXPECT_EQ(nCalls, ORVO::Test::GLHooks::calls("glGetUniformLocation"));
}

TEST_F(ProgramTest, SetsVerifiedUniforms) {
    Program program;
    load(program, pUniforms);
    program.link(true);
    program.enable();
    program.setUniform("a", 1.5F);
    EXPECT_EQ(1.5F, floatOf(program, "a"));
    program.setUniform("b", 1.0F, 2.0F);
    EXPECT_EQ(2.0F, floatOf(program, "b", 1));
    program.setUniform("c", 1.0F, 2.0F, 3.0F);
    EXPECT_EQ(3.0F, floatOf(program, "c", 2));
    program.setUniform("d", 1.0F, 2.0F, 3.0F, 4.0F);
    EXPECT_EQ(4.0F, floatOf(program, "d", 3));
    program.setUniform("e", true);
    EXPECT_EQ(1, integerOf(program, "e"));
    program.setUniform("e", false);
    EXPECT_EQ(0, integerOf(program, "e"));
    program.setUniformSampler2D("plane", 3);
    EXPECT_EQ(3, integerOf(program, "plane"));
    EXPECT_EQ(0U, drainErrors());
}

TEST_F(ProgramTest, RefusesUniformsThatDoNotFit) {
    Program program;
    load(program, pUniforms);
    program.link(true);
    ORVO_EXPECT_OGL(program.setUniform("a", 1.0F), "Program is not enabled");
    program.enable();
    ORVO_EXPECT_OGL(program.setUniform("absent", 1.0F), "Uniform absent does not exist");
    ORVO_EXPECT_OGL(program.setUniform("a", 1.0F, 2.0F), "Uniform a is of another type");
    ORVO_EXPECT_OGL(program.setUniform("b", 1.0F), "Uniform b is of another type");
    ORVO_EXPECT_OGL(program.setUniform("b", 1.0F, 2.0F, 3.0F), "Uniform b is of another type");
    ORVO_EXPECT_OGL(program.setUniform("c", 1.0F, 2.0F, 3.0F, 4.0F), "Uniform c is of another type");
    ORVO_EXPECT_OGL(program.setUniform("a", true), "Uniform a is of another type");
    ORVO_EXPECT_OGL(program.setUniformSampler2D("line", 1), "Uniform line is of another type");
    ORVO_EXPECT_INTERNAL(program.setUniform(nullptr, 1.0F), "Enforce pName != NULL");
    EXPECT_EQ(0.0F, floatOf(program, "a"));
    EXPECT_EQ(0U, drainErrors());
}

TEST_F(ProgramTest, SetsUnverifiedUniforms) {
    Program program;
    load(program, pUniforms);
    program.link(true);
    program.enable();
    program.setUniform_Unsafe("a", 2.5F);
    EXPECT_EQ(2.5F, floatOf(program, "a"));
    program.setUniform_Unsafe(program.getUniformLocation("a"), 3.5F);
    EXPECT_EQ(3.5F, floatOf(program, "a"));
    program.setUniform_Unsafe("b", 5.0F, 6.0F);
    EXPECT_EQ(6.0F, floatOf(program, "b", 1));
    program.setUniform_Unsafe(program.getUniformLocation("b"), 7.0F, 8.0F);
    EXPECT_EQ(7.0F, floatOf(program, "b", 0));
    program.setUniform_Unsafe("c", 1.0F, 2.0F, 9.0F);
    EXPECT_EQ(9.0F, floatOf(program, "c", 2));
    program.setUniform_Unsafe(program.getUniformLocation("c"), 4.0F, 5.0F, 6.0F);
    EXPECT_EQ(5.0F, floatOf(program, "c", 1));
    program.setUniformSampler1D_Unsafe("line", 1);
    EXPECT_EQ(1, integerOf(program, "line"));
    program.setUniformSampler1D_Unsafe(program.getUniformLocation("line"), 4);
    EXPECT_EQ(4, integerOf(program, "line"));
    program.setUniformSampler2D_Unsafe("plane", 2);
    EXPECT_EQ(2, integerOf(program, "plane"));
    program.setUniformSampler2D_Unsafe(program.getUniformLocation("plane"), 5);
    EXPECT_EQ(5, integerOf(program, "plane"));
    program.setUniformSampler3D_Unsafe("box", 3);
    EXPECT_EQ(3, integerOf(program, "box"));
    program.setUniformSampler3D_Unsafe(program.getUniformLocation("box"), 6);
    EXPECT_EQ(6, integerOf(program, "box"));
    // What is absent is left out.
    program.setUniform_Unsafe("absent", 1.0F);
    program.setUniform_Unsafe(-1, 1.0F, 2.0F);
    program.setUniformSampler2D_Unsafe("absent", 1);
    EXPECT_EQ(0U, drainErrors());
}

TEST_F(ProgramTest, SetsMatricesByColumnsOrRows) {
    Program program;
    load(program, pUniforms);
    program.link(true);
    program.enable();
    std::array<float, 9> aThree{};
    std::array<float, 16> aFour{};
    for (std::size_t i = 0; i < 9; ++i)
        aThree[i] = static_cast<float>(i);
    for (std::size_t i = 0; i < 16; ++i)
        aFour[i] = static_cast<float>(i);
    program.setUniformMatrix3_Unsafe("three", aThree.data(), 0);
    EXPECT_EQ(1.0F, floatOf(program, "three", 1));
    program.setUniformMatrix3_Unsafe("three", aThree.data(), 1);
    EXPECT_EQ(3.0F, floatOf(program, "three", 1));
    program.setUniformMatrix4_Unsafe("four", aFour.data(), 0);
    EXPECT_EQ(1.0F, floatOf(program, "four", 1));
    program.setUniformMatrix4_Unsafe("four", aFour.data(), 1);
    EXPECT_EQ(4.0F, floatOf(program, "four", 1));
    program.setUniformMatrix4_Unsafe("absent", aFour.data(), 1);
    EXPECT_EQ(0U, drainErrors());
}

TEST_F(ProgramTest, TellsAProgramThatCannotRun) {
    // Two samplers of different kinds may not read one unit.
    Program program;
    load(program, pUniforms);
    program.link(true);
    program.enable();
    EXPECT_FALSE(program.validate());
    program.setUniformSampler1D_Unsafe("line", 1);
    program.setUniformSampler3D_Unsafe("box", 2);
    EXPECT_TRUE(program.validate());
}

TEST_F(ProgramTest, RefusesNoSources) {
    Program program;
    ORVO_EXPECT_INTERNAL(program.loadVertexShader(1, nullptr, nullptr), "Enforce ppSources != NULL");
    char const* pNone = nullptr;
    ORVO_EXPECT_INTERNAL(program.loadFragmentShader(1, &pNone, nullptr), "Enforce ppSources != NULL");
}

TEST_F(ProgramTest, LeavesNothingWhereACallFails) {
    auto const build = [] {
        Program program;
        load(program, "void main() { gl_FragColor = vec4(1.0); }");
        program.link(false);
        program.enable();
        program.disable();
    };
    auto const aFailed = ORVO::Test::failEveryCall(build, &drainErrors);
    EXPECT_EQ((std::set<std::string>{"glFenceSync", "glCreateProgram", "glCreateShader", "glCompileShader",
                                     "glLinkProgram"}),
              aFailed);
}

TEST_F(ProgramTest, NeedsAContext) {
    Program program;
    load(program, pUniforms);
    program.link(true);
    host().release();
    constexpr char const* pNone = "No OpenGL context is current";
    char const* pSource = pVertex;
    ORVO_EXPECT_OGL(Program(), pNone);
    ORVO_EXPECT_OGL(program.loadVertexShader(1, &pSource, nullptr), pNone);
    ORVO_EXPECT_OGL(program.link(true), pNone);
    ORVO_EXPECT_OGL(program.validate(), pNone);
    ORVO_EXPECT_OGL(program.enable(), pNone);
    ORVO_EXPECT_OGL(program.disable(), pNone);
    ORVO_EXPECT_OGL(program.setUniform("a", 1.0F), pNone);
    ORVO_EXPECT_OGL(program.setUniform_Unsafe("a", 1.0F), pNone);
    EXPECT_LE(0, program.getUniformLocation("a"));
    host().makeCurrent();
}

TEST_F(ProgramTest, LeavesForeignProgramsAloneWhereItDiesInAForeignContext) {
    auto pProgram = std::make_unique<Program>();
    auto const pForeign = host().another(false);
    pForeign->makeCurrent();
    {
        Program const other;
        EXPECT_EQ(pProgram->objectID(), other.objectID());
        pProgram.reset();
        EXPECT_EQ(GL_TRUE, glIsProgram(other.objectID()));
    }
    pForeign->destroyContext();
    loseHost();
    ORVO::Test::GLHooks::forgetObjects();
}

TEST_F(ProgramTest, IsNotSupportedWithoutShaderObjects) {
    OGL::ExtensionManager::Instance()->overrideSupport(OGL::EXTENSION_ARB_SHADER_OBJECTS, false);
    EXPECT_FALSE(Program::isSupported());
}

} // namespace
