#pragma once

#include "orvo/core/exceptions/LogicalException.h"

namespace ORVO {

/// A bad argument from the caller.
///
/// Threads: an object is immutable after construction and may be read from any thread.
class ORVO_API ParameterException : public LogicalException {
public:
    /// Copies both texts; null pointers count as empty texts.
    ParameterException(char const* file, int line, char const* message);
    ParameterException(ParameterException const& other) noexcept;
    ParameterException& operator=(ParameterException const& other) noexcept;
    ~ParameterException() override;

    ParameterException* clone() const override;
};

} // namespace ORVO
