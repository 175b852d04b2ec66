/// Texts of failed compiles and links.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace ORVO::OGL::Internal {

/// The strings of one shader, as they were given to the driver.
class ShaderSource {
public:
    /// Copies count strings; a null array of lengths, or a negative length, means that a string ends at its
    /// null character.
    ShaderSource(unsigned count, char const* const* ppStrings, int const* pLengths);

    std::vector<std::string> const& strings() const noexcept { return aStrings_; }

    /// A line, counted from 1, of a string, counted from 0; where the string does not have it, of all strings
    /// taken as one, as some drivers count. Empty if there is no such line.
    std::string line(std::size_t nString, std::size_t nLine) const;

private:
    std::vector<std::string> aStrings_;
};

/// A place that a driver's log names.
struct LogPlace {
    bool bFound_ = false;
    std::size_t nString_ = 0;
    std::size_t nLine_ = 0;
};

/// The first place that the log names, in any of the forms that drivers use: "0:12(3): error", "0(12) :
/// error", "ERROR: 0:12: ...".
LogPlace firstPlace(std::string const& sLog);

/// "<message>: <log>", and if the log names a line of the source, "\n<string>:<line>: <the line>".
std::string describeFailure(char const* message, std::string const& sLog, ShaderSource const* pSource);

} // namespace ORVO::OGL::Internal
