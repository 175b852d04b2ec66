#pragma once

#include "orvo/core/exceptions/LogicalException.h"

namespace ORVO {

/// A broken invariant: what all "Enforce ..." checks and plain assertions throw.
///
/// Threads: an object is immutable after construction and may be read from any thread.
class ORVO_API InternalException : public LogicalException {
public:
    /// Copies both texts; null pointers count as empty texts.
    InternalException(char const* file, int line, char const* message);
    InternalException(InternalException const& other) noexcept;
    InternalException& operator=(InternalException const& other) noexcept;
    ~InternalException() override;

    InternalException* clone() const override;
};

} // namespace ORVO
