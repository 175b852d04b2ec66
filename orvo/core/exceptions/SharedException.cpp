#include "orvo/core/exceptions/SharedException.h"

#include <ostream>
#include <utility>

namespace ORVO {

SharedException::SharedException(std::shared_ptr<std::exception> spException) noexcept
    : spException_(std::move(spException)) {}
SharedException::SharedException(SharedException const& other) noexcept = default;
SharedException& SharedException::operator=(SharedException const& other) noexcept = default;
SharedException::~SharedException() = default;

char const* SharedException::what() const noexcept {
    return spException_ ? spException_->what() : "Shared exception without content";
}

SharedException* SharedException::clone() const { return new SharedException(*this); }

void SharedException::write(std::ostream& stream) const {
    if (auto const* const pBase = dynamic_cast<ExceptionBase const*>(spException_.get()))
        pBase->write(stream);
    else
        stream << what();
}

std::shared_ptr<std::exception> const& SharedException::exception() const noexcept { return spException_; }

} // namespace ORVO
