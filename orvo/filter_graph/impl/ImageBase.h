#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/math/Int.h"
#include "orvo/core/math/Size.h"
#include "orvo/core/spaces/PositionExtentInPixelSpace.h"
#include "orvo/core/spaces/PositionExtentInWorldSpace.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"

#include <cstddef>
#include <cstdint>
#include <memory>

namespace ORVO {
class ImageBase;
}

namespace ORVO::FilterGraph {

namespace Internal {
class ImageAccessor;
}

/// A client image: a descriptor, a rectangle in pixel space, and the client's storage, which is never owned.
/// A handle may be without storage, which is enough to compile a graph and to propagate regions.
///
/// Copies of a handle share the storage until one of them is given another.
///
/// Threads: as `IFilter`. While a frame runs, neither the handle nor its storage may be changed.
class ORVO_API ImageBase {
public:
    /// Sets every byte of the storage to 0; does nothing without storage.
    virtual void clear() = 0;

    ImageDescriptor const& imageDescriptor() const { return oDescriptor_; }

    /// The pixels of the image, in pixel space. The position may be negative.
    PositionExtentInPixelSpace const& rect() const { return oRect_; }

    /// The same in world space: the rectangle times the pixel extent. Undefined if the rectangle is.
    PositionExtentInWorldSpace const& region() const { return oRegion_; }

    std::size_t numBytesPerPixel() const { return oDescriptor_.numBytesPerPixel(); }

    /// Pixels in a row; 0 if the rectangle is undefined.
    std::size_t width() const;

    /// Rows; 0 if the rectangle is undefined.
    std::size_t height() const;

    size2 size() const { return {width(), height()}; }

    /// The position of the rectangle.
    int2 offset() const;

    /// Sets the rectangle and the region that follows from it. Storage that is there stays as it is, in its
    /// old rectangle: give it again with the new one. Resets the content stamp.
    /// @throws ParameterException "Image extent must not be negative", or "Image rectangle exceeds the range
    /// of pixel positions" if the far corner is no `int`.
    void setRect(PositionExtentInPixelSpace const& rect);

    /// A number by which the host vouches for the pixels: as long as image and stamp bound to a source are
    /// those of the frame before, the pixels are taken to be unchanged, and results that depend on nothing
    /// else are kept. Give another number each time the pixels change, and never one number to two images
    /// with different pixels. 0, the default, means unknown: the image counts as changed on every frame. New
    /// storage and a new rectangle reset it.
    void setContentStamp(std::uint64_t stamp) { nContentStamp_ = stamp; }

    std::uint64_t contentStamp() const { return nContentStamp_; }

protected:
    /// No storage, an undefined rectangle and region.
    explicit ImageBase(ImageDescriptor const& descriptor);

    /// No storage.
    /// @throws ParameterException as `setRect`.
    ImageBase(ImageDescriptor const& descriptor, PositionExtentInPixelSpace const& rect);

    ImageBase(ImageBase const&) = default;
    ImageBase& operator=(ImageBase const&) = default;

    /// Destroyed through its derived class, which is what a host holds.
    virtual ~ImageBase();

    /// The runtime image around the storage, or null.
    ORVO::ImageBase* wrappedImage() const { return pImage_.get(); }

    /// Takes over a runtime image, or none, and lets go of the old one. Resets the content stamp.
    void setWrappedImage(std::shared_ptr<ORVO::ImageBase> pImage);

private:
    friend class Internal::ImageAccessor;

    ImageDescriptor oDescriptor_;
    PositionExtentInPixelSpace oRect_;
    PositionExtentInWorldSpace oRegion_;
    std::shared_ptr<ORVO::ImageBase> pImage_;
    std::uint64_t nContentStamp_ = 0;
};

} // namespace ORVO::FilterGraph
