#include "orvo/filter_graph/impl/ErrorOrWarningInfo.h"

#include <algorithm>
#include <ostream>

namespace ORVO::FilterGraph {

namespace {

template <class Predicate>
std::size_t count(std::vector<ErrorOrWarningInfo> const& infos, Predicate predicate) {
    return static_cast<std::size_t>(std::count_if(infos.begin(), infos.end(), predicate));
}

} // namespace

ErrorOrWarningInfo::ErrorOrWarningInfo(ErrorType type, std::string const& message, int inputStringId,
                                       int line)
    : type_(type), message_(message), inputStringId_(inputStringId), line_(line) {}

std::size_t nError(std::vector<ErrorOrWarningInfo> const& infos) {
    return count(infos, [](ErrorOrWarningInfo const& info) { return info.isError(); });
}

std::size_t nWarning(std::vector<ErrorOrWarningInfo> const& infos) {
    return count(infos, [](ErrorOrWarningInfo const& info) { return info.isWarning(); });
}

std::ostream& operator<<(std::ostream& stream, ErrorOrWarningInfo const& info) {
    return stream << (info.isError() ? "ERROR" : "WARNING") << " (line: " << info.line()
                  << "): " << info.message() << "; (" << info.inputStringId() << ")";
}

std::ostream& operator<<(std::ostream& stream, std::vector<ErrorOrWarningInfo> const& infos) {
    for (ErrorOrWarningInfo const& info : infos)
        stream << info << "\n";
    return stream;
}

} // namespace ORVO::FilterGraph
