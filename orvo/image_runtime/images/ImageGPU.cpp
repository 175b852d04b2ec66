#include "orvo/image_runtime/images/ImageGPU.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/image_runtime/GLStateUtils.h"
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/Scopes.h"

#include <array>
#include <limits>
#include <ostream>

namespace ORVO {

namespace {

/// A token or a number of channels of 0 marks what is refused.
struct FormatRow {
    char const* sName_;
    unsigned nToken_;
    std::size_t nChannels_;
};

// Indexed by the format. What has a token but no number of channels serves as a texture format only.
constexpr std::array<FormatRow, 17> aFormats{{
    {"PIXEL_FORMAT_RGBA8", GL_RGBA8, 4},
    {"PIXEL_FORMAT_RGBA16", GL_RGBA16, 0},
    {"PIXEL_FORMAT_RGBA16F", GL_RGBA16F, 4},
    {"PIXEL_FORMAT_RGBA32F", GL_RGBA32F, 4},
    {"PIXEL_FORMAT_RGB8", GL_RGB8, 3},
    {"PIXEL_FORMAT_RGB16", GL_RGB16, 0},
    {"PIXEL_FORMAT_RGB16F", GL_RGB16F, 3},
    {"PIXEL_FORMAT_RGB32F", GL_RGB32F, 3},
    {"PIXEL_FORMAT_LUMINANCE8", GL_LUMINANCE, 1},
    {"PIXEL_FORMAT_LUMINANCE16", GL_LUMINANCE16, 1},
    {"PIXEL_FORMAT_LUMINANCE16F", GL_LUMINANCE16F_ARB, 0},
    {"PIXEL_FORMAT_LUMINANCE32F", GL_LUMINANCE32F_ARB, 1},
    {"PIXEL_FORMAT_LUMINANCE_ALPHA8", GL_LUMINANCE_ALPHA, 2},
    {"PIXEL_FORMAT_LUMINANCE_ALPHA16", 0, 0},
    {"PIXEL_FORMAT_LUMINANCE_ALPHA16F", GL_LUMINANCE_ALPHA16F_ARB, 2},
    {"PIXEL_FORMAT_LUMINANCE_ALPHA32F", GL_LUMINANCE_ALPHA32F_ARB, 2},
    {"PIXEL_FORMAT_UNDEFINED", 0, 0},
}};

/// Null for a number that is no format.
FormatRow const* rowOf(ImageGPU::tePixelFormat ePixelFormat) noexcept {
    auto const nFormat = static_cast<std::size_t>(ePixelFormat);
    return nFormat < aFormats.size() ? &aFormats[nFormat] : nullptr;
}

/// State that a clear of the whole framebuffer depends on, as it was at the end of the scope.
class ScopedClearState {
public:
    ScopedClearState() noexcept : bScissor_(glIsEnabled(GL_SCISSOR_TEST)) {
        glGetIntegerv(GL_VIEWPORT, aViewport_.data());
        glGetFloatv(GL_COLOR_CLEAR_VALUE, aColor_.data());
        glGetBooleanv(GL_COLOR_WRITEMASK, aMask_.data());
    }
    ~ScopedClearState() {
        glColorMask(aMask_[0], aMask_[1], aMask_[2], aMask_[3]);
        if (bScissor_ == GL_TRUE)
            glEnable(GL_SCISSOR_TEST);
        glClearColor(aColor_[0], aColor_[1], aColor_[2], aColor_[3]);
        glViewport(aViewport_[0], aViewport_[1], aViewport_[2], aViewport_[3]);
    }
    ScopedClearState(ScopedClearState const&) = delete;
    ScopedClearState& operator=(ScopedClearState const&) = delete;

private:
    GLboolean bScissor_;
    std::array<GLint, 4> aViewport_{};
    std::array<GLfloat, 4> aColor_{};
    std::array<GLboolean, 4> aMask_{};
};

TexturePool& requiredPool() {
    TexturePool* const pPool = TexturePool::Instance();
    ORVO_ENFORCE(pPool, "TexturePool::Instance()");
    return *pPool;
}

/// Sizes as the pool takes them. Refused here, before anything is allocated or told to a listener.
void requireSize(ExtentInPixelSpace const& extent, OGL::Texture::InternalFormat format) {
    ORVO_CHECK_PARAMETER(extent.width() >= 0 && extent.height() >= 0, "Image extent must not be negative");
    ORVO_CHECK_PARAMETER(OGL::Texture::SizeInBytes(format, static_cast<std::size_t>(extent.width()),
                                                   static_cast<std::size_t>(extent.height()),
                                                   1) <= std::numeric_limits<std::uint32_t>::max(),
                         "Image size exceeds 4294967295 bytes");
}

} // namespace

ImageGPU::ImageGPU() { eTargetPlatform_ = ORVO_TARGET_GL; }

ImageGPU::ImageGPU(PositionExtentInPixelSpace const& positionExtent, tePixelFormat ePixelFormat,
                   PixelExtentInWorldSpace const& pixelExtent, bool exact)
    : ImageBase(positionExtent, pixelExtent), ePixelFormat_(ePixelFormat) {
    eTargetPlatform_ = ORVO_TARGET_GL;
    auto const format = OGL::Texture::GL2InternalFormat(PixelFormatORVO2GL(ePixelFormat));
    requireSize(extent(), format);
    pPool_ = &requiredPool();
    pTexture_ = pPool_->getTexture2DFromPool(static_cast<unsigned>(extent().width()),
                                             static_cast<unsigned>(extent().height()), format, exact);
}

ImageGPU::ImageGPU(PositionExtentInPixelSpace const& positionExtent, OGL::Texture2D* pTexture,
                   PixelExtentInWorldSpace const& pixelExtent)
    : ImageBase(positionExtent, pixelExtent) {
    eTargetPlatform_ = ORVO_TARGET_GL;
    ORVO_ENFORCE(pTexture);
    ePixelFormat_ = PixelFormatGL2ORVO(OGL::Texture::InternalFormat2GL(pTexture->format()));
    pPool_ = TexturePool::Instance();
    pTexture_ = pTexture;
}

ImageGPU::ImageGPU(ImageGPU const& other) : ImageBase(other) {
    ORVO_FAIL("Not implemented: no copying of ImageGPU allowed");
}

// NOLINTNEXTLINE(bugprone-unhandled-self-assignment): nothing is ever assigned.
ImageGPU& ImageGPU::operator=(ImageGPU const&) {
    ORVO_FAIL("Not implemented: no copying of ImageGPU allowed");
}

ImageGPU::~ImageGPU() {
    if (pTexture_)
        returnTexture();
}

void ImageGPU::returnTexture() noexcept {
    TexturePool* pPool = nullptr;
    try {
        pPool = TexturePool::Instance();
        bindDefault();
    } catch (...) {
        // No context is current, or one that no pool serves: a destructor lets nothing out.
    }
    if (!ImageRuntime::Library::isInitialized()) {
        trackedDelete(pTexture_);
        return;
    }
    if (!pPool) {
        TexturePool::returnTexture2DLater(pTexture_);
        return;
    }
    try {
        pPool->returnTexture2DToPool(pTexture_);
    } catch (...) {
        // The texture is the pool's already, which failed to keep to its budget.
    }
}

ExtentInPixelSpace ImageGPU::capacityExtent() const {
    if (!pTexture_)
        return ExtentInPixelSpace();
    return {static_cast<int>(pTexture_->width(0)), static_cast<int>(pTexture_->height(0))};
}

OGL::Texture2D* ImageGPU::release() {
    OGL::Texture2D* const pTexture = pTexture_;
    forgetTexture();
    return pTexture;
}

void ImageGPU::forgetTexture() noexcept {
    pPool_ = nullptr;
    pTexture_ = nullptr;
}

OGL::Texture2D& ImageGPU::requiredTexture() const {
    ORVO_CHECK(pTexture_, "No Texture Object specified");
    return *pTexture_;
}

void ImageGPU::bind(unsigned unit) const {
    ORVO_CHECK(nBoundTexUnit_ == -1 || static_cast<unsigned>(nBoundTexUnit_) == unit,
               "Image currently bound to a different unit");
    OGL::TextureUnit::Unit(unit).bind(pTexture_);
    nBoundTexUnit_ = static_cast<std::int32_t>(unit);
}

void ImageGPU::bindDefault() const {
    if (nBoundTexUnit_ == -1)
        return;
    requiredTexture();
    OGL::TextureUnit::Unit(static_cast<unsigned>(nBoundTexUnit_)).bind2DDefault();
    nBoundTexUnit_ = -1;
}

void ImageGPU::enable(unsigned unit) const { OGL::TextureUnit::Unit(unit).enable2D(); }

void ImageGPU::disable(unsigned unit) const { OGL::TextureUnit::Unit(unit).disable2D(); }

void ImageGPU::setEnvironment(OGL::TextureUnit::Environment environment) const {
    OGL::TextureUnit::Unit(static_cast<unsigned>(nBoundTexUnit_)).setEnv(environment);
}

void ImageGPU::setFilter(unsigned min, unsigned mag) const {
    requiredTexture().setFilter(OGL::Texture::GL2Filter(min), OGL::Texture::GL2Filter(mag));
}

void ImageGPU::setWrap(unsigned s, unsigned t) const {
    requiredTexture().setWrap(OGL::Texture::GL2WrapMode(s), OGL::Texture::GL2WrapMode(t));
}

void ImageGPU::setBorderColor(float const* pColor) const { requiredTexture().setBorderColor(pColor); }

void ImageGPU::requireInside(PositionExtentInPixelSpace const& targetPositionExtent) const {
    // In 64 bits, so that no sum wraps.
    using Int = std::int64_t;
    PositionInPixelSpace const& target = targetPositionExtent.position();
    ExtentInPixelSpace const& size = targetPositionExtent.extent();
    ORVO_CHECK_PARAMETER(position().x() <= target.x() && position().y() <= target.y(),
                         "position().x() <= targetPositionExtent.position().x() && position().y() <= "
                         "targetPositionExtent.position().y()");
    ORVO_CHECK_PARAMETER(
        Int{target.x()} + size.width() <= Int{position().x()} + extent().width() &&
            Int{target.y()} + size.height() <= Int{position().y()} + extent().height(),
        "targetPositionExtent.position().x() + targetPositionExtent.extent().width() <= position().x() + "
        "extent().width() && targetPositionExtent.position().y() + targetPositionExtent.extent().height() <= "
        "position().y() + extent().height()");
}

void ImageGPU::uploadRectangle(PositionExtentInPixelSpace const& targetPositionExtent, unsigned format,
                               unsigned type, void const* pPixels, unsigned rowLength) {
    OGL::Texture2D& texture = requiredTexture();
    auto const eFormat = OGL::Texture::GL2Format(format);
    auto const eType = OGL::Texture::GL2Type(type);
    PositionExtentInPixelSpace const rectangle = targetPositionExtent - position();
    OGL::PixelUnpackParameters parameters;
    parameters.setRowLength(rowLength);
    ScopedTextureBindRestore<OGL::Texture2D> const binding(&texture);
    texture.subImage(0, rectangle.position().x(), rectangle.position().y(),
                     static_cast<std::size_t>(rectangle.extent().width()),
                     static_cast<std::size_t>(rectangle.extent().height()), eFormat, eType, pPixels,
                     parameters);
    ORVO_OGL_THROW_ON_ERROR("The image could not be uploaded");
}

void ImageGPU::copyImageData(PositionExtentInPixelSpace const& targetPositionExtent, unsigned format,
                             unsigned type, void const* pPixels, PixelExtentInWorldSpace const& pixelExtent) {
    requireInside(targetPositionExtent);
    ORVO_OGL_REQUIRE_CONTEXT();
    if (OGL::Internal::boundBuffer(GL_PIXEL_UNPACK_BUFFER) == 0)
        ORVO_ENFORCE(pPixels);
    uploadRectangle(targetPositionExtent, format, type, pPixels, 0);
    setPixelExtent(pixelExtent);
}

void ImageGPU::copyImageData(unsigned char const* pPixels,
                             PositionExtentInPixelSpace const& targetPositionExtent,
                             PixelExtentInWorldSpace const& pixelExtent, unsigned format, unsigned type,
                             unsigned rowLength) {
    requireInside(targetPositionExtent);
    ORVO_ENFORCE(pPixels);
    ORVO_OGL_REQUIRE_CONTEXT();
    // A buffer of the host's would turn the pointer into an offset.
    OGL::Internal::ScopedBufferBinding const noBuffer(GL_PIXEL_UNPACK_BUFFER, 0);
    setPixelExtent(pixelExtent);
    uploadRectangle(targetPositionExtent, format, type, pPixels, rowLength);
}

void ImageGPU::copyFrameBufferData(PositionInPixelSpace const& destination,
                                   PositionInPixelSpace const& source, ExtentInPixelSpace const& extent) {
    OGL::Texture2D& texture = requiredTexture();
    ScopedTextureBindRestore<OGL::Texture2D> const binding(&texture);
    texture.copyTexSubImage(0, destination.x(), destination.y(), source.x(), source.y(),
                            static_cast<std::size_t>(extent.width()),
                            static_cast<std::size_t>(extent.height()));
    ORVO_OGL_THROW_ON_ERROR("The framebuffer could not be copied");
}

void ImageGPU::initializeToTransparentBlack() {
    ExtentInPixelSpace const capacity = capacityExtent();
    if (extent() == capacity)
        return;
    requiredTexture();
    // A framebuffer without pixels is not complete, and to clear it an error.
    if (capacity.width() == 0 || capacity.height() == 0)
        return;
    ORVO_OGL_REQUIRE_CONTEXT();
    ScopedClearState const restore;
    glDisable(GL_SCISSOR_TEST);
    glColorMask(GL_TRUE, GL_TRUE, GL_TRUE, GL_TRUE);
    glViewport(0, 0, capacity.width(), capacity.height());
    glClearColor(0, 0, 0, 0);
    glClear(GL_COLOR_BUFFER_BIT);
}

void ImageGPU::doWrite(std::ostream& stream) const {
    ImageBase::doWrite(stream);
    stream << "Pixel format : " << pixelFormat() << "\n";
}

unsigned ImageGPU::PixelFormatORVO2GL(tePixelFormat ePixelFormat) {
    FormatRow const* const pRow = rowOf(ePixelFormat);
    ORVO_CHECK_PARAMETER(pRow && pRow->nToken_, "invalid pixel format");
    return pRow->nToken_;
}

ImageGPU::tePixelFormat ImageGPU::PixelFormatGL2ORVO(unsigned internalFormat) {
    // The sized token of the format whose own is the unsized one.
    if (internalFormat == GL_LUMINANCE8)
        return PIXEL_FORMAT_LUMINANCE8;
    for (std::size_t i = 0; i < aFormats.size(); ++i)
        if (internalFormat != 0 && aFormats[i].nToken_ == internalFormat)
            return static_cast<tePixelFormat>(i);
    ORVO_FAIL_PARAMETER("invalid pixel format");
}

std::size_t nChannels(ImageGPU::tePixelFormat ePixelFormat) {
    FormatRow const* const pRow = rowOf(ePixelFormat);
    ORVO_CHECK(pRow && pRow->nChannels_, "Pixel format not supported by ORVO in GPU mode");
    return pRow->nChannels_;
}

std::ostream& operator<<(std::ostream& stream, ImageGPU::tePixelFormat ePixelFormat) {
    FormatRow const* const pRow = rowOf(ePixelFormat);
    return stream << (pRow ? pRow->sName_ : "UNKNOWN");
}

} // namespace ORVO
