#include "orvo/core/exceptions/CPURuntimeException.h"

namespace ORVO {

CPURuntimeException::CPURuntimeException(ExceptionCondition condition) noexcept : eCondition_(condition) {}
CPURuntimeException::CPURuntimeException(CPURuntimeException const& other) noexcept = default;
CPURuntimeException& CPURuntimeException::operator=(CPURuntimeException const& other) noexcept = default;
CPURuntimeException::~CPURuntimeException() = default;

char const* CPURuntimeException::what() const noexcept {
    switch (eCondition_) {
    case CONDITION_NONE:
        return "CPU runtime exception: none";
    case CONDITION_OUT_OF_MEMORY:
        return "CPU runtime exception: out of memory";
    case CONDITION_DIVISION_BY_ZERO:
        return "CPU runtime exception: division by zero";
    case CONDITION_INVALID_OPERATION:
        return "CPU runtime exception: invalid operation";
    case CONDITION_NUMERIC_OVERFLOW:
        return "CPU runtime exception: numeric overflow";
    case CONDITION_ILLEGAL_ACCESS:
        return "CPU runtime exception: illegal access";
    case CONDITION_UNKNOWN:
        break;
    }
    return "CPU runtime exception: unknown";
}

CPURuntimeException* CPURuntimeException::clone() const { return new CPURuntimeException(*this); }

CPURuntimeException::ExceptionCondition CPURuntimeException::condition() const noexcept {
    return eCondition_;
}

} // namespace ORVO
