#include "orvo/image_flow/filters/lab/LabRows.h"

#include "orvo/image_flow/filters/bilateral/RowAccess.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/kernels/Rows.h"

#include <vector>

namespace ORVO::ImageFlow::lab {

void convertRows(RowKernel pfnKernel, ImageCPU const& input, ImageCPU& output,
                 PositionExtentInPixelSpace const& region, std::size_t begin, std::size_t end) {
    ImageCPUReadAccessor const read(input);
    bilateral::RowSource const source(read, region);
    PositionInPixelSpace const corner = region.position();
    int const width = region.extent().width();
    std::vector<float> aRow(4 * static_cast<std::size_t>(width));
    for (std::size_t row = begin; row < end; ++row) {
        pfnKernel(aRow.data(), source.row(row, aRow.data()), static_cast<std::size_t>(width));
        ImageRuntime::writeRowFromRGBAFloat(output, corner.y() + static_cast<int>(row), corner.x(),
                                            corner.x() + width, aRow.data());
    }
}

} // namespace ORVO::ImageFlow::lab
