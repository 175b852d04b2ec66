#include "orvo/image_runtime/UniformArray.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/image_runtime/GLStateUtils.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/Program.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/TextureState.h"
#include "orvo/ogl/TextureUnit.h"
#include "orvo/ogl/internal/Failure.h"

namespace ORVO {

namespace {

using OGL::Texture;
using OGL::TextureUnit;

TexturePool& requiredPool() {
    TexturePool* const pPool = TexturePool::Instance();
    ORVO_ENFORCE(pPool);
    return *pPool;
}

/// Gives the texture to the pool, or deletes it where there is none any more.
void giveBack(OGL::Texture1D* pTexture) noexcept {
    TexturePool* pPool = nullptr;
    try {
        pPool = &requiredPool();
    } catch (...) {
        trackedDelete(pTexture);
        return;
    }
    try {
        pPool->returnTexture1DToPool(pTexture);
    } catch (...) {
        // The texture is the pool's, which could not delete others to keep to its budget.
        return;
    }
}

} // namespace

std::shared_ptr<UniformArray> UniformArray::construct(OGL::Program& oProgram, std::string const& name,
                                                      float const* data, unsigned count, unsigned unit) {
    ORVO_ENFORCE(data);
    ORVO_CHECK_PARAMETER(count > 0);
    ScopedActiveTextureUnitRestore const restore;
    OGL::TextureState::setActiveTextureUnit(unit);
    auto spArray = std::make_shared<UniformArray>(count, unit, Texture::INTERNAL_FORMAT_LUMINANCE32F);
    TextureUnit::Unit(unit).enable1D();

    OGL::Texture1D& texture = *spArray->getTexture();
    texture.subImage(0, 0, count, Texture::FORMAT_LUMINANCE, Texture::TYPE_FLOAT, data,
                     OGL::PixelUnpackParameters());
    ORVO_OGL_THROW_ON_ERROR("The uniform array could not be uploaded");
    texture.setFilter(Texture::FILTER_NEAREST, Texture::FILTER_NEAREST);
    texture.setWrap(Texture::WRAP_MODE_CLAMP_TO_EDGE);

    int const iSampler = oProgram.getUniformLocation((name + "_sampler").c_str());
    if (iSampler != -1) {
        oProgram.setUniformSampler1D_Unsafe(iSampler, static_cast<int>(unit));
    }
    int const iDelta = oProgram.getUniformLocation((name + "_delta").c_str());
    if (iDelta != -1) {
        oProgram.setUniform_Unsafe(iDelta, 1.0f / static_cast<float>(texture.width(0)));
    }
    return spArray;
}

UniformArray::UniformArray(unsigned width, unsigned unit, Texture::InternalFormat internalFormat)
    : nUnit_(unit), pTexture_(requiredPool().getTexture1DFromPool(width, internalFormat, true)) {
    try {
        ScopedActiveTextureUnitRestore const restore;
        TextureUnit::Unit(unit).bind(pTexture_);
    } catch (...) {
        giveBack(pTexture_);
        throw;
    }
}

UniformArray::~UniformArray() {
    try {
        ScopedActiveTextureUnitRestore const restore;
        TextureUnit const& unit = TextureUnit::Unit(nUnit_);
        unit.disable1D();
        unit.bind1DDefault();
    } catch (...) {
        // Without a context there is nothing bound: the texture still goes back.
        giveBack(pTexture_);
        return;
    }
    giveBack(pTexture_);
}

} // namespace ORVO
