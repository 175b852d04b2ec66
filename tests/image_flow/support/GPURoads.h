/// Graphs that move one image between host memory and textures.
#pragma once

#include "tests/image_flow/support/GLFlowTest.h"

#include "orvo/image_flow/filters/CPU2GPU.h"
#include "orvo/image_flow/filters/GPU2CPU.h"
#include "orvo/image_flow/sources/ImageGPUInput.h"
#include "orvo/image_flow/sources/ImageGPUOutput.h"

namespace ORVO::Test {

/// A host image of known storage, every byte of which is the given one at first. Its storage has one row more
/// than the rectangle.
class HostImage {
public:
    HostImage(ImageCPU::tePixelFormat format, PositionExtentInPixelSpace const& region, int nPadding = 0,
              unsigned char fill = 0xcd,
              PixelExtentInWorldSpace const& pixelExtent = PixelExtentInWorldSpace())
        : oImage_(format, region, pixelExtent,
                  ExtentInPixelSpace(region.extent().width() + nPadding, region.extent().height() + 1)) {
        std::memset(oImage_.pixels(), fill, storageBytes());
    }

    ImageCPU& image() { return oImage_; }
    std::size_t pixelBytes() const { return pixelSizeBytes(oImage_.pixelFormat()); }
    std::size_t storageBytes() const {
        return std::size_t(oImage_.capacityExtent().width()) *
               std::size_t(oImage_.capacityExtent().height()) * pixelBytes();
    }
    std::vector<unsigned char> storage() const {
        return {oImage_.pixels(), oImage_.pixels() + storageBytes()};
    }

    unsigned char* at(int x, int y) {
        return oImage_.pixels() +
               std::size_t(std::ptrdiff_t(y - oImage_.position().y()) * oImage_.capacityExtent().width() + x -
                           oImage_.position().x()) *
                   pixelBytes();
    }
    template <typename T>
    T channel(int x, int y, std::size_t iChannel) {
        T value;
        std::memcpy(&value, at(x, y) + iChannel * sizeof(T), sizeof(T));
        return value;
    }

    /// Fills the rectangle from tight rows.
    void set(std::vector<unsigned char> const& aBytes) {
        std::size_t const nRow = std::size_t(oImage_.extent().width()) * pixelBytes();
        for (int row = 0; row < oImage_.extent().height(); ++row)
            std::memcpy(at(oImage_.position().x(), oImage_.position().y() + row),
                        &aBytes[std::size_t(row) * nRow], nRow);
    }

    /// Part of the image, as tight rows.
    std::vector<unsigned char> get(PositionExtentInPixelSpace const& part) {
        std::vector<unsigned char> aBytes;
        std::size_t const nRow = std::size_t(part.extent().width()) * pixelBytes();
        for (int row = 0; row < part.extent().height(); ++row) {
            unsigned char const* const pRow = at(part.position().x(), part.position().y() + row);
            aBytes.insert(aBytes.end(), pRow, pRow + nRow);
        }
        return aBytes;
    }
    std::vector<unsigned char> get() { return get(oImage_.positionExtent()); }

private:
    ImageCPU oImage_;
};

inline PositionExtentInWorldSpace
worldOf(PositionExtentInPixelSpace const& region,
        PixelExtentInWorldSpace const& pixelExtent = PixelExtentInWorldSpace()) {
    return pixelToWorldSpace(region, pixelExtent);
}

/// Nodes in a chain, run to the end of the last one.
class Chain {
public:
    Chain(OGL::Context const& context, std::initializer_list<ImageFilter*> aNodes) : aNodes_(aNodes) {
        for (std::size_t i = 1; i < aNodes_.size(); ++i)
            feed(*aNodes_[i], 0, *aNodes_[i - 1]);
        for (ImageFilter* pNode : aNodes_)
            oController_.addNode(pNode);
        oController_.setImageSink(*aNodes_.back());
        oController_.setContextGPU(context);
    }
    ~Chain() {
        for (ImageFilter* pNode : aNodes_)
            pNode->disconnect();
    }
    Chain(Chain const&) = delete;
    Chain& operator=(Chain const&) = delete;

    void run(PositionExtentInWorldSpace const& region) {
        oController_.computeRegions(region);
        oController_.setDirtyState();
        emitAll(oController_);
        oController_.process();
    }

    ImageFlowController oController_;

private:
    std::vector<ImageFilter*> aNodes_;
};

} // namespace ORVO::Test
