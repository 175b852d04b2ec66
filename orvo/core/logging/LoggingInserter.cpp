#include "orvo/core/logging/LoggingInserter.h"

#include <algorithm>

namespace ORVO::Logging {

LoggingInserter::LoggingInserter() noexcept = default;

void LoggingInserter::setIndent(int nIndent) noexcept { nIndent_ = std::max(nIndent, 0); }

int LoggingInserter::indent() const noexcept { return nIndent_; }

int LoggingInserter::operator()(std::streambuf& target, int character) {
    using Traits = std::streambuf::traits_type;
    if (bLineStart_) {
        nPending_ = nIndent_;
        bLineStart_ = false;
    }
    for (; nPending_ > 0; --nPending_) {
        if (Traits::eq_int_type(target.sputc(' '), Traits::eof()))
            return Traits::eof();
    }
    int const result = target.sputc(Traits::to_char_type(character));
    if (!Traits::eq_int_type(result, Traits::eof()))
        bLineStart_ = character == '\n';
    return result;
}

} // namespace ORVO::Logging
