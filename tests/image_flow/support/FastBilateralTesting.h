/// What the tests of the fast bilateral filter share.
#pragma once

#include "orvo/core/math/Half.h"
#include "orvo/image_flow/filters/FastBilateralCPUFilter.h"
#include "orvo/image_flow/filters/bilateral/BandRunner.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/images/ImageCPUWriteAccessor.h"
#include "tests/image_flow/support/BilateralReference.h"

#include <atomic>
#include <cstring>
#include <memory>
#include <thread>
#include <vector>

namespace ORVO::Test {

inline std::size_t channelBytesOf(ImageCPU::tePixelFormat format) { return channelSizeBits(format) / 8; }
inline std::size_t nChannelsOf(ImageCPU::tePixelFormat format) {
    return pixelSizeBytes(format) / channelBytesOf(format);
}

/// A padded image of the library that holds a picture, with a guard in the padding.
class FilterImage {
public:
    FilterImage(ImageCPU::tePixelFormat format, Picture const& picture, int pitch)
        : oImage_(format, picture.rectangle(), PixelExtentInWorldSpace(1.0F, 1.0F),
                  ExtentInPixelSpace(pitch, picture.height + 2)) {
        std::memset(oImage_.pixels(), kGuard, bytes());
        ImageCPUWriteAccessor writer(oImage_);
        for (int row = 0; row < picture.height; ++row) {
            for (int column = 0; column < picture.width; ++column) {
                float4 const& p = picture.at(column, row);
                if (format == ImageCPU::PIXEL_FORMAT_RGBA32F) {
                    // Not clamped.
                    std::memcpy(pixel(column, row), p.begin(), sizeof(float4));
                } else {
                    writer.writeRGBAFloatPixel4At(p, picture.x + column, picture.y + row);
                }
            }
        }
    }

    ImageCPU& image() { return oImage_; }

    Picture picture() const {
        Picture picture(oImage_.position().x(), oImage_.position().y(), oImage_.extent().width(),
                        oImage_.extent().height());
        ImageCPUReadAccessor const reader(oImage_);
        for (int row = 0; row < picture.height; ++row) {
            for (int column = 0; column < picture.width; ++column) {
                picture.at(column, row) = reader.getRGBAFloat4PixelAt(picture.x + column, picture.y + row);
            }
        }
        return picture;
    }

    bool paddingIsUntouched() const {
        std::size_t const size = pixelSizeBytes(oImage_.pixelFormat());
        std::size_t const pitch = std::size_t(oImage_.capacityExtent().width()) * size;
        std::size_t const used = std::size_t(oImage_.extent().width()) * size;
        for (std::size_t i = 0; i < bytes(); ++i) {
            bool const isPadding = i % pitch >= used || i / pitch >= std::size_t(oImage_.extent().height());
            if (isPadding && oImage_.pixels()[i] != kGuard) {
                return false;
            }
        }
        return true;
    }

private:
    static constexpr unsigned char kGuard = 0xA5;

    std::size_t bytes() const {
        return std::size_t(oImage_.capacityExtent().width()) *
               std::size_t(oImage_.capacityExtent().height()) * pixelSizeBytes(oImage_.pixelFormat());
    }
    unsigned char* pixel(int column, int row) {
        return oImage_.pixels() +
               (std::size_t(row) * std::size_t(oImage_.capacityExtent().width()) + std::size_t(column)) *
                   pixelSizeBytes(oImage_.pixelFormat());
    }

    ImageCPU oImage_;
};

/// The fast filter on pictures, through accessors that the library does not know; the result is not clamped.
inline Picture applied(Picture const& source, Picture destination, reference::Settings const& s) {
    PictureReader reader(source);
    PictureWriter writer(destination);
    FastBilateralCPUFilter filter;
    EXPECT_TRUE(filter.applyFilter(&reader, &writer, float(s.rangeSigma), float(s.sigmaX), float(s.sigmaY),
                                   s.colorize));
    EXPECT_EQ(destination.pixels.size(), writer.written());
    return destination;
}

/// The fast filter on images of the library.
inline bool applyTo(ImageCPU const& source, ImageCPU& destination, reference::Settings const& s) {
    ImageCPUReadAccessor reader(source);
    ImageCPUWriteAccessor writer(destination);
    FastBilateralCPUFilter filter;
    return filter.applyFilter(&reader, &writer, float(s.rangeSigma), float(s.sigmaX), float(s.sigmaY),
                              s.colorize);
}

/// Runs bands on threads of its own, a given number of bands at a time, taken in any order.
class ThreadedRunner : public ImageFlow::bilateral::BandRunner {
public:
    ThreadedRunner(std::size_t nThreads, std::size_t nGrain) : nThreads_(nThreads), nGrain_(nGrain) {}

    void run(std::size_t nBands, std::size_t /*nUnits*/, Body const& body) override {
        std::atomic<std::size_t> next(0);
        auto const work = [&] {
            for (std::size_t first = next.fetch_add(nGrain_); first < nBands;
                 first = next.fetch_add(nGrain_)) {
                body(first, std::min(first + nGrain_, nBands));
            }
        };
        std::vector<std::thread> aThreads;
        for (std::size_t i = 1; i < nThreads_; ++i) {
            aThreads.emplace_back(work);
        }
        work();
        for (std::thread& thread : aThreads) {
            thread.join();
        }
    }

private:
    std::size_t nThreads_;
    std::size_t nGrain_;
};

} // namespace ORVO::Test
