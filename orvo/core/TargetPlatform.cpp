#include "orvo/core/TargetPlatform.h"

#include <ostream>

namespace ORVO {

std::ostream& operator<<(std::ostream& stream, TargetPlatform platform) {
    switch (platform) {
    case ORVO_TARGET_GL:
        return stream << "ORVO_TARGET_GL";
    case ORVO_TARGET_CPU:
        return stream << "ORVO_TARGET_CPU";
    case ORVO_TARGET_RESERVED_2:
        return stream << "ORVO_TARGET_RESERVED_2";
    case ORVO_TARGET_RESERVED_3:
        return stream << "ORVO_TARGET_RESERVED_3";
    case ORVO_TARGET_UNSET:
        return stream << "ORVO_TARGET_UNSET";
    }
    return stream << "TargetPlatform(" << static_cast<std::int32_t>(platform) << ")";
}

} // namespace ORVO
