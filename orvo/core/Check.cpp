#include "orvo/core/Check.h"

#include "orvo/core/exceptions/InternalException.h"
#include "orvo/core/exceptions/ParameterException.h"

namespace ORVO_private {

void throwInternal(char const* file, int line, char const* text) {
    throw ORVO::InternalException(file, line, text);
}

void throwInternal(char const* file, int line, std::string const& text) {
    throwInternal(file, line, text.c_str());
}

void throwParameter(char const* file, int line, char const* text) {
    throw ORVO::ParameterException(file, line, text);
}

void throwParameter(char const* file, int line, std::string const& text) {
    throwParameter(file, line, text.c_str());
}

void throwEnforce(char const* file, int line, char const* name) {
    throwInternal(file, line, "Enforce " + std::string(name) + " != NULL");
}

} // namespace ORVO_private
