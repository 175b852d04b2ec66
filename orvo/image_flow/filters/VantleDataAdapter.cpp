#include "orvo/image_flow/filters/VantleDataAdapter.h"

#include "orvo/colour_engine/VantleShaderParameterData.h"
#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/ScopedPtr.h"
#include "orvo/image_flow/ScopedTexturePoolAccessors.h"
#include "orvo/image_flow/filters/VantleShaderAdapter.h"
#include "orvo/image_runtime/GLStateUtils.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/PixelUnpackParameters.h"
#include "orvo/ogl/Program.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/Texture3D.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"

#include <algorithm>
#include <array>
#include <sstream>

namespace ORVO {

namespace {

using Record = _t_Vantle_ShaderParameterData;
using OGL::Texture;

constexpr unsigned nFirstUnitBehindTheInput = 2;
constexpr std::size_t nMatrixRoom = 16;

/// Textures of a map go back to the pool.
template <typename Textures>
void giveBack(Textures& textures) noexcept {
    for (auto const& [sName, entry] : textures) {
        trackedDelete(entry.first);
    }
    textures.clear();
}

/// Gives the texture of a name back, so that its successor can be the same one.
template <typename Textures>
void drop(Textures& textures, std::string const& sName) {
    auto const iEntry = textures.find(sName);
    if (iEntry != textures.end()) {
        trackedDelete(iEntry->second.first);
        textures.erase(iEntry);
    }
}

template <typename Textures, typename ScopedTexture>
void store(Textures& textures, std::string const& sName, ScopedTexture* pTexture, unsigned unit) {
    ScopedPtr<ScopedTexture> scoped(pTexture);
    textures.emplace(sName, std::pair(pTexture, unit));
    static_cast<void>(scoped.release());
}

/// What OpenGL's numbers in a record stand for. Wrap modes are apart: those of the dimensions that a table
/// does not have may be any numbers.
struct TableFormat {
    explicit TableFormat(Record const& record)
        : internalFormat_(Texture::GL2InternalFormat(record.internalFormat)),
          minFilter_(Texture::GL2Filter(record.minFilter)),
          magFilter_(Texture::GL2Filter(record.magFilter)),
          type_(Texture::GL2Type(record.type)),
          format_(Texture::GL2Format(record.format)) {}

    Texture::InternalFormat internalFormat_;
    Texture::Filter minFilter_;
    Texture::Filter magFilter_;
    Texture::Type type_;
    Texture::Format format_;
};

/// Float formats of one set of channels, and the formats that they stand in for.
struct Escalation {
    std::array<Texture::InternalFormat, 4> aFrom_;
    Texture::InternalFormat interpolated_;
    Texture::InternalFormat nearest_;
};

constexpr std::array<Escalation, 5> aEscalations{{
    {{Texture::INTERNAL_FORMAT_ALPHA, Texture::INTERNAL_FORMAT_ALPHA8, Texture::INTERNAL_FORMAT_ALPHA32F,
      Texture::INTERNAL_FORMAT_ALPHA16F},
     Texture::INTERNAL_FORMAT_ALPHA16F,
     Texture::INTERNAL_FORMAT_ALPHA32F},
    {{Texture::INTERNAL_FORMAT_LUMINANCE, Texture::INTERNAL_FORMAT_LUMINANCE8,
      Texture::INTERNAL_FORMAT_LUMINANCE32F, Texture::INTERNAL_FORMAT_LUMINANCE16F},
     Texture::INTERNAL_FORMAT_LUMINANCE16F,
     Texture::INTERNAL_FORMAT_LUMINANCE32F},
    {{Texture::INTERNAL_FORMAT_INTENSITY, Texture::INTERNAL_FORMAT_INTENSITY8,
      Texture::INTERNAL_FORMAT_INTENSITY32F, Texture::INTERNAL_FORMAT_INTENSITY16F},
     Texture::INTERNAL_FORMAT_INTENSITY16F,
     Texture::INTERNAL_FORMAT_INTENSITY32F},
    {{Texture::INTERNAL_FORMAT_RGB, Texture::INTERNAL_FORMAT_RGB8, Texture::INTERNAL_FORMAT_RGB32F,
      Texture::INTERNAL_FORMAT_RGB16F},
     Texture::INTERNAL_FORMAT_RGB16F,
     Texture::INTERNAL_FORMAT_RGB32F},
    {{Texture::INTERNAL_FORMAT_RGBA, Texture::INTERNAL_FORMAT_RGBA8, Texture::INTERNAL_FORMAT_RGBA32F,
      Texture::INTERNAL_FORMAT_RGBA16F},
     Texture::INTERNAL_FORMAT_RGBA16F,
     Texture::INTERNAL_FORMAT_RGBA32F},
}};

} // namespace

VantleDataAdapter::VantleDataAdapter(VantleShaderAdapter* shaderAdapter)
    : pShaderAdapter_(shaderAdapter), sInputSamplerName_("InputImage") {
    ORVO_CHECK(pShaderAdapter_ != nullptr, "vantleShader_ != NULL");
}

VantleDataAdapter::~VantleDataAdapter() {
    giveBack(tex1D_);
    giveBack(tex2D_);
    giveBack(tex3D_);
}

std::string VantleDataAdapter::buildGLObjects() {
    std::ostringstream stream;
    if (pShaderAdapter_->isValid()) {
        buildShaderString(stream);
    } else {
        buildDefaultShaderString(stream);
    }
    sShaderCode_ = stream.str();
    return sShaderCode_;
}

void VantleDataAdapter::buildShaderString(std::ostream& stream) {
    std::string sEntryPoint;
    std::string sCode;
    pShaderAdapter_->getShaderInfo(sEntryPoint, sCode);
    std::string const& S = sInputSamplerName_;
    stream << sCode << "#define _PROFILE_TILED\n"
           << "#define _PROFILE_NORMALIZED\n"
           << "uniform sampler2D " << S << "_sampler;\n"
           << "uniform vec2 _outOffset;\n"
           << "uniform vec2 _outPixelExtent;\n"
           << "uniform vec2 " << S << "_offset;\n"
           << "uniform vec2 " << S << "_delta;\n"
           << "void main(void)\n"
           << "{\n"
           << "   vec4 inputColor = texture2D(" << S
           << "_sampler, (gl_TexCoord[0].xy*_outPixelExtent+_outOffset-" << S << "_offset)*" << S
           << "_delta);\n"
           << sEntryPoint << "(inputColor);\n"
           << (bGreyResult_ ? "   inputColor.rgb = inputColor.ggg;\n" : "")
           << "   (gl_FragData[0]) = inputColor;\n"
           << "}\n";
}

void VantleDataAdapter::buildDefaultShaderString(std::ostream& stream) {
    std::string const& S = sInputSamplerName_;
    stream << "uniform sampler2D " << S << ";\n"
           << "const float Epsilon = 0.05;\n"
           << "const vec4 Red = vec4(1, 0, 0, 1);\n"
           << "void main(void)\n"
           << "{\n"
           << "    vec4 bg = texture2D(" << S << ", vec2(gl_TexCoord[0]));\n"
           << "    gl_FragColor = mix(Red, bg, step(Epsilon, abs(gl_TexCoord[0].x - gl_TexCoord[0].y)));\n"
           << "}\n";
}

std::string VantleDataAdapter::buildAndPopulateGLObjects() {
    std::string sText = buildGLObjects();
    populateGLObjects(nFirstUnitBehindTheInput);
    return sText;
}

bool VantleDataAdapter::canCreateGLObject(Record const& record) {
    OGL::ExtensionManager const& manager = *OGL::ExtensionManager::Instance();
    // The format is compared, not the type: what the engine's interface says, and hosts know.
    return (record.kind != Record::KIND_TEXTURE_3D || manager.supportsTexture3D()) &&
           (record.format != GL_FLOAT || manager.supportsFloatingPointTextures()) &&
           (record.wrapS != GL_CLAMP_TO_EDGE || manager.supportsClampToEdge());
}

bool VantleDataAdapter::canCreateGLObjectsAsRequested(VantleShaderAdapter& shaderAdapter) {
    bool bCan = OGL::Program::isSupported();
    if (!shaderAdapter.isValid()) {
        return bCan;
    }
    unsigned nUnits = 1; // the input's
    unsigned const nParameters = shaderAdapter.numParameters();
    for (unsigned index = 0; index < nParameters; ++index) {
        std::string sName;
        Record const record = shaderAdapter.getParameter(index, sName);
        bCan = bCan && canCreateGLObject(record);
        bool const bTexture = record.kind == Record::KIND_TEXTURE_1D ||
                              record.kind == Record::KIND_TEXTURE_2D ||
                              record.kind == Record::KIND_TEXTURE_3D;
        nUnits += bTexture ? 1 : 0;
    }
    return bCan && nUnits < OGL::ExtensionManager::Instance()->numberOfTextureUnits();
}

std::vector<float> VantleDataAdapter::copyMatrix(unsigned index, unsigned& size) {
    std::vector<float> aValues(nMatrixRoom);
    pShaderAdapter_->copyMatrixData(aValues.data(), index, size);
    aValues.resize(std::min<std::size_t>(size / sizeof(float), nMatrixRoom));
    return aValues;
}

void VantleDataAdapter::populateGLObjects(unsigned firstTextureUnit) {
    if (!pShaderAdapter_->isValid()) {
        return;
    }
    ScopedActiveTextureUnitRestore const activeUnit;
    unsigned unit = firstTextureUnit;
    unsigned const nParameters = pShaderAdapter_->numParameters();
    for (unsigned index = 0; index < nParameters; ++index) {
        std::string sName;
        Record const record = pShaderAdapter_->getParameter(index, sName);
        unsigned matSize = 0;
        switch (record.kind) {
        case Record::KIND_MATRIX_3X3: {
            std::vector<float> aValues = copyMatrix(index, matSize);
            ORVO_CHECK(matSize == 9 * sizeof(float));
            mat3_[sName] = std::move(aValues);
            break;
        }
        case Record::KIND_MATRIX_4X4: {
            std::vector<float> aValues = copyMatrix(index, matSize);
            ORVO_CHECK(matSize == 16 * sizeof(float));
            mat4_[sName] = std::move(aValues);
            break;
        }
        case Record::KIND_TEXTURE_1D:
            drop(tex1D_, sName);
            store(tex1D_, sName, constructTexture1DFromData(record, unit), unit);
            ++unit;
            break;
        case Record::KIND_TEXTURE_2D:
            drop(tex2D_, sName);
            store(tex2D_, sName, constructTexture2DFromData(record, unit), unit);
            ++unit;
            break;
        case Record::KIND_TEXTURE_3D:
            drop(tex3D_, sName);
            store(tex3D_, sName, constructTexture3DFromData(record, unit), unit);
            ++unit;
            break;
        default:
            ORVO_FAIL("Parameter interface not implemented");
        }
    }
}

ScopedTexture1D* VantleDataAdapter::constructTexture1DFromData(Record const& parameterData, unsigned unit) {
    ORVO_CHECK(parameterData.target == Texture::Target2GL(Texture::TARGET_1D),
               "Vantle is requesting an unsupported texture target for 1D textures");
    ORVO_ENFORCE(parameterData.data);
    TableFormat const table(parameterData);
    Texture::WrapMode const wrapS = Texture::GL2WrapMode(parameterData.wrapS);
    ScopedPtr<ScopedTexture1D> pScoped(ORVO_NEW ScopedTexture1D(
        parameterData.width,
        escalateInternalFormat1D(table.internalFormat_, table.type_, table.minFilter_, table.magFilter_)));
    OGL::Texture1D* const pTexture = pScoped->get();
    GLStateStack states;
    states.push_back(ORVO_NEW ScopedTexture1DEnablerWithActivation(unit));
    states.push_back(ORVO_NEW ScopedTexture1DBindUnbindWithActivation(unit, pTexture));
    pTexture->setFilter(table.minFilter_, table.magFilter_);
    pTexture->setWrap(wrapS);
    pTexture->subImage(parameterData.level, 0, parameterData.width, table.format_, table.type_,
                       parameterData.data, OGL::PixelUnpackParameters());
    ORVO_OGL_THROW_ON_ERROR("A table of a colour transform could not be uploaded");
    return pScoped.release();
}

ScopedTexture2D* VantleDataAdapter::constructTexture2DFromData(Record const& parameterData, unsigned unit) {
    ORVO_CHECK(parameterData.target == Texture::Target2GL(Texture::TARGET_2D),
               "Vantle is requesting an unsupported texture target for 2D textures");
    ORVO_ENFORCE(parameterData.data);
    TableFormat const table(parameterData);
    Texture::WrapMode const wrapS = Texture::GL2WrapMode(parameterData.wrapS);
    Texture::WrapMode const wrapT = Texture::GL2WrapMode(parameterData.wrapT);
    ScopedPtr<ScopedTexture2D> pScoped(ORVO_NEW ScopedTexture2D(
        parameterData.width, parameterData.height,
        escalateInternalFormat2D(table.internalFormat_, table.type_, table.minFilter_, table.magFilter_)));
    OGL::Texture2D* const pTexture = pScoped->get();
    GLStateStack states;
    states.push_back(ORVO_NEW ScopedTexture2DEnablerWithActivation(unit));
    states.push_back(ORVO_NEW ScopedTexture2DBindUnbindWithActivation(unit, pTexture));
    pTexture->setFilter(table.minFilter_, table.magFilter_);
    pTexture->setWrap(wrapS, wrapT);
    pTexture->subImage(parameterData.level, 0, 0, parameterData.width, parameterData.height, table.format_,
                       table.type_, parameterData.data, OGL::PixelUnpackParameters());
    ORVO_OGL_THROW_ON_ERROR("A table of a colour transform could not be uploaded");
    return pScoped.release();
}

ScopedTexture3D* VantleDataAdapter::constructTexture3DFromData(Record const& parameterData, unsigned unit) {
    ORVO_CHECK(parameterData.target == Texture::Target2GL(Texture::TARGET_3D),
               "Vantle is requesting an unsupported texture target for 3D textures");
    ORVO_ENFORCE(parameterData.data);
    TableFormat const table(parameterData);
    Texture::WrapMode const wrapS = Texture::GL2WrapMode(parameterData.wrapS);
    Texture::WrapMode const wrapT = Texture::GL2WrapMode(parameterData.wrapT);
    Texture::WrapMode const wrapR = Texture::GL2WrapMode(parameterData.wrapR);
    ScopedPtr<ScopedTexture3D> pScoped(ORVO_NEW ScopedTexture3DFromPool(
        parameterData.width, parameterData.height, parameterData.depth,
        escalateInternalFormat3D(table.internalFormat_, table.type_, table.minFilter_, table.magFilter_)));
    OGL::Texture3D* const pTexture = pScoped->get();
    GLStateStack states;
    states.push_back(ORVO_NEW ScopedTexture3DEnablerWithActivation(unit));
    states.push_back(ORVO_NEW ScopedTexture3DBindUnbindWithActivation(unit, pTexture));
    pTexture->setFilter(table.minFilter_, table.magFilter_);
    pTexture->setWrap(wrapS, wrapT, wrapR);
    pTexture->subImage(parameterData.level, 0, 0, 0, parameterData.width, parameterData.height,
                       parameterData.depth, table.format_, table.type_, parameterData.data,
                       OGL::PixelUnpackParameters());
    ORVO_OGL_THROW_ON_ERROR("A table of a colour transform could not be uploaded");
    return pScoped.release();
}

Texture::InternalFormat VantleDataAdapter::escalateInternalFormat1D(Texture::InternalFormat format,
                                                                    Texture::Type type,
                                                                    Texture::Filter minFilter,
                                                                    Texture::Filter magFilter) {
    if (type != Texture::TYPE_FLOAT || !OGL::ExtensionManager::Instance()->supportsFloatingPointTextures()) {
        return format;
    }
    for (Escalation const& row : aEscalations) {
        if (std::find(row.aFrom_.begin(), row.aFrom_.end(), format) != row.aFrom_.end()) {
            bool const bInterpolated = Texture::IsLinear(minFilter) || Texture::IsLinear(magFilter);
            return bInterpolated ? row.interpolated_ : row.nearest_;
        }
    }
    ORVO_FAIL("Requested internal format not supported");
}

Texture::InternalFormat VantleDataAdapter::escalateInternalFormat2D(Texture::InternalFormat format,
                                                                    Texture::Type /*type*/,
                                                                    Texture::Filter /*minFilter*/,
                                                                    Texture::Filter /*magFilter*/) {
    return format;
}

Texture::InternalFormat VantleDataAdapter::escalateInternalFormat3D(Texture::InternalFormat format,
                                                                    Texture::Type /*type*/,
                                                                    Texture::Filter /*minFilter*/,
                                                                    Texture::Filter /*magFilter*/) {
    return format;
}

} // namespace ORVO
