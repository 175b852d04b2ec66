#include "orvo/image_flow/filters/bilateral/PlainBilateralFilter.h"

#include "orvo/core/math/Float.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SaturatingCast.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/image_flow/filters/bilateral/GridShape.h"
#include "orvo/image_flow/filters/bilateral/HaltBilateralException.h"
#include "orvo/image_flow/filters/bilateral/RowAccess.h"
#include "orvo/image_flow/filters/lab/LabTransform.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageReadAccessor.h"
#include "orvo/image_runtime/images/ImageWriteAccessor.h"
#include "orvo/image_runtime/kernels/Rows.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <type_traits>
#include <vector>

namespace ORVO::ImageFlow::bilateral {

namespace {

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

/// The largest whole number that is not above v. Written out, since std::floor is a call of a function where
/// there is no instruction for it.
inline float floorOf(float v) {
    if (!(std::fabs(v) < 8388608.0F)) {
        return v;
    }
    float const truncated = static_cast<float>(static_cast<int>(v));
    return truncated > v ? truncated - 1.0F : truncated;
}

/// clampedCell(), where the compiler sees it.
inline std::size_t cellOf(float cell, std::size_t count) {
    if (!(cell > 0.0F)) {
        return 0;
    }
    return cell < static_cast<float>(count - 1) ? static_cast<std::size_t>(cell) : count - 1;
}

inline float intensityOf(PixelLuminanceAlpha32F const& pixel) { return pixel.l; }
inline float intensityOf(PixelRGBA32F const& pixel) { return pixel.r; }

inline PixelLuminanceAlpha32F sample3DGrid(PixelLuminanceAlpha32F const* pGrid, std::size_t index) {
    return pGrid[index];
}

inline PixelRGBA32F sample3DGrid(PixelRGBA32F const* pGrid, std::size_t index) { return pGrid[index]; }

inline PixelLuminanceAlpha32F sample3DGridAndDivide(PixelLuminanceAlpha32F const* pGrid, std::size_t index) {
    PixelLuminanceAlpha32F const cell = pGrid[index];
    return {cell.a != 0.0F ? cell.l / cell.a : 0.0F, cell.a};
}

inline PixelRGBA32F sample3DGridAndDivide(PixelRGBA32F const* pGrid, std::size_t index) {
    PixelRGBA32F const cell = pGrid[index];
    if (cell.a == 0.0F) {
        return {0.0F, 0.0F, 0.0F, 0.0F};
    }
    return {cell.r / cell.a, cell.g / cell.a, cell.b / cell.a, cell.a};
}

inline void setResultInGrid(PixelLuminanceAlpha32F* pGrid, std::size_t index,
                            PixelLuminanceAlpha32F const& result) {
    pGrid[index] = result;
}

inline void setResultInGrid(PixelRGBA32F* pGrid, std::size_t index, PixelRGBA32F const& result) {
    pGrid[index] = result;
}

/// The blur at a position of a line whose cells are `step` apart, of the taps `before` it to `after` it.
template <class Pixel>
inline Pixel sumOfTaps(Pixel const* pSource, std::size_t index, std::size_t step, std::size_t before,
                       std::size_t after) {
    Pixel sum = sample3DGrid(pSource, index - before * step) * kBlurWeights[before];
    for (std::size_t distance = before; distance-- > 0;) {
        sum += sample3DGrid(pSource, index - distance * step) * kBlurWeights[distance];
    }
    for (std::size_t distance = 1; distance <= after; ++distance) {
        sum += sample3DGrid(pSource, index + distance * step) * kBlurWeights[distance];
    }
    return sum;
}

// The padding of the grid gives every axis at least 8 cells, so the three head positions, the interior and
// the three tail positions do not overlap.
template <class Pixel>
inline void blurLine(Pixel const* pSource, Pixel* pDestination, std::size_t first, std::size_t step,
                     std::size_t count) {
    auto const blurAt = [=](std::size_t position, std::size_t before, std::size_t after) {
        std::size_t const index = first + position * step;
        setResultInGrid(pDestination, index, sumOfTaps(pSource, index, step, before, after));
    };
    blurAt(0, 0, 3);
    blurAt(1, 1, 3);
    blurAt(2, 2, 3);
    for (std::size_t i = 3; i + 3 < count; ++i) {
        blurAt(i, 3, 3);
    }
    blurAt(count - 3, 3, 2);
    blurAt(count - 2, 3, 1);
    blurAt(count - 1, 3, 0);
}

/// Writes all pixels, made by `convert` from those of the working image.
template <class Pixel, class Convert>
void writeRows(ImageCPU const& working, ImageWriteAccessor& destination, Convert const& convert) {
    int const beginX = working.position().x();
    std::vector<float> aRow(4 * widthOf(working));
    Pixel const* pPixel = pixelsOf<Pixel>(working);
    for (int row = 0; row < working.extent().height(); ++row) {
        for (std::size_t i = 0; i < aRow.size(); i += 4, ++pPixel) {
            float4 const pixel = convert(*pPixel);
            aRow[i] = pixel.x;
            aRow[i + 1] = pixel.y;
            aRow[i + 2] = pixel.z;
            aRow[i + 3] = pixel.w;
        }
        ImageRuntime::writeRowFromRGBAFloat(destination, working.position().y() + row, beginX,
                                            beginX + working.extent().width(), aRow.data());
    }
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
    RowSource const rows(source, destination.positionExtent());
    try {
        runPhases(rows, destination);
    } catch (HaltBilateralException const&) {
        return false;
    }
    return true;
}

void PlainBilateralFilter::runPhases(RowSource const& source, ImageWriteAccessor& destination) {
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
            // The rows are counted as converted a second time, which would give the same.
            askCallback(heightOf(*spWorking));
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

void PlainBilateralFilter::askCallback(std::size_t nTimes) const {
    for (std::size_t i = 0; pfnCallback_ != nullptr && i < nTimes; ++i) {
        if (!pfnCallback_(pCallbackData_)) {
            throw HaltBilateralException();
        }
    }
}

template <class Pixel, class Convert>
void PlainBilateralFilter::convertRows(RowSource const& source, ImageCPU& working, Convert const& convert) {
    float lowest = std::numeric_limits<float>::max();
    float highest = -std::numeric_limits<float>::max();
    std::size_t const nWidth = widthOf(working);
    std::vector<float> aBuffer(4 * nWidth);
    Pixel* pPixel = pixelsOf<Pixel>(working);
    for (std::size_t row = 0; row < heightOf(working); ++row) {
        float const* pRGBA = source.row(row, aBuffer.data());
        for (Pixel const* const pEnd = pPixel + nWidth; pPixel != pEnd; ++pPixel, pRGBA += 4) {
            float const alpha = pRGBA[3];
            *pPixel = convert(float4(pRGBA[0] * alpha, pRGBA[1] * alpha, pRGBA[2] * alpha, alpha));
            float const intensity = intensityOf(*pPixel);
            lowest = intensity < lowest ? intensity : lowest;
            highest = intensity > highest ? intensity : highest;
        }
        askCallback();
    }
    ValueRange const range = valueRange(lowest, highest);
    fValueMin_ = range.fMin;
    fValueExtent_ = range.fExtent;
}

void PlainBilateralFilter::convertToLuminance(RowSource const& source, ImageCPU& working) {
    convertRows<PixelLuminanceAlpha32F>(source, working, [](float4 const& pixel) {
        return PixelLuminanceAlpha32F{dot(pixel, float4(0.39F, 0.5F, 0.11F, 0.0F)), pixel.w};
    });
}

void PlainBilateralFilter::convertToLAB(RowSource const& source, ImageCPU& working) {
    convertRows<PixelRGBA32F>(source, working, [](float4 const& pixel) {
        float4 const lab = lab::sRGBToLab(pixel);
        return PixelRGBA32F{lab.x, lab.y, lab.z, lab.w};
    });
}

PlainBilateralFilter::ImagePointer PlainBilateralFilter::makeGrid(ImageCPU const& working) const {
    ImagePointer spGrid =
        makeImage(working.pixelFormat(),
                  PositionExtentInPixelSpace(ExtentInPixelSpace(
                      saturatingCast<int>(nGridWidth_ * nGridDepth_), saturatingCast<int>(nGridHeight_))));
    spGrid->initializeToTransparentBlack();
    return spGrid;
}

template <class Pixel, class Summand>
PlainBilateralFilter::ImagePointer PlainBilateralFilter::constructGrid(ImageCPU const& working,
                                                                       Summand const& summandOf) const {
    ImagePointer spGrid = makeGrid(working);
    Pixel* const pGrid = pixelsOf<Pixel>(*spGrid);
    Pixel const* pPixel = pixelsOf<Pixel>(working);
    std::vector<std::size_t> aCellX(widthOf(working));
    for (std::size_t px = 0; px < aCellX.size(); ++px) {
        aCellX[px] = cellAlong(px, fSigmaX_, fPaddingXY_, fGridOffset_, nGridWidth_);
    }
    // Kept at hand: the compiler must assume that pixels are stored over the fields.
    float const valueMin = fValueMin_;
    float const valueExtent = fValueExtent_;
    float const rangeStep = fRangeSigma_ / fValueExtent_;
    float const gridOffset = fGridOffset_;
    float const paddingZ = fPaddingZ_;
    std::size_t const nWidth = nGridWidth_;
    std::size_t const nDepth = nGridDepth_;
    for (std::size_t py = 0; py < heightOf(working); ++py) {
        Pixel* const pLayer =
            pGrid + cellIndex(0, cellAlong(py, fSigmaY_, fPaddingXY_, fGridOffset_, nGridHeight_), 0);
        for (std::size_t const cellX : aCellX) {
            float const value = intensityOf(*pPixel);
            float const level = floorOf((value - valueMin) / valueExtent / rangeStep + 0.5F);
            std::size_t const index = cellOf(level + gridOffset + paddingZ, nDepth) * nWidth + cellX;
            setResultInGrid(pLayer, index, sample3DGrid(pLayer, index) + summandOf(*pPixel));
            ++pPixel;
        }
        askCallback();
    }
    return spGrid;
}

PlainBilateralFilter::ImagePointer
PlainBilateralFilter::constructDownsampled3DGrid(ImageCPU const& working) const {
    return constructGrid<PixelLuminanceAlpha32F>(working, [](PixelLuminanceAlpha32F const& pixel) {
        return PixelLuminanceAlpha32F{pixel.l, 1.0F};
    });
}

PlainBilateralFilter::ImagePointer
PlainBilateralFilter::constructDownsampled3DGridLAB(ImageCPU const& working) const {
    return constructGrid<PixelRGBA32F>(working, [](PixelRGBA32F const& pixel) {
        return PixelRGBA32F{pixel.r, pixel.g, pixel.b, 1.0F};
    });
}

template <class Pixel>
PlainBilateralFilter::ImagePointer PlainBilateralFilter::blurGrid(ImagePointer const& spGrid) const {
    ImagePointer spScratch = makeGrid(*spGrid);
    Pixel* const pGrid = pixelsOf<Pixel>(*spGrid);
    Pixel* const pScratch = pixelsOf<Pixel>(*spScratch);
    for (std::size_t y = 0; y < nGridHeight_; ++y) {
        for (std::size_t z = 0; z < nGridDepth_; ++z) {
            blurLine(pGrid, pScratch, cellIndex(0, y, z), 1, nGridWidth_);
        }
        askCallback();
    }
    spGrid->initializeToTransparentBlack();
    for (std::size_t x = 0; x < nGridWidth_; ++x) {
        for (std::size_t z = 0; z < nGridDepth_; ++z) {
            blurLine(pScratch, pGrid, cellIndex(x, 0, z), nGridDepth_ * nGridWidth_, nGridHeight_);
        }
        askCallback();
    }
    for (std::size_t x = 0; x < nGridWidth_; ++x) {
        for (std::size_t y = 0; y < nGridHeight_; ++y) {
            blurLine(pGrid, pScratch, cellIndex(x, y, 0), nGridWidth_, nGridDepth_);
        }
        askCallback();
    }
    return spScratch;
}

template <class Pixel, class Store>
void PlainBilateralFilter::sliceGrid(ImageCPU& grid, ImageCPU& working, Store const& store) const {
    Pixel* const pGrid = pixelsOf<Pixel>(grid);
    for (std::size_t i = 0; i < nGridWidth_ * nGridDepth_ * nGridHeight_; ++i) {
        setResultInGrid(pGrid, i, sample3DGridAndDivide(pGrid, i));
    }
    auto const placeOf = [](float place, std::size_t count) {
        float const whole = floorOf(place);
        return Place{cellOf(whole, count), cellOf(whole + 1.0F, count), place - whole};
    };
    auto const placeOfPixel = [this](std::size_t pixel, float sigma, std::size_t count) {
        GridPlace const place = placeAlong(pixel, sigma, fPaddingXY_, fGridOffset_);
        return Place{cellOf(place.fWhole, count), cellOf(place.fWhole + 1.0F, count), place.fFraction};
    };
    std::vector<Place> aColumns(widthOf(working));
    for (std::size_t px = 0; px < aColumns.size(); ++px) {
        aColumns[px] = placeOfPixel(px, fSigmaX_, nGridWidth_);
    }
    // Kept at hand: the compiler must assume that pixels are stored over the fields.
    float const valueMin = fValueMin_;
    float const valueExtent = fValueExtent_;
    float const rangeStep = fRangeSigma_ / fValueExtent_;
    float const gridOffset = fGridOffset_;
    float const paddingZ = fPaddingZ_;
    std::size_t const nWidth = nGridWidth_;
    std::size_t const nDepth = nGridDepth_;
    Pixel* pPixel = pixelsOf<Pixel>(working);
    for (std::size_t py = 0; py < heightOf(working); ++py) {
        Place const y = placeOfPixel(py, fSigmaY_, nGridHeight_);
        std::array<Pixel const*, 2> const apLayers = {pGrid + cellIndex(0, y.nFirst, 0),
                                                      pGrid + cellIndex(0, y.nSecond, 0)};
        for (Place const& x : aColumns) {
            float const level = (intensityOf(*pPixel) - valueMin) / valueExtent / rangeStep;
            Place const z = placeOf(level + gridOffset + paddingZ, nDepth);
            auto const alongX = [&](Pixel const* pLayer, std::size_t nLevel) {
                Pixel const* const pLine = pLayer + nLevel * nWidth;
                return interpolate(pLine[x.nFirst], pLine[x.nSecond], x.fFraction);
            };
            auto const alongXY = [&](std::size_t nLevel) {
                return interpolate(alongX(apLayers[0], nLevel), alongX(apLayers[1], nLevel), y.fFraction);
            };
            store(*pPixel, interpolate(alongXY(z.nFirst), alongXY(z.nSecond), z.fFraction));
            ++pPixel;
        }
    }
}

void PlainBilateralFilter::sliceGridAndLumaImage(ImageCPU& grid, ImageCPU& working) const {
    sliceGrid<PixelLuminanceAlpha32F>(
        grid, working,
        [](PixelLuminanceAlpha32F& pixel, PixelLuminanceAlpha32F const& result) { pixel.l = result.l; });
}

void PlainBilateralFilter::sliceGridAndLABImage(ImageCPU& grid, ImageCPU& working) const {
    sliceGrid<PixelRGBA32F>(grid, working, [](PixelRGBA32F& pixel, PixelRGBA32F const& result) {
        pixel = {result.r, result.g, result.b, pixel.a};
    });
}

void PlainBilateralFilter::writeLuminanceImage(ImageCPU const& working,
                                               ImageWriteAccessor& destination) const {
    writeRows<PixelLuminanceAlpha32F>(working, destination, [](PixelLuminanceAlpha32F const& pixel) {
        float const grey = pixel.a != 0.0F ? pixel.l / pixel.a : pixel.l;
        return float4(grey, grey, grey, pixel.a);
    });
}

void PlainBilateralFilter::convertToRGB(ImageCPU const& working, ImageWriteAccessor& destination) const {
    writeRows<PixelRGBA32F>(working, destination, [](PixelRGBA32F const& pixel) {
        float4 const rgb = lab::LabTosRGB(float4(pixel.r, pixel.g, pixel.b, pixel.a));
        if (rgb.w == 0.0F) {
            return rgb;
        }
        return float4(rgb.x / rgb.w, rgb.y / rgb.w, rgb.z / rgb.w, rgb.w);
    });
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

} // namespace ORVO::ImageFlow::bilateral
