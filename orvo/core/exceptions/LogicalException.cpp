#include "orvo/core/exceptions/LogicalException.h"

#include <string>

namespace ORVO {

struct LogicalException::Record {
    std::string sFile_;
    int iLine_;
    std::string sMessage_;
    std::string sWhat_;
};

LogicalException::LogicalException(char const* file, int line, char const* message) {
    std::string sFile(file != nullptr ? file : "");
    std::string sMessage(message != nullptr ? message : "");
    std::string sWhat = sMessage + " (" + sFile + ":" + std::to_string(line) + ")";
    spRecord_ =
        std::make_shared<Record const>(Record{std::move(sFile), line, std::move(sMessage), std::move(sWhat)});
}

LogicalException::LogicalException(LogicalException const& other) noexcept = default;
LogicalException& LogicalException::operator=(LogicalException const& other) noexcept = default;
LogicalException::~LogicalException() = default;

char const* LogicalException::what() const noexcept { return spRecord_->sWhat_.c_str(); }
char const* LogicalException::file() const noexcept { return spRecord_->sFile_.c_str(); }
int LogicalException::line() const noexcept { return spRecord_->iLine_; }
char const* LogicalException::message() const noexcept { return spRecord_->sMessage_.c_str(); }

} // namespace ORVO
