#include "orvo/image_flow/filters/FastBilateralCPUFilter.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/filters/bilateral/BandRunner.h"
#include "orvo/image_flow/filters/bilateral/GridKernels.h"
#include "orvo/image_flow/filters/bilateral/GridShape.h"
#include "orvo/image_flow/filters/bilateral/HaltBilateralException.h"
#include "orvo/image_flow/filters/bilateral/PlainBilateralFilter.h"
#include "orvo/image_flow/filters/bilateral/RowAccess.h"
#include "orvo/image_flow/filters/bilateral/WorkingImage.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageReadAccessor.h"
#include "orvo/image_runtime/images/ImageWriteAccessor.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <cmath>
#include <limits>
#include <vector>

namespace ORVO {

using namespace ImageFlow::bilateral;

namespace {

/// Bands of about this many rows are faster than single rows.
constexpr std::size_t kRowsPerBand = 16;

/// Rows that nobody is asked after.
std::size_t asksNobody(std::size_t /*row*/) { return 0; }
std::size_t asksOnce(std::size_t /*row*/) { return 1; }

} // namespace

/// What one call works with.
struct FastBilateralCPUFilter::Call {
    RowSource const& source;
    RowTarget const& target;
    BandRunner& runner;
    GridKernels const& kernels;
    WorkingImage working;
    SerialBandRunner serialRunner = {};

    /// Rows whose alpha is 1 throughout: their alpha is not kept.
    std::vector<unsigned char> aOpaqueRows = {};

    GridLayout layout = {};
    std::vector<std::uint32_t> aColumns = {}; ///< the grid column that each pixel of a row falls into
    std::vector<float> aFractions = {};       ///< how far each pixel of a row is from the column left of it
    std::vector<std::int32_t> aLevels = {};   ///< where the column left of each pixel begins in a plane
    std::vector<std::uint32_t> aEnds = {};    ///< the first pixel behind those between the same columns
    std::vector<std::size_t> aFirstRows = {}; ///< the first image row of each row of the grid, and the end
    std::shared_ptr<ImageCPU> spGrid = {};
    float* pGrid = nullptr;
    std::shared_ptr<ImageCPU> spDivided = {};
    float* pDivided = nullptr;

    std::size_t gridPitch() const { return rowFloats(layout) + kSlack; }
    std::size_t dividedPitch() const { return layout.nChannels * planeFloats(layout) + kSlack; }
    /// The rows of the grid that hold pixels: the others are left as they are and count as 0.
    bool hasPixels(std::size_t gridRow) const { return aFirstRows[gridRow] < aFirstRows[gridRow + 1]; }
};

FastBilateralCPUFilter::FastBilateralCPUFilter()
    : fPaddingXY_(4.0F),
      fGridOffset_(0.0F),
      nGridHeight_(0),
      nGridWidth_(0),
      nGridDepth_(0),
      pfnCallback_(nullptr),
      pCallbackData_(nullptr),
      fRangeSigma_(0.0F),
      fSigmaX_(0.0F),
      fSigmaY_(0.0F),
      bColorize_(false),
      fValueMin_(0.0F),
      fValueExtent_(1.0F) {}

FastBilateralCPUFilter::~FastBilateralCPUFilter() = default;

void FastBilateralCPUFilter::registerProcessingCallback(bool (*callback)(void*), void* data) {
    pfnCallback_ = callback;
    pCallbackData_ = data;
}

void FastBilateralCPUFilter::resetProcessingCallback() { registerProcessingCallback(nullptr, nullptr); }

bool FastBilateralCPUFilter::applyFilter(ImageReadAccessor* source, ImageWriteAccessor* destination,
                                         float rangeSigma, float sigmaX, float sigmaY, bool colorize) {
    SerialBandRunner runner;
    return applyFilter(source, destination, rangeSigma, sigmaX, sigmaY, colorize, runner);
}

bool FastBilateralCPUFilter::applyFilter(ImageReadAccessor* source, ImageWriteAccessor* destination,
                                         float rangeSigma, float sigmaX, float sigmaY, bool colorize,
                                         BandRunner& runner) {
    ORVO_ENFORCE(source);
    ORVO_ENFORCE(destination);
    fRangeSigma_ = rangeSigma;
    fSigmaX_ = sigmaX;
    fSigmaY_ = sigmaY;
    bColorize_ = colorize;
    PositionExtentInPixelSpace const rectangle = destination->positionExtent();
    int const width = rectangle.extent().width();
    int const height = rectangle.extent().height();
    if (width <= 0 || height <= 0) {
        return true;
    }
    nGridHeight_ = cellsAlong(height, fSigmaY_, fPaddingXY_, fGridOffset_);
    nGridWidth_ = cellsAlong(width, fSigmaX_, fPaddingXY_, fGridOffset_);
    RowSource const rows(*source, rectangle);
    RowTarget const target(*destination);
    ImageRuntime::InstructionSet const eInstructionSet = ImageRuntime::activeInstructionSet();
    if (eInstructionSet == ImageRuntime::InstructionSet::PLAIN) {
        return PlainBilateralFilter(pfnCallback_, pCallbackData_)
            .applyFilter(*source, *destination, rangeSigma, sigmaX, sigmaY, colorize);
    }
    Call call{
        rows, target, runner, gridKernels(eInstructionSet),
        WorkingImage(static_cast<std::size_t>(width), static_cast<std::size_t>(height), colorize ? 3 : 1)};
    try {
        applyByRows(call);
    } catch (HaltBilateralException const&) {
        return false;
    }
    return true;
}

void FastBilateralCPUFilter::applyByRows(Call& call) {
    if (bColorize_) {
        convertToLAB(call);
    } else {
        convertToLuminance(call);
    }
    nGridDepth_ = cellsInDepth(fRangeSigma_, fValueExtent_, fPaddingXY_, fGridOffset_);
    // Equal values outside 0..1 leave an intensity axis of length 0, on which there is nothing to smooth.
    bool const valuesDiffer = fValueExtent_ > 0.0F;
    bool const usesGrid = valuesDiffer && gridServes();
    if (usesGrid) {
        if (!bColorize_) {
            // The rows are counted as converted a second time, which would give the same.
            askCallback(call.working.height());
        }
        layOutGrid(call);
        constructDownsampled3DGrid(call);
        blurGridAlongY(call);
    } else if (valuesDiffer && !directFilterIsIdentity(fRangeSigma_, fSigmaX_, fSigmaY_)) {
        applyBruteForceFilter(call);
    }
    writeImage(call, usesGrid);
}

bool FastBilateralCPUFilter::gridServes() const {
    return gridServesFor(nGridWidth_, nGridHeight_, nGridDepth_, fRangeSigma_, fSigmaX_, fSigmaY_);
}

void FastBilateralCPUFilter::askCallback(std::size_t nTimes) const {
    for (std::size_t i = 0; pfnCallback_ != nullptr && i < nTimes; ++i) {
        if (!pfnCallback_(pCallbackData_)) {
            throw HaltBilateralException();
        }
    }
}

template <class Body, class Asks>
void FastBilateralCPUFilter::runRows(BandRunner& runner, std::size_t nRows, std::size_t nRowsPerBand,
                                     std::size_t nPixelsPerRow, Body const& body, Asks const& asks) const {
    if (pfnCallback_ != nullptr) {
        for (std::size_t row = 0; row < nRows; ++row) {
            body(row, row + 1);
            askCallback(asks(row));
        }
        return;
    }
    std::size_t const nBands = (nRows + nRowsPerBand - 1) / nRowsPerBand;
    std::atomic<std::size_t> nBandsDone(0);
    runner.run(nBands, nRowsPerBand * nPixelsPerRow, [&](std::size_t first, std::size_t last) {
        body(first * nRowsPerBand, std::min(last * nRowsPerBand, nRows));
        nBandsDone.fetch_add(last - first, std::memory_order_relaxed);
    });
    if (nBandsDone.load(std::memory_order_relaxed) != nBands) {
        throw HaltBilateralException();
    }
}

template <class ConvertRow>
void FastBilateralCPUFilter::convertRows(Call& call, ConvertRow const& convertRow) {
    float const largest = std::numeric_limits<float>::max();
    std::vector<ValueBounds> aBounds(call.working.height(), ValueBounds{largest, -largest});
    BandRunner& runner = call.source.isConcurrent() ? call.runner : call.serialRunner;
    std::size_t const nWidth = call.working.width();
    call.aOpaqueRows.assign(call.working.height(), 0);
    auto const convert = [&](std::size_t first, std::size_t last) {
        std::vector<float> aBuffer(4 * nWidth);
        std::vector<float> aAlpha(nWidth);
        for (std::size_t row = first; row < last; ++row) {
            float const* const pRGBA = call.source.row(row, aBuffer.data());
            bool const isOpaque = convertRow(pRGBA, row, aAlpha.data(), aBounds[row]);
            call.aOpaqueRows[row] = isOpaque ? 1 : 0;
            if (!isOpaque) {
                std::copy(aAlpha.begin(), aAlpha.end(), call.working.row(call.working.channels(), row));
            }
        }
    };
    runRows(runner, call.working.height(), kRowsPerBand, call.working.width(), convert, asksOnce);
    ValueBounds bounds{largest, -largest};
    for (ValueBounds const& row : aBounds) {
        bounds.fLowest = std::min(bounds.fLowest, row.fLowest);
        bounds.fHighest = std::max(bounds.fHighest, row.fHighest);
    }
    ValueRange const range = valueRange(bounds.fLowest, bounds.fHighest);
    fValueMin_ = range.fMin;
    fValueExtent_ = range.fExtent;
}

void FastBilateralCPUFilter::convertToLuminance(Call& call) {
    convertRows(call, [&call](float const* pRGBA, std::size_t row, float* pAlpha, ValueBounds& bounds) {
        return call.kernels.luminanceFromRGBA(pRGBA, call.working.row(0, row), pAlpha, call.working.width(),
                                              &bounds);
    });
}

void FastBilateralCPUFilter::convertToLAB(Call& call) {
    convertRows(call, [&call](float const* pRGBA, std::size_t row, float* pAlpha, ValueBounds& bounds) {
        std::array<float*, 4> const apPlanes = {call.working.row(0, row), call.working.row(1, row),
                                                call.working.row(2, row), pAlpha};
        return call.kernels.labFromRGBA(pRGBA, apPlanes.data(), call.working.width(), &bounds);
    });
}

void FastBilateralCPUFilter::layOutGrid(Call& call) const {
    GridLayout& layout = call.layout;
    layout.fValueMin = fValueMin_;
    layout.fValueExtent = fValueExtent_;
    layout.fRangeStep = fRangeSigma_ / fValueExtent_;
    layout.nChannels = call.working.channels();
    layout.nWidth = nGridWidth_;
    layout.nDepth = nGridDepth_;
    layout.nUsed = nGridDepth_ - 6;
    layout.nLevels = (layout.nUsed + 7) / 8 * 8;

    std::size_t const nWidth = call.working.width();
    call.aColumns.resize(nWidth);
    call.aFractions.resize(nWidth);
    call.aLevels.resize(nWidth);
    for (std::size_t px = 0; px < nWidth; ++px) {
        call.aColumns[px] =
            static_cast<std::uint32_t>(cellAlong(px, fSigmaX_, fPaddingXY_, fGridOffset_, nGridWidth_));
        GridPlace const place = placeAlong(px, fSigmaX_, fPaddingXY_, fGridOffset_);
        call.aFractions[px] = place.fFraction;
        // The padding keeps the column right of it inside the grid.
        call.aLevels[px] =
            static_cast<std::int32_t>(clampedCell(place.fWhole, nGridWidth_ - 1) * layout.nLevels);
    }
    call.aEnds.assign(nWidth, static_cast<std::uint32_t>(nWidth));
    for (std::size_t px = nWidth - 1; px-- > 0;) {
        bool const isLast = call.aLevels[px] != call.aLevels[px + 1];
        call.aEnds[px] = isLast ? static_cast<std::uint32_t>(px + 1) : call.aEnds[px + 1];
    }
    call.aFirstRows.assign(nGridHeight_ + 1, call.working.height());
    for (std::size_t py = call.working.height(); py-- > 0;) {
        call.aFirstRows[cellAlong(py, fSigmaY_, fPaddingXY_, fGridOffset_, nGridHeight_)] = py;
    }
    for (std::size_t y = nGridHeight_; y-- > 0;) {
        call.aFirstRows[y] = std::min(call.aFirstRows[y], call.aFirstRows[y + 1]);
    }
    call.spGrid = makeFloats(call.gridPitch(), nGridHeight_, call.pGrid);
    call.spDivided = makeFloats(call.dividedPitch(), nGridHeight_, call.pDivided);
}

// Each row of the grid is one task: the image rows that fall into it are added by one thread, in order. It is
// blurred along the intensity axis and x while it is near; the blurs are linear and each goes along its own
// axis, so their order does not matter.
void FastBilateralCPUFilter::constructDownsampled3DGrid(Call& call) const {
    GridLayout const& layout = call.layout;
    auto const construct = [&](std::size_t first, std::size_t last) {
        std::vector<float> aCells(splatFloats(layout));
        std::vector<float> aLevels(levelFloats(layout), 0.0F);
        for (std::size_t y = first; y < last; ++y) {
            if (!call.hasPixels(y)) {
                continue;
            }
            std::fill(aCells.begin(), aCells.end(), 0.0F);
            SplatJob splat = {};
            splat.pLayout = &layout;
            for (std::size_t channel = 0; channel < layout.nChannels; ++channel) {
                splat.apPlanes[channel] = call.working.row(channel, 0);
            }
            splat.nPitch = call.working.width();
            splat.nFirstRow = call.aFirstRows[y];
            splat.nEndRow = call.aFirstRows[y + 1];
            splat.nColumns = call.working.width();
            splat.pColumns = call.aColumns.data();
            splat.pCells = aCells.data();
            call.kernels.splat(splat);
            call.kernels.blur({&layout, aCells.data(), aLevels.data(), call.pGrid + y * call.gridPitch()});
        }
    };
    std::size_t const nPixels =
        (call.working.height() + nGridHeight_ - 1) / nGridHeight_ * call.working.width();
    runRows(call.runner, nGridHeight_, 1, nPixels, construct,
            [&call](std::size_t y) { return call.aFirstRows[y + 1] - call.aFirstRows[y]; });
    // The blur along x went with it.
    askCallback(nGridHeight_);
}

void FastBilateralCPUFilter::blurGridAlongY(Call& call) const {
    auto const blur = [&](std::size_t first, std::size_t last) {
        for (std::size_t y = first; y < last; ++y) {
            DivideJob job = {};
            job.pLayout = &call.layout;
            for (std::size_t i = 0; i < 7; ++i) {
                std::size_t const row = y + i - 3;
                if (y + i >= 3 && row < nGridHeight_ && call.hasPixels(row)) {
                    job.apRows[i] = call.pGrid + row * call.gridPitch();
                }
            }
            job.pResult = call.pDivided + y * call.dividedPitch();
            call.kernels.divide(job);
        }
    };
    runRows(call.runner, nGridHeight_, 4, rowFloats(call.layout), blur, asksNobody);
    askCallback(2 * nGridWidth_);
}

void FastBilateralCPUFilter::sliceGridRow(Call const& call, std::size_t row, float* pBlended,
                                          float* const* apResults) const {
    GridPlace const place = placeAlong(row, fSigmaY_, fPaddingXY_, fGridOffset_);
    SliceJob job = {};
    job.pLayout = &call.layout;
    job.pUpper = call.pDivided + clampedCell(place.fWhole, nGridHeight_) * call.dividedPitch();
    job.pLower = call.pDivided + clampedCell(place.fWhole + 1.0F, nGridHeight_) * call.dividedPitch();
    job.fFraction = place.fFraction;
    job.pBlended = pBlended;
    job.nPixels = call.working.width();
    job.pLevels = call.aLevels.data();
    job.pEnds = call.aEnds.data();
    job.pFractions = call.aFractions.data();
    job.pIntensities = call.working.row(0, row);
    std::copy_n(apResults, call.layout.nChannels, job.apResults);
    call.kernels.slice(job);
}

void FastBilateralCPUFilter::applyBruteForceFilter(Call& call) const {
    WorkingImage& working = call.working;
    std::size_t const nChannels = working.channels();
    WorkingImage result(working.width(), working.height(), nChannels);
    DirectJob common = {};
    common.nChannels = nChannels;
    common.nPixels = working.width() * working.height();
    common.nWidth = working.width();
    common.nRadiusX = radiusOf(fSigmaX_);
    common.nRadiusY = radiusOf(fSigmaY_);
    // The filter runs with sigmas of which these factors are positive and finite, or 0.
    common.fRangeFactor = 1.0F / (2.0F * fRangeSigma_ * fRangeSigma_);
    float const spatialFactor = 1.0F / (2.0F * fSigmaX_ * fSigmaY_);
    std::vector<float> aWeights;
    for (int dy = 0; dy <= common.nRadiusY; ++dy) {
        for (int dx = 0; dx <= common.nRadiusX; ++dx) {
            aWeights.push_back(std::exp(-static_cast<float>(dx * dx + dy * dy) * spatialFactor));
        }
    }
    common.pSpatialWeights = aWeights.data();
    for (std::size_t channel = 0; channel < nChannels; ++channel) {
        common.apPlanes[channel] = working.row(channel, 0);
    }
    auto const filter = [&](std::size_t first, std::size_t last) {
        for (std::size_t row = first; row < last; ++row) {
            DirectJob job = common;
            job.nRow = row;
            for (std::size_t channel = 0; channel < nChannels; ++channel) {
                job.apResults[channel] = result.row(channel, row);
            }
            call.kernels.direct(job);
        }
    };
    runRows(call.runner, working.height(), 1, working.width(), filter, asksOnce);
    for (std::size_t channel = 0; channel < nChannels; ++channel) {
        working.swapPlane(result, channel);
    }
}

void FastBilateralCPUFilter::writeImage(Call& call, bool bSlice) const {
    WorkingImage const& working = call.working;
    std::size_t const nWidth = working.width();
    BandRunner& runner = call.target.isConcurrent() ? call.runner : call.serialRunner;
    // Other targets clamp by themselves, or want their pixels as they are.
    StoreStyle const style = {call.target.isDirect(), call.target.prefersStreaming()};
    std::vector<float> const aOnes(nWidth, 1.0F);
    auto const write = [&](std::size_t first, std::size_t last) {
        std::vector<float> aBuffer(4 * nWidth);
        std::vector<float> aBlended(bSlice ? call.dividedPitch() : 0);
        std::vector<float> aSliced(bSlice ? working.channels() * nWidth : 0);
        for (std::size_t row = first; row < last; ++row) {
            std::array<float const*, 4> apPlanes = {};
            std::array<float*, 3> apSliced = {};
            for (std::size_t channel = 0; channel < working.channels(); ++channel) {
                apSliced[channel] = aSliced.data() + channel * nWidth;
                apPlanes[channel] = bSlice ? apSliced[channel] : working.row(channel, row);
            }
            apPlanes[working.channels()] =
                call.aOpaqueRows[row] != 0 ? aOnes.data() : working.row(working.channels(), row);
            if (bSlice) {
                sliceGridRow(call, row, aBlended.data(), apSliced.data());
            }
            float* const pRow = call.target.rowBuffer(row, aBuffer.data());
            if (bColorize_) {
                call.kernels.rgbaFromLab(apPlanes.data(), pRow, nWidth, style);
            } else {
                call.kernels.greyFromLuminance(apPlanes[0], apPlanes[1], pRow, nWidth, style);
            }
            call.target.finishRow(row, pRow);
        }
    };
    runRows(runner, working.height(), kRowsPerBand, nWidth, write, asksNobody);
}

} // namespace ORVO
