#include "orvo/ogl/internal/ShaderLog.h"

#include <algorithm>
#include <regex>

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

/// A number of at most nine digits.
std::size_t numberOf(std::ssub_match const& digits) { return std::stoul(digits.str()); }

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
    // In one pass over the log, so that the earliest place counts whatever its form.
    static std::regex const oPattern(R"((\d{1,9}):(\d{1,9})\(\d{1,9}\):|(\d{1,9})\((\d{1,9})\)\s*:|)"
                                     R"((?:ERROR|WARNING):\s*(\d{1,9}):(\d{1,9}):)");
    std::smatch match;
    if (!std::regex_search(sLog, match, oPattern))
        return {};
    for (std::size_t i = 1; i < match.size(); i += 2)
        if (match[i].matched)
            return {true, numberOf(match[i]), numberOf(match[i + 1])};
    return {};
}

std::string describeFailure(char const* message, std::string const& sLog, ShaderSource const* pSource) {
    std::string sText = std::string(message) + ": " + withoutTrailingNewlines(sLog);
    LogPlace const place = firstPlace(sLog);
    if (!place.bFound_ || pSource == nullptr)
        return sText;
    std::string const sLine = pSource->line(place.nString_, place.nLine_);
    if (!sLine.empty())
        sText += "\n" + std::to_string(place.nString_) + ":" + std::to_string(place.nLine_) + ": " + sLine;
    return sText;
}

} // namespace ORVO::OGL::Internal
