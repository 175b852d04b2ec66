#include "orvo/core/exceptions/ParameterException.h"

namespace ORVO {

ParameterException::ParameterException(char const* file, int line, char const* message)
    : LogicalException(file, line, message) {}

ParameterException::ParameterException(ParameterException const& other) noexcept = default;
ParameterException& ParameterException::operator=(ParameterException const& other) noexcept = default;
ParameterException::~ParameterException() = default;

ParameterException* ParameterException::clone() const { return new ParameterException(*this); }

} // namespace ORVO
