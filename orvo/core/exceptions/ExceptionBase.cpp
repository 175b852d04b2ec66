#include "orvo/core/exceptions/ExceptionBase.h"

#include <ostream>

namespace ORVO {

ExceptionBase::ExceptionBase() noexcept = default;
ExceptionBase::ExceptionBase(ExceptionBase const& other) noexcept = default;
ExceptionBase& ExceptionBase::operator=(ExceptionBase const& other) noexcept = default;
ExceptionBase::~ExceptionBase() = default;

char const* ExceptionBase::what() const noexcept { return "ORVO exception"; }

void ExceptionBase::write(std::ostream& stream) const { stream << what(); }

std::ostream& operator<<(std::ostream& stream, ExceptionBase const& exception) {
    exception.write(stream);
    return stream;
}

} // namespace ORVO
