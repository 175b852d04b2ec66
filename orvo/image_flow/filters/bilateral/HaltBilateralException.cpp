#include "orvo/image_flow/filters/bilateral/HaltBilateralException.h"

#include "orvo/core/memory/TrackedNew.h"

#include <ostream>

HaltBilateralException::HaltBilateralException() = default;
HaltBilateralException::HaltBilateralException(HaltBilateralException const& other) = default;
HaltBilateralException& HaltBilateralException::operator=(HaltBilateralException const& other) = default;
HaltBilateralException::~HaltBilateralException() = default;

char const* HaltBilateralException::what() const noexcept {
    return "HaltBilateralException exception.  This should not be exposed to any clients";
}

ORVO::ExceptionBase* HaltBilateralException::clone() const { return ORVO_NEW HaltBilateralException(*this); }

void HaltBilateralException::write(std::ostream& stream) const { stream << what(); }
