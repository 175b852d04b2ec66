#include "orvo/ogl/Program.h"

#include <atomic>
#include <functional>
#include <map>
#include <string>
#include <vector>

#include "orvo/core/Check.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/Scopes.h"
#include "orvo/ogl/internal/ShaderLog.h"
#include "orvo/ogl/internal/ShareGroup.h"

namespace ORVO::OGL {

namespace {

char const* compileMessage(unsigned nStage) noexcept {
    return nStage == GL_VERTEX_SHADER ? "Vertex shader did not compile" : "Fragment shader did not compile";
}

/// A shader's or a program's log.
std::string logOf(unsigned nName, PFNGLGETSHADERIVPROC get, PFNGLGETSHADERINFOLOGPROC getLog) {
    GLint nLength = 0;
    get(nName, GL_INFO_LOG_LENGTH, &nLength);
    if (nLength <= 0)
        return {};
    std::string sLog(static_cast<std::size_t>(nLength), '\0');
    GLsizei nWritten = 0;
    getLog(nName, nLength, &nWritten, sLog.data());
    sLog.resize(static_cast<std::size_t>(nWritten));
    return sLog;
}

} // namespace

struct Program::Details {
    struct Shader {
        unsigned nStage_;
        unsigned nName_;
        Internal::ShaderSource oSource_;
    };

    struct Uniform {
        int iLocation_;
        unsigned nType_;
    };

    /// Of the shaders that were linked, the one whose part of the log comes first.
    Internal::ShaderSource const* sourceOfLog(std::string const& sLog) const {
        std::size_t const nVertex = sLog.find("ertex");
        std::size_t const nFragment = sLog.find("ragment");
        unsigned const nStage = nVertex < nFragment ? GL_VERTEX_SHADER : GL_FRAGMENT_SHADER;
        for (Shader const& shader : aShaders_)
            if (shader.nStage_ == nStage)
                return &shader.oSource_;
        return aShaders_.empty() ? nullptr : &aShaders_.front().oSource_;
    }

    std::vector<Shader> aShaders_;
    bool bLinked_ = false;
    /// By name; of arrays also by the name without "[0]".
    std::map<std::string, Uniform, std::less<>> aUniforms_;
};

Program::Program() : pDetails_(std::make_unique<Details>()) {
    joinShareGroup();
    unsigned const nName = glCreateProgram();
    if (nName == 0) {
        Internal::clearErrors();
        ORVO_OGL_FAIL("The program could not be created", GL_OUT_OF_MEMORY);
    }
    setObjectID(nName);
}

Program::~Program() {
    using Kind = Internal::ShareGroup::Kind;
    Internal::ShareGroup const* const pGroup = shareGroup();
    if (pGroup == nullptr)
        return;
    // Shaders go with the program that they are attached to.
    for (Details::Shader const& shader : pDetails_->aShaders_)
        pGroup->destroy(Kind::shader, shader.nName_);
    pGroup->destroy(Kind::program, objectID());
}

void Program::loadVertexShader(unsigned count, char const** ppSources, int* pLengths) {
    loadShader(GL_VERTEX_SHADER, count, ppSources, pLengths);
}

void Program::loadFragmentShader(unsigned count, char const** ppSources, int* pLengths) {
    loadShader(GL_FRAGMENT_SHADER, count, ppSources, pLengths);
}

void Program::loadShader(unsigned nStage, unsigned count, char const* const* ppSources, int const* pLengths) {
    ORVO_ENFORCE(ppSources);
    for (unsigned i = 0; i < count; ++i)
        ORVO_ENFORCE(ppSources[i], "ppSources");
    ORVO_OGL_REQUIRE_CONTEXT();
    pDetails_->aShaders_.reserve(pDetails_->aShaders_.size() + 1);
    Details::Shader shader{nStage, 0, Internal::ShaderSource(count, ppSources, pLengths)};
    shader.nName_ = glCreateShader(nStage);
    if (shader.nName_ == 0) {
        Internal::clearErrors();
        ORVO_OGL_FAIL("The shader could not be created", GL_OUT_OF_MEMORY);
    }
    try {
        glShaderSource(shader.nName_, static_cast<GLsizei>(count), ppSources, pLengths);
        glCompileShader(shader.nName_);
        GLint nCompiled = GL_FALSE;
        glGetShaderiv(shader.nName_, GL_COMPILE_STATUS, &nCompiled);
        if (nCompiled == GL_FALSE)
            ORVO_OGL_FAIL(Internal::describeFailure(compileMessage(nStage),
                                                    logOf(shader.nName_, glGetShaderiv, glGetShaderInfoLog),
                                                    &shader.oSource_),
                          0);
    } catch (...) {
        glDeleteShader(shader.nName_);
        throw;
    }
    glAttachShader(objectID(), shader.nName_);
    pDetails_->aShaders_.push_back(std::move(shader));
}

void Program::releaseShaders() noexcept {
    for (Details::Shader const& shader : pDetails_->aShaders_) {
        glDetachShader(objectID(), shader.nName_);
        glDeleteShader(shader.nName_);
    }
    pDetails_->aShaders_.clear();
}

void Program::link(bool bReleaseShaders) {
    ORVO_OGL_REQUIRE_CONTEXT();
    pDetails_->bLinked_ = false;
    pDetails_->aUniforms_.clear();
    glLinkProgram(objectID());
    GLint nLinked = GL_FALSE;
    glGetProgramiv(objectID(), GL_LINK_STATUS, &nLinked);
    std::string sFailure;
    if (nLinked == GL_FALSE) {
        std::string const sLog = logOf(objectID(), glGetProgramiv, glGetProgramInfoLog);
        sFailure = Internal::describeFailure("Program did not link", sLog, pDetails_->sourceOfLog(sLog));
    }
    if (bReleaseShaders)
        releaseShaders();
    if (nLinked == GL_FALSE)
        ORVO_OGL_FAIL(sFailure, 0);
    readUniforms();
    static std::atomic<std::uint64_t> nLinks{0};
    nLink_ = ++nLinks;
    pDetails_->bLinked_ = true;
}

void Program::readUniforms() {
    GLint nUniforms = 0;
    GLint nLongestName = 0;
    glGetProgramiv(objectID(), GL_ACTIVE_UNIFORMS, &nUniforms);
    glGetProgramiv(objectID(), GL_ACTIVE_UNIFORM_MAX_LENGTH, &nLongestName);
    std::vector<char> aName(static_cast<std::size_t>(nLongestName) + 1);
    for (GLint i = 0; i < nUniforms; ++i) {
        GLsizei nLength = 0;
        GLint nElements = 0;
        GLenum nType = 0;
        glGetActiveUniform(objectID(), static_cast<GLuint>(i), static_cast<GLsizei>(aName.size()), &nLength,
                           &nElements, &nType, aName.data());
        std::string const sName(aName.data(), static_cast<std::size_t>(nLength));
        Details::Uniform const uniform{glGetUniformLocation(objectID(), sName.c_str()), nType};
        pDetails_->aUniforms_[sName] = uniform;
        std::size_t const nBracket = sName.rfind("[0]");
        if (nBracket != std::string::npos && nBracket + 3 == sName.size())
            pDetails_->aUniforms_[sName.substr(0, nBracket)] = uniform;
    }
}

bool Program::validate() const {
    ORVO_OGL_REQUIRE_CONTEXT();
    glValidateProgram(objectID());
    GLint nValid = GL_FALSE;
    glGetProgramiv(objectID(), GL_VALIDATE_STATUS, &nValid);
    return nValid != GL_FALSE;
}

void Program::enable() {
    ORVO_OGL_REQUIRE_CONTEXT();
    if (!pDetails_->bLinked_)
        ORVO_OGL_FAIL("Program is not linked", GL_INVALID_OPERATION);
    glUseProgram(objectID());
}

void Program::disable() {
    ORVO_OGL_REQUIRE_CONTEXT();
    glUseProgram(0);
}

int Program::getUniformLocation(char const* pName) const {
    ORVO_ENFORCE(pName);
    auto const known = pDetails_->aUniforms_.find(pName);
    if (known != pDetails_->aUniforms_.end())
        return known->second.iLocation_;
    // Further elements of arrays are not listed: the driver is asked. Other names are known to be absent.
    if (!pDetails_->bLinked_ || std::string(pName).find('[') == std::string::npos)
        return -1;
    ORVO_OGL_REQUIRE_CONTEXT();
    return glGetUniformLocation(objectID(), pName);
}

int Program::verifiedLocation(char const* pName, unsigned nType) const {
    ORVO_ENFORCE(pName);
    ORVO_OGL_REQUIRE_CONTEXT();
    if (static_cast<unsigned>(Internal::integerState(GL_CURRENT_PROGRAM)) != objectID())
        ORVO_OGL_FAIL("Program is not enabled", GL_INVALID_OPERATION);
    auto const known = pDetails_->aUniforms_.find(pName);
    if (known == pDetails_->aUniforms_.end())
        ORVO_OGL_FAIL(std::string("Uniform ") + pName + " does not exist", GL_INVALID_VALUE);
    if (known->second.nType_ != nType)
        ORVO_OGL_FAIL(std::string("Uniform ") + pName + " is of another type", GL_INVALID_OPERATION);
    return known->second.iLocation_;
}

bool Program::isSupported() {
    return ExtensionManager::Instance()->isSupported(EXTENSION_ARB_SHADER_OBJECTS);
}

} // namespace ORVO::OGL
