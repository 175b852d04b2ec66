#include "orvo/colour_engine/internal/ApplyPixels.h"

#include "orvo/colour_engine/VantlePackingSpec.h"

namespace ORVO::ColourEngine::Internal {

bool ApplyPixels::describe(_t_Vantle_PackingSpec const& record) {
    bool const bGray = record.space == _t_Vantle_PackingSpec::SPACE_GRAY && record.channels == 1;
    bool const bRGB = record.space == _t_Vantle_PackingSpec::SPACE_RGB && record.channels == 3;
    if ((!bGray && !bRGB) || (record.bytesPerChannel != 1 && record.bytesPerChannel != 2)) {
        return false;
    }
    for (std::size_t i = 0; i < record.channels; ++i) {
        if (record.planes[i].base == nullptr) {
            return false;
        }
    }
    for (std::size_t i = 0; i < aPlanes_.size(); ++i) {
        auto const& plane = record.planes[bGray ? 0 : i];
        aPlanes_[i] = {static_cast<unsigned char*>(plane.base), plane.rowBytes, plane.columnBytes};
    }
    iFirst_ = bGray ? 1 : 0;
    iEnd_ = bGray ? 2 : 3;
    bWords_ = record.bytesPerChannel == 2;
    return true;
}

} // namespace ORVO::ColourEngine::Internal
