#include "orvo/core/ThreadID.h"

#include <ostream>

namespace ORVO {

ThreadID::ThreadID() noexcept : id_(std::this_thread::get_id()) {}

bool ThreadID::isCurrent() const noexcept { return id_ == std::this_thread::get_id(); }

std::ostream& operator<<(std::ostream& stream, ThreadID const& id) { return stream << id.id_; }

} // namespace ORVO
