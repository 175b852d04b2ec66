#include "orvo/image_flow/filters/FormatEnumConversionUtil.h"

#include "orvo/core/Check.h"

#include <algorithm>
#include <iterator>

namespace ORVO {

namespace {

using CPU = ImageCPU;
using GPU = ImageGPU;
using OGL::Texture;

/// How the pixels of one format lie in memory, and what they become.
struct Mapping {
    CPU::tePixelFormat eFrom_;
    GPU::tePixelFormat eTo_;
    Texture::Format eFormat_;
    Texture::Type eType_;
};

constexpr Texture::Type BYTES = Texture::TYPE_UNSIGNED_BYTE;
constexpr Texture::Type HALVES = Texture::TYPE_HALF_FLOAT;
constexpr Texture::Type FLOATS = Texture::TYPE_FLOAT;

constexpr Mapping aMappings[] = {
    {CPU::PIXEL_FORMAT_BGR8, GPU::PIXEL_FORMAT_RGB8, Texture::FORMAT_BGR, BYTES},
    {CPU::PIXEL_FORMAT_BGRA8, GPU::PIXEL_FORMAT_RGBA8, Texture::FORMAT_BGRA, BYTES},
    {CPU::PIXEL_FORMAT_RGB8, GPU::PIXEL_FORMAT_RGB8, Texture::FORMAT_RGB, BYTES},
    {CPU::PIXEL_FORMAT_RGBA8, GPU::PIXEL_FORMAT_RGBA8, Texture::FORMAT_RGBA, BYTES},
    {CPU::PIXEL_FORMAT_RGB16, GPU::PIXEL_FORMAT_RGB16F, Texture::FORMAT_RGB, HALVES},
    {CPU::PIXEL_FORMAT_RGBA16, GPU::PIXEL_FORMAT_RGBA16F, Texture::FORMAT_RGBA, HALVES},
    {CPU::PIXEL_FORMAT_RGB32F, GPU::PIXEL_FORMAT_RGB32F, Texture::FORMAT_RGB, FLOATS},
    {CPU::PIXEL_FORMAT_RGBA32F, GPU::PIXEL_FORMAT_RGBA32F, Texture::FORMAT_RGBA, FLOATS},
    {CPU::PIXEL_FORMAT_LUMINANCE8, GPU::PIXEL_FORMAT_LUMINANCE8, Texture::FORMAT_LUMINANCE, BYTES},
    {CPU::PIXEL_FORMAT_LUMINANCE16, GPU::PIXEL_FORMAT_LUMINANCE16F, Texture::FORMAT_LUMINANCE, HALVES},
    {CPU::PIXEL_FORMAT_LUMINANCE32F, GPU::PIXEL_FORMAT_LUMINANCE32F, Texture::FORMAT_LUMINANCE, FLOATS},
    {CPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, GPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, Texture::FORMAT_LUMINANCE_ALPHA,
     BYTES},
    {CPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, GPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F,
     Texture::FORMAT_LUMINANCE_ALPHA, HALVES},
    {CPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, GPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F,
     Texture::FORMAT_LUMINANCE_ALPHA, FLOATS},
    {CPU::PIXEL_FORMAT_RGB16F, GPU::PIXEL_FORMAT_RGB16F, Texture::FORMAT_RGB, HALVES},
    {CPU::PIXEL_FORMAT_RGBA16F, GPU::PIXEL_FORMAT_RGBA16F, Texture::FORMAT_RGBA, HALVES},
    {CPU::PIXEL_FORMAT_LUMINANCE16F, GPU::PIXEL_FORMAT_LUMINANCE16F, Texture::FORMAT_LUMINANCE, HALVES},
    {CPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F, GPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F,
     Texture::FORMAT_LUMINANCE_ALPHA, HALVES},
};

/// The mapping of a format, unless the caller refuses it.
Mapping const& mappingOf(CPU::tePixelFormat format, bool bRefused) {
    ORVO_CHECK(format != CPU::PIXEL_FORMAT_UNDEFINED, "!\"PIXEL_FORMAT_UNDEFINED\"");
    auto const* const pMapping =
        std::find_if(std::begin(aMappings), std::end(aMappings),
                     [format](Mapping const& mapping) { return mapping.eFrom_ == format; });
    ORVO_CHECK(pMapping != std::end(aMappings) && !bRefused,
               "Not implemented: pixelFormat in CPU2GPU::internaProcess()");
    return *pMapping;
}

} // namespace

void MapImageCPUToGPU(ImageCPU::tePixelFormat formatCPU, ImageGPU::tePixelFormat& formatGPU,
                      OGL::Texture::Format& format, OGL::Texture::Type& type) {
    bool const bRefused = formatCPU == CPU::PIXEL_FORMAT_RGB16 ||
                          formatCPU == CPU::PIXEL_FORMAT_LUMINANCE16 ||
                          formatCPU == CPU::PIXEL_FORMAT_LUMINANCE_ALPHA16;
    Mapping const& mapping = mappingOf(formatCPU, bRefused);
    formatGPU = mapping.eTo_;
    format = mapping.eFormat_;
    type = mapping.eType_;
}

void MapImageCPUToGPU(ImageCPU::tePixelFormat formatCPU, ImageGPU::tePixelFormat& formatGPU, unsigned& format,
                      unsigned& type) {
    bool const bRefused = formatCPU >= CPU::PIXEL_FORMAT_RGB16F;
    Mapping const& mapping = mappingOf(formatCPU, bRefused);
    formatGPU = mapping.eTo_;
    format = Texture::Format2GL(mapping.eFormat_);
    type = Texture::Type2GL(mapping.eType_);
}

} // namespace ORVO
