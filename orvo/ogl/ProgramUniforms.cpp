#include "orvo/ogl/Program.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"

namespace ORVO::OGL {

void Program::setUniform(char const* pName, bool value) {
    glUniform1i(verifiedLocation(pName, GL_BOOL), value ? 1 : 0);
}

void Program::setUniform(char const* pName, float x) { glUniform1f(verifiedLocation(pName, GL_FLOAT), x); }

void Program::setUniform(char const* pName, float x, float y) {
    glUniform2f(verifiedLocation(pName, GL_FLOAT_VEC2), x, y);
}

void Program::setUniform(char const* pName, float x, float y, float z) {
    glUniform3f(verifiedLocation(pName, GL_FLOAT_VEC3), x, y, z);
}

void Program::setUniform(char const* pName, float x, float y, float z, float w) {
    glUniform4f(verifiedLocation(pName, GL_FLOAT_VEC4), x, y, z, w);
}

void Program::setUniformSampler2D(char const* pName, int unit) {
    glUniform1i(verifiedLocation(pName, GL_SAMPLER_2D), unit);
}

void Program::setUniform_Unsafe(int location, float x) {
    ORVO_OGL_REQUIRE_CONTEXT();
    glUniform1f(location, x);
}

void Program::setUniform_Unsafe(int location, float x, float y) {
    ORVO_OGL_REQUIRE_CONTEXT();
    glUniform2f(location, x, y);
}

void Program::setUniform_Unsafe(int location, float x, float y, float z) {
    ORVO_OGL_REQUIRE_CONTEXT();
    glUniform3f(location, x, y, z);
}

void Program::setUniform_Unsafe(char const* pName, float x) {
    setUniform_Unsafe(getUniformLocation(pName), x);
}

void Program::setUniform_Unsafe(char const* pName, float x, float y) {
    setUniform_Unsafe(getUniformLocation(pName), x, y);
}

void Program::setUniform_Unsafe(char const* pName, float x, float y, float z) {
    setUniform_Unsafe(getUniformLocation(pName), x, y, z);
}

void Program::setUniformSampler1D_Unsafe(int location, int unit) {
    ORVO_OGL_REQUIRE_CONTEXT();
    glUniform1i(location, unit);
}

void Program::setUniformSampler1D_Unsafe(char const* pName, int unit) {
    setUniformSampler1D_Unsafe(getUniformLocation(pName), unit);
}

void Program::setUniformSampler2D_Unsafe(int location, int unit) {
    ORVO_OGL_REQUIRE_CONTEXT();
    glUniform1i(location, unit);
}

void Program::setUniformSampler2D_Unsafe(char const* pName, int unit) {
    setUniformSampler2D_Unsafe(getUniformLocation(pName), unit);
}

void Program::setUniformSampler3D_Unsafe(int location, int unit) {
    ORVO_OGL_REQUIRE_CONTEXT();
    glUniform1i(location, unit);
}

void Program::setUniformSampler3D_Unsafe(char const* pName, int unit) {
    setUniformSampler3D_Unsafe(getUniformLocation(pName), unit);
}

void Program::setUniformMatrix3_Unsafe(char const* pName, float const* pValues, unsigned char transpose) {
    ORVO_OGL_REQUIRE_CONTEXT();
    glUniformMatrix3fv(getUniformLocation(pName), 1, transpose, pValues);
}

void Program::setUniformMatrix4_Unsafe(char const* pName, float const* pValues, unsigned char transpose) {
    ORVO_OGL_REQUIRE_CONTEXT();
    glUniformMatrix4fv(getUniformLocation(pName), 1, transpose, pValues);
}

} // namespace ORVO::OGL
