#pragma once

#include "orvo/core/Export.h"
#include "orvo/ogl/Texture.h"

#include <iosfwd>
#include <map>
#include <string>
#include <utility>
#include <vector>

namespace ORVO {

class ScopedTexture1D;
class ScopedTexture2D;
class ScopedTexture3D;
class VantleShaderAdapter;
struct _t_Vantle_ShaderParameterData;

/// Turns the description of a colour transform into what the GPU runs: the text of a whole fragment program,
/// and its tables as textures of the pool. It keeps the textures until it dies or makes them anew.
///
/// The program is of the kind that BasicGLShaderFilter runs, over one input "InputImage". Over a shader
/// adapter that is not valid it is another one, which draws a red diagonal over the input: it reads the
/// sampler `InputImage` at gl_TexCoord[0], which then has to address the input's texture.
///
/// A program for a grey result hands its green result on in all three channels of colour.
///
/// Operations throw what the shader adapter throws.
///
/// Threads: the one that draws; what makes or drops textures needs a context of the image runtime current,
/// always of the same share group.
class ORVO_API VantleDataAdapter {
public:
    /// @param shaderAdapter not owned; has to outlive this object.
    /// @throws InternalException "vantleShader_ != NULL".
    explicit VantleDataAdapter(VantleShaderAdapter* shaderAdapter);
    VantleDataAdapter(VantleDataAdapter const&) = delete;
    VantleDataAdapter& operator=(VantleDataAdapter const&) = delete;
    /// Gives the textures back to the pool.
    virtual ~VantleDataAdapter();

    /// Whether programs that are built from now on are for a grey result; they are not at first.
    void setGreyResult(bool bGrey) noexcept { bGreyResult_ = bGrey; }

    /// The text of the fragment program. Speaks to the engine alone.
    std::string buildGLObjects();
    /// Makes the textures and fetches the matrices; nothing on a shader adapter that is not valid. Textures
    /// take the units from firstTextureUnit on, in the order of the engine's parameters, for binding later:
    /// afterwards no unit has anything bound that was not, and the active unit is the same. A texture or
    /// matrix of the same name that was there goes back at once.
    /// @throws InternalException "matSize == 9 * sizeof(float)", "matSize == 16 * sizeof(float)", "Parameter
    ///         interface not implemented", "Vantle is requesting an unsupported texture target for 1D
    ///         textures" (2D, 3D), "Requested internal format not supported", "Enforce parameterData.data !=
    ///         NULL"; ParameterException "The level does not exist"; ExceptionOGL. What was made before the
    ///         failure is kept.
    void populateGLObjects(unsigned firstTextureUnit);
    /// Both, with units from 2 on.
    std::string buildAndPopulateGLObjects();

    /// The name of the input.
    std::string const& getInputSamplerName() const noexcept { return sInputSamplerName_; }

    /// Whether the current context can run the transform: it has programs, the kinds of textures and wrap
    /// modes that are asked for, and more texture units than the tables and the input take.
    static bool canCreateGLObjectsAsRequested(VantleShaderAdapter& shaderAdapter);

    /// What was made, by the names of the uniforms: textures with their units, matrices column by column.
    std::map<std::string, std::pair<ScopedTexture1D*, unsigned>> const& textures1D() const noexcept {
        return tex1D_;
    }
    std::map<std::string, std::pair<ScopedTexture2D*, unsigned>> const& textures2D() const noexcept {
        return tex2D_;
    }
    std::map<std::string, std::pair<ScopedTexture3D*, unsigned>> const& textures3D() const noexcept {
        return tex3D_;
    }
    std::map<std::string, std::vector<float>> const& matrices3() const noexcept { return mat3_; }
    std::map<std::string, std::vector<float>> const& matrices4() const noexcept { return mat4_; }

private:
    void buildShaderString(std::ostream& stream);
    void buildDefaultShaderString(std::ostream& stream);

    ScopedTexture1D* constructTexture1DFromData(_t_Vantle_ShaderParameterData const& parameterData,
                                                unsigned unit);
    ScopedTexture2D* constructTexture2DFromData(_t_Vantle_ShaderParameterData const& parameterData,
                                                unsigned unit);
    ScopedTexture3D* constructTexture3DFromData(_t_Vantle_ShaderParameterData const& parameterData,
                                                unsigned unit);

    /// The internal format for a table: one of floats is widened to floats of its channels, to halves where
    /// it is interpolated.
    /// @throws InternalException "Requested internal format not supported".
    static OGL::Texture::InternalFormat escalateInternalFormat1D(OGL::Texture::InternalFormat format,
                                                                 OGL::Texture::Type type,
                                                                 OGL::Texture::Filter minFilter,
                                                                 OGL::Texture::Filter magFilter);
    static OGL::Texture::InternalFormat escalateInternalFormat2D(OGL::Texture::InternalFormat format,
                                                                 OGL::Texture::Type type,
                                                                 OGL::Texture::Filter minFilter,
                                                                 OGL::Texture::Filter magFilter);
    static OGL::Texture::InternalFormat escalateInternalFormat3D(OGL::Texture::InternalFormat format,
                                                                 OGL::Texture::Type type,
                                                                 OGL::Texture::Filter minFilter,
                                                                 OGL::Texture::Filter magFilter);
    static bool canCreateGLObject(_t_Vantle_ShaderParameterData const& parameterData);

    std::vector<float> copyMatrix(unsigned index, unsigned& size);

    VantleShaderAdapter* pShaderAdapter_;
    std::map<std::string, std::pair<ScopedTexture1D*, unsigned>> tex1D_;
    std::map<std::string, std::pair<ScopedTexture2D*, unsigned>> tex2D_;
    std::map<std::string, std::pair<ScopedTexture3D*, unsigned>> tex3D_;
    std::map<std::string, std::vector<float>> mat3_;
    std::map<std::string, std::vector<float>> mat4_;
    std::string sInputSamplerName_;
    std::string sShaderCode_;
    bool bGreyResult_ = false;
};

} // namespace ORVO
