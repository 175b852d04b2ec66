#pragma once

#include "orvo/core/Export.h"

#include <cstddef>
#include <cstdint>
#include <iosfwd>
#include <string>
#include <vector>

namespace ORVO::FilterGraph {

/// One record of what went wrong, in words meant for a person.
///
/// Threads: a plain value; any thread, one at a time for each object.
class ORVO_API ErrorOrWarningInfo {
public:
    enum ErrorType : std::int32_t {
        ERROR_TYPE_ERROR = 0,
        ERROR_TYPE_WARNING = 1,
    };

    /// @param inputStringId the number of the text that the record is about, for hosts that check several;
    /// else 0.
    /// @param line the line in that text, else 0.
    ErrorOrWarningInfo(ErrorType type, std::string const& message, int inputStringId, int line);

    ErrorType type() const { return type_; }

    std::string const& message() const { return message_; }

    int inputStringId() const { return inputStringId_; }

    int line() const { return line_; }

    bool isError() const { return type_ == ERROR_TYPE_ERROR; }

    bool isWarning() const { return type_ == ERROR_TYPE_WARNING; }

private:
    ErrorType type_;
    std::string message_;
    int inputStringId_;
    int line_;
};

/// The number of records that are errors.
ORVO_API std::size_t nError(std::vector<ErrorOrWarningInfo> const& infos);

/// The number of records that are warnings.
ORVO_API std::size_t nWarning(std::vector<ErrorOrWarningInfo> const& infos);

/// Writes "ERROR (line: 3): message; (0)", with the word "WARNING" for everything but an error.
ORVO_API std::ostream& operator<<(std::ostream& stream, ErrorOrWarningInfo const& info);

/// Writes each record, followed by a line break.
ORVO_API std::ostream& operator<<(std::ostream& stream, std::vector<ErrorOrWarningInfo> const& infos);

} // namespace ORVO::FilterGraph
