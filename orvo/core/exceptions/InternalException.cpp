#include "orvo/core/exceptions/InternalException.h"

namespace ORVO {

InternalException::InternalException(char const* file, int line, char const* message)
    : LogicalException(file, line, message) {}

InternalException::InternalException(InternalException const& other) noexcept = default;
InternalException& InternalException::operator=(InternalException const& other) noexcept = default;
InternalException::~InternalException() = default;

InternalException* InternalException::clone() const { return new InternalException(*this); }

} // namespace ORVO
