#pragma once

#include <cstdint>

#include "orvo/core/exceptions/ExceptionBase.h"

namespace ORVO {

/// A failure of CPU work with no information of its own but a condition. The system itself only builds it
/// with CONDITION_UNKNOWN, for anything that was caught on a worker and is no ExceptionBase.
///
/// Threads: an object is immutable after construction and may be read from any thread.
class ORVO_API CPURuntimeException : public ExceptionBase {
public:
    /// What went wrong. Values outside the enumeration are kept and read as unknown.
    enum ExceptionCondition : std::int32_t {
        CONDITION_NONE = 0,
        CONDITION_OUT_OF_MEMORY = 1,
        CONDITION_DIVISION_BY_ZERO = 2,
        CONDITION_INVALID_OPERATION = 3,
        CONDITION_NUMERIC_OVERFLOW = 4,
        CONDITION_ILLEGAL_ACCESS = 5,
        CONDITION_UNKNOWN = 6
    };

    explicit CPURuntimeException(ExceptionCondition condition) noexcept;
    CPURuntimeException(CPURuntimeException const& other) noexcept;
    CPURuntimeException& operator=(CPURuntimeException const& other) noexcept;
    ~CPURuntimeException() override;

    /// "CPU runtime exception: " and the name of the condition.
    char const* what() const noexcept override;
    CPURuntimeException* clone() const override;

    /// The condition given at construction.
    ExceptionCondition condition() const noexcept;

private:
    ExceptionCondition eCondition_;
};

} // namespace ORVO
