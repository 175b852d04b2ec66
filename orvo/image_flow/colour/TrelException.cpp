#include "orvo/image_flow/colour/TrelException.h"

#include <utility>

namespace ORVO {

TrelException::TrelException(std::string sText) : sText_(std::move(sText)) {}
TrelException::TrelException(TrelException const&) = default;
TrelException& TrelException::operator=(TrelException const&) = default;
TrelException::~TrelException() = default;

char const* TrelException::what() const noexcept { return sText_.c_str(); }

} // namespace ORVO
