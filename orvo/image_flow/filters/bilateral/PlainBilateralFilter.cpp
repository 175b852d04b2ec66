#include "orvo/image_flow/filters/bilateral/PlainBilateralFilter.h"

#include "orvo/core/math/Float.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SaturatingCast.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/image_flow/filters/bilateral/GridShape.h"
#include "orvo/image_flow/filters/bilateral/HaltBilateralException.h"
#include "orvo/image_flow/filters/lab/LabTransform.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageReadAccessor.h"
#include "orvo/image_runtime/images/ImageWriteAccessor.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <type_traits>

namespace ORVO::ImageFlow::bilateral {

namespace {

float4 const kLuminanceWeights(0.39F, 0.5F, 0.11F, 0.0F);

std::shared_ptr<ImageCPU> makeImage(ImageCPU::tePixelFormat format,
                                    PositionExtentInPixelSpace const& rectangle) {
    return {ORVO_NEW ImageCPU(format, rectangle, PixelExtentInWorldSpace(1.0F, 1.0F), ExtentInPixelSpace()),
            ORVODeleter<ImageCPU>()};
}

std::size_t widthOf(ImageCPU const& image) { return static_cast<std::size_t>(image.extent().width()); }
std::size_t heightOf(ImageCPU const& image) { return static_cast<std::size_t>(image.extent().height()); }

template <class Pixel>
Pixel* pixelsOf(ImageCPU& image) {
    if constexpr (std::is_same_v<Pixel, PixelRGBA32F>) {
        return image.pixels_RGBA32F();
    } else {
        return image.pixels_LuminanceAlpha32F();
    }
}

template <class Pixel>
Pixel const* pixelsOf(ImageCPU const& image) {
    if constexpr (std::is_same_v<Pixel, PixelRGBA32F>) {
        return image.pixels_RGBA32F();
    } else {
        return image.pixels_LuminanceAlpha32F();
    }
}

template <class Pixel>
Pixel interpolate(Pixel const& first, Pixel const& second, float fraction) {
    return first * (1.0F - fraction) + second * fraction;
}

bool isInside(int x, int y, PositionExtentInPixelSpace const& rectangle) {
    long long const column = static_cast<long long>(x) - rectangle.position().x();
    long long const row = static_cast<long long>(y) - rectangle.position().y();
    return column >= 0 && column < rectangle.extent().width() && row >= 0 &&
           row < rectangle.extent().height();
}

float4 premultipliedPixelAt(ImageReadAccessor const& source, int x, int y) {
    float4 pixel(0.0F, 0.0F, 0.0F, 0.0F);
    if (isInside(x, y, source.positionExtent())) {
        pixel = source.getRGBAFloat4PixelAt(x, y);
    }
    return {pixel.x * pixel.w, pixel.y * pixel.w, pixel.z * pixel.w, pixel.w};
}

} // namespace

PlainBilateralFilter::PlainBilateralFilter(bool (*pfnCallback)(void*), void* pCallbackData)
    : fPaddingXY_(4.0F),
      fPaddingZ_(4.0F),
      fGridOffset_(0.0F),
      nGridHeight_(0),
      nGridWidth_(0),
      nGridDepth_(0),
      pfnCallback_(pfnCallback),
      pCallbackData_(pCallbackData),
      fRangeSigma_(0.0F),
      fSigmaX_(0.0F),
      fSigmaY_(0.0F),
      bColorize_(false),
      fValueMin_(0.0F),
      fValueExtent_(1.0F) {}

bool PlainBilateralFilter::applyFilter(ImageReadAccessor const& source, ImageWriteAccessor& destination,
                                       float rangeSigma, float sigmaX, float sigmaY, bool colorize) {
    fRangeSigma_ = rangeSigma;
    fSigmaX_ = sigmaX;
    fSigmaY_ = sigmaY;
    bColorize_ = colorize;
    ExtentInPixelSpace const extent = destination.extent();
    if (extent.width() <= 0 || extent.height() <= 0) {
        return true;
    }
    nGridHeight_ = cellsAlong(extent.height(), fSigmaY_, fPaddingXY_, fGridOffset_);
    nGridWidth_ = cellsAlong(extent.width(), fSigmaX_, fPaddingXY_, fGridOffset_);
    try {
        runPhases(source, destination);
    } catch (HaltBilateralException const&) {
        return false;
    }
    return true;
}

void PlainBilateralFilter::runPhases(ImageReadAccessor const& source, ImageWriteAccessor& destination) {
    ImageCPU::tePixelFormat const format =
        bColorize_ ? ImageCPU::PIXEL_FORMAT_RGBA32F : ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F;
    ImagePointer spWorking = makeImage(format, destination.positionExtent());
    if (bColorize_) {
        convertToLAB(source, *spWorking);
    } else {
        convertToLuminance(source, *spWorking);
    }
    nGridDepth_ = cellsInDepth(fRangeSigma_, fValueExtent_, fPaddingXY_, fGridOffset_);
    // Equal values outside 0..1 leave an intensity axis of length 0, on which there is nothing to smooth.
    bool const valuesDiffer = fValueExtent_ > 0.0F;
    if (valuesDiffer && gridServes()) {
        if (bColorize_) {
            ImagePointer const spGrid = blurGrid<PixelRGBA32F>(constructDownsampled3DGridLAB(*spWorking));
            sliceGridAndLABImage(*spGrid, *spWorking);
        } else {
            ImagePointer const spScratch = makeImage(format, destination.positionExtent());
            convertToLuminance(source, *spScratch);
            ImagePointer const spGrid =
                blurGrid<PixelLuminanceAlpha32F>(constructDownsampled3DGrid(*spWorking));
            sliceGridAndLumaImage(*spGrid, *spWorking);
        }
    } else if (valuesDiffer) {
        spWorking =
            bColorize_ ? applyBruteForceFilterLAB(*spWorking) : applyBruteForceFilterLuminance(*spWorking);
    }
    if (bColorize_) {
        convertToRGB(*spWorking, destination);
    } else {
        writeLuminanceImage(*spWorking, destination);
    }
}

bool PlainBilateralFilter::gridServes() const {
    return gridServesFor(nGridWidth_, nGridHeight_, nGridDepth_, fRangeSigma_, fSigmaX_, fSigmaY_);
}

void PlainBilateralFilter::askCallback() const {
    if (pfnCallback_ != nullptr && !pfnCallback_(pCallbackData_)) {
        throw HaltBilateralException();
    }
}

void PlainBilateralFilter::finishValueRange(float lowest, float highest) {
    ValueRange const range = valueRange(lowest, highest);
    fValueMin_ = range.fMin;
    fValueExtent_ = range.fExtent;
}

void PlainBilateralFilter::convertToLuminance(ImageReadAccessor const& source, ImageCPU& working) {
    float lowest = std::numeric_limits<float>::max();
    float highest = -std::numeric_limits<float>::max();
    PixelLuminanceAlpha32F* pPixel = working.pixels_LuminanceAlpha32F();
    for (int row = 0; row < working.extent().height(); ++row) {
        for (int column = 0; column < working.extent().width(); ++column, ++pPixel) {
            float4 const pixel =
                premultipliedPixelAt(source, working.position().x() + column, working.position().y() + row);
            float const luminance = dot(pixel, kLuminanceWeights);
            lowest = luminance < lowest ? luminance : lowest;
            highest = luminance > highest ? luminance : highest;
            *pPixel = {luminance, pixel.w};
        }
        askCallback();
    }
    finishValueRange(lowest, highest);
}

void PlainBilateralFilter::convertToLAB(ImageReadAccessor const& source, ImageCPU& working) {
    float lowest = std::numeric_limits<float>::max();
    float highest = -std::numeric_limits<float>::max();
    PixelRGBA32F* pPixel = working.pixels_RGBA32F();
    for (int row = 0; row < working.extent().height(); ++row) {
        for (int column = 0; column < working.extent().width(); ++column, ++pPixel) {
            float4 const pixel = lab::sRGBToLab(
                premultipliedPixelAt(source, working.position().x() + column, working.position().y() + row));
            lowest = pixel.x < lowest ? pixel.x : lowest;
            highest = pixel.x > highest ? pixel.x : highest;
            *pPixel = {pixel.x, pixel.y, pixel.z, pixel.w};
        }
        askCallback();
    }
    finishValueRange(lowest, highest);
}

std::size_t PlainBilateralFilter::cellIndex(std::size_t x, std::size_t y, std::size_t z) const {
    return (y * nGridDepth_ + z) * nGridWidth_ + x;
}

float PlainBilateralFilter::rangeStep() const { return fRangeSigma_ / fValueExtent_; }

std::size_t PlainBilateralFilter::cellX(std::size_t px) const {
    return cellAlong(px, fSigmaX_, fPaddingXY_, fGridOffset_, nGridWidth_);
}

std::size_t PlainBilateralFilter::cellY(std::size_t py) const {
    return cellAlong(py, fSigmaY_, fPaddingXY_, fGridOffset_, nGridHeight_);
}

std::size_t PlainBilateralFilter::cellZ(float value) const {
    float const cell =
        std::floor((value - fValueMin_) / fValueExtent_ / rangeStep() + 0.5F) + fGridOffset_ + fPaddingZ_;
    return clampedCell(cell, nGridDepth_);
}

PlainBilateralFilter::ImagePointer PlainBilateralFilter::makeGrid(ImageCPU const& working) const {
    ImagePointer spGrid =
        makeImage(working.pixelFormat(),
                  PositionExtentInPixelSpace(ExtentInPixelSpace(
                      saturatingCast<int>(nGridWidth_ * nGridDepth_), saturatingCast<int>(nGridHeight_))));
    spGrid->initializeToTransparentBlack();
    return spGrid;
}

PlainBilateralFilter::ImagePointer
PlainBilateralFilter::constructDownsampled3DGrid(ImageCPU const& working) const {
    ImagePointer spGrid = makeGrid(working);
    PixelLuminanceAlpha32F* const pGrid = spGrid->pixels_LuminanceAlpha32F();
    PixelLuminanceAlpha32F const* pPixel = working.pixels_LuminanceAlpha32F();
    for (std::size_t py = 0; py < heightOf(working); ++py) {
        for (std::size_t px = 0; px < widthOf(working); ++px, ++pPixel) {
            std::size_t const index = cellIndex(cellX(px), cellY(py), cellZ(pPixel->l));
            setResultInGrid(pGrid, index,
                            sample3DGrid(pGrid, index) + PixelLuminanceAlpha32F{pPixel->l, 1.0F});
        }
        askCallback();
    }
    return spGrid;
}

PlainBilateralFilter::ImagePointer
PlainBilateralFilter::constructDownsampled3DGridLAB(ImageCPU const& working) const {
    ImagePointer spGrid = makeGrid(working);
    PixelRGBA32F* const pGrid = spGrid->pixels_RGBA32F();
    PixelRGBA32F const* pPixel = working.pixels_RGBA32F();
    for (std::size_t py = 0; py < heightOf(working); ++py) {
        for (std::size_t px = 0; px < widthOf(working); ++px, ++pPixel) {
            std::size_t const index = cellIndex(cellX(px), cellY(py), cellZ(pPixel->r));
            setResultInGrid(pGrid, index,
                            sample3DGrid(pGrid, index) + PixelRGBA32F{pPixel->r, pPixel->g, pPixel->b, 1.0F});
        }
        askCallback();
    }
    return spGrid;
}

// The padding of the grid gives every axis at least 8 cells, so the three head positions, the interior and
// the three tail positions do not overlap.
template <class Pixel>
void PlainBilateralFilter::blurLine(ImageCPU const& source, ImageCPU& destination, std::size_t first,
                                    std::size_t step, std::size_t count) const {
    Pixel const* const pSource = pixelsOf<Pixel>(source);
    Pixel* const pDestination = pixelsOf<Pixel>(destination);
    auto const tap = [&](std::size_t position, std::size_t weight) {
        return sample3DGrid(pSource, first + position * step) * kBlurWeights[weight];
    };
    auto const sumOfTaps = [&](std::size_t position, std::size_t before, std::size_t after) {
        Pixel sum = tap(position - before, before);
        for (std::size_t i = position - before + 1; i <= position + after; ++i) {
            sum += tap(i, i < position ? position - i : i - position);
        }
        return sum;
    };
    for (std::size_t i = 0; i < 3; ++i) {
        setResultInGrid(pDestination, first + i * step, sumOfTaps(i, i, 3));
    }
    for (std::size_t i = 3; i + 3 < count; ++i) {
        setResultInGrid(pDestination, first + i * step, sumOfTaps(i, 3, 3));
    }
    for (std::size_t i = count - 3; i < count; ++i) {
        setResultInGrid(pDestination, first + i * step, sumOfTaps(i, 3, count - 1 - i));
    }
}

template <class Pixel>
PlainBilateralFilter::ImagePointer PlainBilateralFilter::blurGrid(ImagePointer const& spGrid) const {
    ImagePointer spScratch = makeGrid(*spGrid);
    for (std::size_t y = 0; y < nGridHeight_; ++y) {
        for (std::size_t z = 0; z < nGridDepth_; ++z) {
            blurLine<Pixel>(*spGrid, *spScratch, cellIndex(0, y, z), 1, nGridWidth_);
        }
        askCallback();
    }
    spGrid->initializeToTransparentBlack();
    for (std::size_t x = 0; x < nGridWidth_; ++x) {
        for (std::size_t z = 0; z < nGridDepth_; ++z) {
            blurLine<Pixel>(*spScratch, *spGrid, cellIndex(x, 0, z), nGridDepth_ * nGridWidth_, nGridHeight_);
        }
        askCallback();
    }
    for (std::size_t x = 0; x < nGridWidth_; ++x) {
        for (std::size_t y = 0; y < nGridHeight_; ++y) {
            blurLine<Pixel>(*spGrid, *spScratch, cellIndex(x, y, 0), nGridWidth_, nGridDepth_);
        }
        askCallback();
    }
    return spScratch;
}

template <class Pixel>
Pixel PlainBilateralFilter::sampleCube(ImageCPU const& grid, std::size_t px, std::size_t py,
                                       float value) const {
    float const fx = static_cast<float>(px) / fSigmaX_ + fGridOffset_ + fPaddingXY_;
    float const fy = static_cast<float>(py) / fSigmaY_ + fGridOffset_ + fPaddingXY_;
    float const fz = (value - fValueMin_) / fValueExtent_ / rangeStep() + fGridOffset_ + fPaddingZ_;
    std::array<std::size_t, 2> const x = {clampedCell(std::floor(fx), nGridWidth_),
                                          clampedCell(std::floor(fx) + 1.0F, nGridWidth_)};
    std::array<std::size_t, 2> const y = {clampedCell(std::floor(fy), nGridHeight_),
                                          clampedCell(std::floor(fy) + 1.0F, nGridHeight_)};
    std::array<std::size_t, 2> const z = {clampedCell(std::floor(fz), nGridDepth_),
                                          clampedCell(std::floor(fz) + 1.0F, nGridDepth_)};
    Pixel const* const pGrid = pixelsOf<Pixel>(grid);
    std::array<Pixel, 2> planes;
    for (std::size_t k = 0; k < 2; ++k) {
        std::array<Pixel, 2> lines;
        for (std::size_t j = 0; j < 2; ++j) {
            lines[j] =
                interpolate(sample3DGridAndDivide(pGrid, cellIndex(x[0], y[j], z[k])),
                            sample3DGridAndDivide(pGrid, cellIndex(x[1], y[j], z[k])), fx - std::floor(fx));
        }
        planes[k] = interpolate(lines[0], lines[1], fy - std::floor(fy));
    }
    return interpolate(planes[0], planes[1], fz - std::floor(fz));
}

void PlainBilateralFilter::sliceGridAndLumaImage(ImageCPU const& grid, ImageCPU& working) const {
    PixelLuminanceAlpha32F* pPixel = working.pixels_LuminanceAlpha32F();
    for (std::size_t py = 0; py < heightOf(working); ++py) {
        for (std::size_t px = 0; px < widthOf(working); ++px, ++pPixel) {
            pPixel->l = sampleCube<PixelLuminanceAlpha32F>(grid, px, py, pPixel->l).l;
        }
    }
}

void PlainBilateralFilter::sliceGridAndLABImage(ImageCPU const& grid, ImageCPU& working) const {
    PixelRGBA32F* pPixel = working.pixels_RGBA32F();
    for (std::size_t py = 0; py < heightOf(working); ++py) {
        for (std::size_t px = 0; px < widthOf(working); ++px, ++pPixel) {
            PixelRGBA32F const result = sampleCube<PixelRGBA32F>(grid, px, py, pPixel->r);
            *pPixel = {result.r, result.g, result.b, pPixel->a};
        }
    }
}

void PlainBilateralFilter::writeLuminanceImage(ImageCPU const& working,
                                               ImageWriteAccessor& destination) const {
    PixelLuminanceAlpha32F const* pPixel = working.pixels_LuminanceAlpha32F();
    for (int row = 0; row < working.extent().height(); ++row) {
        for (int column = 0; column < working.extent().width(); ++column, ++pPixel) {
            float const grey = pPixel->a != 0.0F ? pPixel->l / pPixel->a : pPixel->l;
            destination.writeRGBAFloatPixel4At(float4(grey, grey, grey, pPixel->a),
                                               working.position().x() + column, working.position().y() + row);
        }
    }
}

void PlainBilateralFilter::convertToRGB(ImageCPU const& working, ImageWriteAccessor& destination) const {
    PixelRGBA32F const* pPixel = working.pixels_RGBA32F();
    for (int row = 0; row < working.extent().height(); ++row) {
        for (int column = 0; column < working.extent().width(); ++column, ++pPixel) {
            float4 pixel = lab::LabTosRGB(float4(pPixel->r, pPixel->g, pPixel->b, pPixel->a));
            if (pixel.w != 0.0F) {
                pixel = float4(pixel.x / pixel.w, pixel.y / pixel.w, pixel.z / pixel.w, pixel.w);
            }
            destination.writeRGBAFloatPixel4At(pixel, working.position().x() + column,
                                               working.position().y() + row);
        }
    }
}

// A tap is skipped by its place in memory alone: past the left or right edge it is in the neighbouring row.
template <class Pixel, class Average>
PlainBilateralFilter::ImagePointer PlainBilateralFilter::filterDirectly(ImageCPU const& working,
                                                                        Average const& average) const {
    ImagePointer spResult = makeImage(working.pixelFormat(), working.positionExtent());
    Pixel const* const pInput = pixelsOf<Pixel>(working);
    Pixel* const pOutput = pixelsOf<Pixel>(*spResult);
    long long const width = working.capacityExtent().width();
    long long const count = width * working.extent().height();
    if (directFilterIsIdentity(fRangeSigma_, fSigmaX_, fSigmaY_)) {
        std::copy(pInput, pInput + count, pOutput);
        return spResult;
    }
    long long const radiusX = radiusOf(fSigmaX_);
    long long const radiusY = radiusOf(fSigmaY_);
    for (long long i = 0; i < count; ++i) {
        auto const visitTaps = [&](auto const& visit) {
            for (long long dy = -radiusY; dy <= radiusY; ++dy) {
                for (long long dx = -radiusX; dx <= radiusX; ++dx) {
                    long long const tap = i + dy * width + dx;
                    if (tap >= 0 && tap < count) {
                        visit(pInput[tap], static_cast<float>(dx * dx + dy * dy));
                    }
                }
            }
        };
        pOutput[i] = average(pInput[i], visitTaps);
        if ((i + 1) % width == 0) {
            askCallback();
        }
    }
    return spResult;
}

PlainBilateralFilter::ImagePointer
PlainBilateralFilter::applyBruteForceFilterLuminance(ImageCPU const& working) const {
    float const spatialFactor =
        fSigmaX_ > 0.0F && fSigmaY_ > 0.0F ? 1.0F / (2.0F * fSigmaX_ * fSigmaY_) : 1.0F;
    float const rangeFactor = fRangeSigma_ > 0.0F ? 1.0F / (2.0F * fRangeSigma_ * fRangeSigma_) : 1.0F;
    auto const average = [=](PixelLuminanceAlpha32F const& centre, auto const& visitTaps) {
        float const c = centre.l;
        float sum = 0.0F;
        float weight = 0.0F;
        visitTaps([&](PixelLuminanceAlpha32F const& tap, float squaredDistance) {
            float const v = tap.l;
            float const ws = std::exp(-squaredDistance * spatialFactor);
            float const wr = std::exp(-(c - v) * (c - v) * rangeFactor);
            sum += wr * v * ws;
            weight += wr * ws;
        });
        return PixelLuminanceAlpha32F{weight != 0.0F ? sum / weight : 0.0F, centre.a};
    };
    return filterDirectly<PixelLuminanceAlpha32F>(working, average);
}

PlainBilateralFilter::ImagePointer
PlainBilateralFilter::applyBruteForceFilterLAB(ImageCPU const& working) const {
    float const spatialFactor =
        fSigmaX_ > 0.0F && fSigmaY_ > 0.0F ? -1.0F / (fSigmaX_ * 2.0F * fSigmaY_) : -1.0F;
    float const rangeFactor = fRangeSigma_ > 0.0F ? -1.0F / (fRangeSigma_ * 2.0F * fRangeSigma_) : -1.0F;
    auto const average = [=](PixelRGBA32F const& centre, auto const& visitTaps) {
        PixelRGBA32F sum = {0.0F, 0.0F, 0.0F, 0.0F};
        visitTaps([&](PixelRGBA32F const& v, float squaredDistance) {
            float const difference = centre.r - v.r;
            float const w =
                std::exp(difference * difference * rangeFactor) * std::exp(squaredDistance * spatialFactor);
            sum += PixelRGBA32F{v.r * w, v.g * w, v.b * w, w};
        });
        float const scale = sum.a != 0.0F ? 1.0F / sum.a : 0.0F;
        return PixelRGBA32F{sum.r * scale, sum.g * scale, sum.b * scale, centre.a};
    };
    return filterDirectly<PixelRGBA32F>(working, average);
}

PixelLuminanceAlpha32F PlainBilateralFilter::sample3DGrid(PixelLuminanceAlpha32F const* pGrid,
                                                          std::size_t index) const {
    return pGrid[index];
}

PixelRGBA32F PlainBilateralFilter::sample3DGrid(PixelRGBA32F const* pGrid, std::size_t index) const {
    return pGrid[index];
}

PixelLuminanceAlpha32F PlainBilateralFilter::sample3DGridAndDivide(PixelLuminanceAlpha32F const* pGrid,
                                                                   std::size_t index) const {
    PixelLuminanceAlpha32F const cell = pGrid[index];
    return {cell.a != 0.0F ? cell.l / cell.a : 0.0F, cell.a};
}

PixelRGBA32F PlainBilateralFilter::sample3DGridAndDivide(PixelRGBA32F const* pGrid, std::size_t index) const {
    PixelRGBA32F const cell = pGrid[index];
    if (cell.a == 0.0F) {
        return {0.0F, 0.0F, 0.0F, 0.0F};
    }
    return {cell.r / cell.a, cell.g / cell.a, cell.b / cell.a, cell.a};
}

void PlainBilateralFilter::setResultInGrid(PixelLuminanceAlpha32F* pGrid, std::size_t index,
                                           PixelLuminanceAlpha32F const& result) const {
    pGrid[index] = result;
}

void PlainBilateralFilter::setResultInGrid(PixelRGBA32F* pGrid, std::size_t index,
                                           PixelRGBA32F const& result) const {
    pGrid[index] = result;
}

} // namespace ORVO::ImageFlow::bilateral
