#pragma once

#include <streambuf>

#include "orvo/core/Export.h"

namespace ORVO::Logging {

/// Stream filter that indents: writes the current indent at the start of each line, also of an empty one.
///
/// Threads: one at a time.
class ORVO_API LoggingInserter {
public:
    /// Starts at the beginning of a line, with no indent.
    LoggingInserter() noexcept;

    /// Sets the number of blanks at the start of the lines to come; negative counts as 0.
    void setIndent(int nIndent) noexcept;
    int indent() const noexcept;

    /// Inserts one character into target, behind the indent if it is the first of its line. Returns the
    /// character, or end-of-file as soon as target refuses one; the rest of a refused indent is written with
    /// the next call.
    int operator()(std::streambuf& target, int character);

private:
    int nIndent_ = 0;
    int nPending_ = 0;
    bool bLineStart_ = true;
};

} // namespace ORVO::Logging
