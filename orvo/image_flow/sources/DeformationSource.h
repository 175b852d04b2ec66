#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_flow/sources/DeformationMap.h"
#include "orvo/image_runtime/images/ImageGPU.h"

namespace ORVO {

/// The source that puts a deformation map into a graph, as a texture of luminance and alpha in 32-bit floats
/// on "OutputImage": one pixel of 1 by 1 world units for each place of the map, from the origin on.
///
/// It gives its image once, and then again after each `emit`. It shares the image with its consumer and
/// copies nothing unless its output is bound; then it copies its compute region into the bound texture, as
/// ImageGPUInput does. The image survives a flush of the graph.
///
/// Throws `InternalException` "Enforce oImage_.get() != NULL" where a run finds no image,
/// `ParameterException` where a bound output has other channels, and `OGL::ExceptionOGL` where OpenGL
/// refuses.
///
/// Threads: `setDeformationMap` by the client's thread, between frames. It, runs, and the death of images
/// need a current context that shares with one of the image runtime's.
class ORVO_API DeformationSource : public ImageFilter {
public:
    /// A source with the map, as `setDeformationMap` takes it.
    DeformationSource(char const* name, DeformationMap* map);
    ~DeformationSource() override;

    /// Makes the image of a map, whose values are copied before the call returns. Null counts as a map of
    /// 0 by 0 without data. A map without data has an image whose values are undefined. Throws
    /// `ParameterException` for a map that no image can be as large as, `OGL::ExceptionOGL` where the driver
    /// has no texture of that size; the image is then the one before.
    void setDeformationMap(DeformationMap* map);

    /// \name Size of the image, in pixels
    /// @{
    ExtentInPixelSpace size() const;
    int width() const;
    int height() const;
    /// @}

    /// True.
    bool canEmit() const override;
    /// Starts a new round: the next run gives the image again.
    void emit() override;
    /// The rectangle of the image (world), whatever is asked for.
    PositionExtentInWorldSpace generated(RegionMap const& inputDODs) override;
    /// `Node::isReady`, with an image that was not given since the last `emit`.
    bool isReady() const override;

protected:
    void internalProcess() override;

private:
    DataFlow::ConstDataPointer<ImageGPU> oImage_;
    bool bEmitted_;
    DataFlow::ConstOutput<ImageGPU> oOutputImage_;
};

} // namespace ORVO
