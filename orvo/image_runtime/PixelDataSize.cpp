#include "orvo/image_runtime/PixelDataSize.h"

#include "orvo/core/Check.h"
#include "orvo/ogl/TokenName.h"

#include <string>

namespace ORVO {

namespace {

/// The name of the type's token; its number if it is none of the types.
char const* nameOf(OGL::Texture::Type type) {
    bool const bType = type >= OGL::Texture::TYPE_UNSIGNED_BYTE && type <= OGL::Texture::TYPE_HALF_FLOAT;
    return OGL::TokenName(bType ? OGL::Texture::Type2GL(type) : static_cast<unsigned>(type));
}

std::size_t channelSize(OGL::Texture::Type type) {
    using OGL::Texture;
    switch (static_cast<int>(type)) {
    case Texture::TYPE_UNSIGNED_BYTE:
    case Texture::TYPE_BYTE:
    case Texture::TYPE_UNSIGNED_INT_8_8_8_8:
    case Texture::TYPE_UNSIGNED_INT_8_8_8_8_REV:
        return 1;
    case Texture::TYPE_UNSIGNED_SHORT:
    case Texture::TYPE_SHORT:
    case Texture::TYPE_HALF_FLOAT:
        return 2;
    case Texture::TYPE_FLOAT:
        return 4;
    default:
        ORVO_FAIL(std::string("pixelDataSize: Unknown type ") + nameOf(type));
    }
}

} // namespace

std::size_t pixelDataSize(OGL::Texture::Format format, OGL::Texture::Type type) {
    return OGL::Texture::Channels(format) * channelSize(type);
}

} // namespace ORVO
