#include "orvo/ogl/Texture.h"

#include <algorithm>
#include <climits>
#include <cstdint>
#include <string>

#include "orvo/core/Check.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/Scopes.h"
#include "orvo/ogl/internal/ShareGroup.h"

namespace ORVO::OGL {

namespace {

/// Levels from the given size down to one pixel.
unsigned levelsDownToOne(std::size_t nLargest) noexcept {
    unsigned nLevels = 1;
    for (; nLargest > 1; nLargest /= 2)
        ++nLevels;
    return nLevels;
}

std::size_t sizeOfLevel(std::size_t nSize, unsigned level) noexcept {
    return nSize == 0 ? 0 : std::max<std::size_t>(1, level < 64 ? nSize >> level : 0);
}

} // namespace

Texture::Texture(unsigned nTarget, InternalFormat format, Extent const& extent, bool bMipmaps)
    : Object(nTarget), eFormat_(format), oExtent_(extent) {
    std::size_t const nLargest = std::max({extent.nWidth_, extent.nHeight_, extent.nDepth_});
    ORVO_CHECK_PARAMETER(nLargest <= INT_MAX && SizeInBytes(format, extent.nWidth_, extent.nHeight_,
                                                            extent.nDepth_) <= UINT32_MAX,
                         "Texture size is too large");
    if (bMipmaps)
        nLevels_ = levelsDownToOne(nLargest);
    joinShareGroup();
    GLuint nName = 0;
    glGenTextures(1, &nName);
    if (nName == 0) {
        Internal::clearErrors();
        ORVO_OGL_FAIL("The texture could not be created", GL_OUT_OF_MEMORY);
    }
    setObjectID(nName);
}

Texture::~Texture() {
    if (Internal::ShareGroup const* const pGroup = shareGroup())
        pGroup->destroy(Internal::ShareGroup::Kind::texture, Texture::objectID());
}

unsigned Texture::getBoundID() const {
    ORVO_OGL_REQUIRE_CONTEXT();
    return Internal::boundTexture(target());
}

void Texture::requireBound() const { ORVO_CHECK(isBound()); }

void Texture::requireLevel(int level) const {
    ORVO_CHECK_PARAMETER(level >= 0 && static_cast<unsigned>(level) < nLevels_, "The level does not exist");
}

std::size_t Texture::width(unsigned level) const noexcept {
    return level < nLevels_ ? sizeOfLevel(oExtent_.nWidth_, level) : 0;
}

std::size_t Texture::height(unsigned level) const noexcept {
    return level < nLevels_ ? sizeOfLevel(oExtent_.nHeight_, level) : 0;
}

std::size_t Texture::depth(unsigned level) const noexcept {
    return level < nLevels_ ? sizeOfLevel(oExtent_.nDepth_, level) : 0;
}

int Texture::sizeInBytes() const noexcept {
    std::size_t nBytes = 0;
    for (unsigned level = 0; level < nLevels_; ++level)
        nBytes += SizeInBytes(eFormat_, width(level), height(level), depth(level));
    return static_cast<int>(std::min<std::size_t>(nBytes, INT_MAX));
}

void Texture::setFilter(Filter min, Filter mag) {
    auto const nMin = static_cast<GLint>(Filter2GL(min));
    auto const nMag = static_cast<GLint>(Filter2GL(mag));
    if (mag > FILTER_LINEAR)
        ORVO_OGL_FAIL("A magnification filter has no mipmaps", GL_INVALID_ENUM);
    requireBound();
    glTexParameteri(target(), GL_TEXTURE_MIN_FILTER, nMin);
    glTexParameteri(target(), GL_TEXTURE_MAG_FILTER, nMag);
}

void Texture::setBorderColor(float const* pColor) {
    ORVO_ENFORCE(pColor);
    requireBound();
    glTexParameterfv(target(), GL_TEXTURE_BORDER_COLOR, pColor);
}

} // namespace ORVO::OGL
