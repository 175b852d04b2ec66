#include "orvo/ogl/internal/ShaderLog.h"

#include <cctype>
#include <string_view>

namespace ORVO::OGL::Internal {

namespace {

/// A line of a text, counted from 1; empty if there is none.
std::string lineOf(std::string const& sText, std::size_t nLine) {
    std::size_t nBegin = 0;
    for (std::size_t i = 1; i < nLine; ++i) {
        nBegin = sText.find('\n', nBegin);
        if (nBegin == std::string::npos)
            return {};
        ++nBegin;
    }
    return nLine == 0 ? std::string() : sText.substr(nBegin, sText.find('\n', nBegin) - nBegin);
}

bool isDigit(char c) noexcept { return std::isdigit(static_cast<unsigned char>(c)) != 0; }

/// Reads a log from a position on. Every step forward is taken only if it fits.
class LogReader {
public:
    LogReader(std::string const& sLog, std::size_t nPosition) noexcept : sLog_(sLog), n_(nPosition) {}

    bool take(char c) noexcept {
        if (n_ >= sLog_.size() || sLog_[n_] != c)
            return false;
        ++n_;
        return true;
    }

    /// A number of at most nine digits.
    bool take(std::size_t& number) noexcept {
        std::size_t nEnd = n_;
        while (nEnd < sLog_.size() && isDigit(sLog_[nEnd]))
            ++nEnd;
        if (nEnd == n_ || nEnd - n_ > 9)
            return false;
        number = 0;
        for (; n_ < nEnd; ++n_)
            number = number * 10 + static_cast<std::size_t>(sLog_[n_] - '0');
        return true;
    }

    void skipSpaces() noexcept {
        while (take(' ')) {
        }
    }

private:
    std::string const& sLog_;
    std::size_t n_;
};

/// "<string>:<line>(<column>):"
bool readWithColumn(LogReader reader, LogPlace& place) noexcept {
    std::size_t nColumn = 0;
    return reader.take(place.nString_) && reader.take(':') && reader.take(place.nLine_) && reader.take('(') &&
           reader.take(nColumn) && reader.take(')') && reader.take(':');
}

/// "<string>(<line>) :"
bool readInParentheses(LogReader reader, LogPlace& place) noexcept {
    if (!reader.take(place.nString_) || !reader.take('(') || !reader.take(place.nLine_) || !reader.take(')'))
        return false;
    reader.skipSpaces();
    return reader.take(':');
}

/// "<string>:<line>:", which is only a place after "ERROR: " or "WARNING: ".
bool readAfterSeverity(std::string const& sLog, std::size_t nPosition, LogPlace& place) noexcept {
    std::string_view const sBefore(sLog.data(), nPosition);
    auto const follows = [sBefore](std::string_view sText) {
        return sBefore.size() >= sText.size() && sBefore.substr(sBefore.size() - sText.size()) == sText;
    };
    LogReader reader(sLog, nPosition);
    return (follows("ERROR: ") || follows("WARNING: ")) && reader.take(place.nString_) && reader.take(':') &&
           reader.take(place.nLine_) && reader.take(':');
}

std::string withoutTrailingNewlines(std::string sText) {
    while (!sText.empty() && (sText.back() == '\n' || sText.back() == '\0'))
        sText.pop_back();
    return sText;
}

} // namespace

ShaderSource::ShaderSource(unsigned count, char const* const* ppStrings, int const* pLengths) {
    aStrings_.reserve(count);
    for (unsigned i = 0; i < count; ++i) {
        if (pLengths != nullptr && pLengths[i] >= 0)
            aStrings_.emplace_back(ppStrings[i], static_cast<std::size_t>(pLengths[i]));
        else
            aStrings_.emplace_back(ppStrings[i]);
    }
}

std::string ShaderSource::line(std::size_t nString, std::size_t nLine) const {
    if (nString < aStrings_.size()) {
        std::string sLine = lineOf(aStrings_[nString], nLine);
        if (!sLine.empty())
            return sLine;
    }
    std::string sAll;
    for (std::string const& sString : aStrings_)
        sAll += sString;
    return lineOf(sAll, nLine);
}

LogPlace firstPlace(std::string const& sLog) {
    for (std::size_t i = 0; i < sLog.size(); ++i) {
        if (!isDigit(sLog[i]) || (i > 0 && isDigit(sLog[i - 1])))
            continue;
        LogPlace place;
        LogReader const reader(sLog, i);
        place.bFound_ = readWithColumn(reader, place) || readInParentheses(reader, place) ||
                        readAfterSeverity(sLog, i, place);
        if (place.bFound_)
            return place;
    }
    return {};
}

std::string describeFailure(char const* message, std::string const& sLog, ShaderSource const* pSource) {
    std::string sText = std::string(message) + ": " + withoutTrailingNewlines(sLog);
    LogPlace const place = firstPlace(sLog);
    if (!place.bFound_ || pSource == nullptr)
        return sText;
    std::string const sLine = pSource->line(place.nString_, place.nLine_);
    if (!sLine.empty())
        sText.append("\n")
            .append(std::to_string(place.nString_))
            .append(":")
            .append(std::to_string(place.nLine_))
            .append(": ")
            .append(sLine);
    return sText;
}

} // namespace ORVO::OGL::Internal
