#include "orvo/core/exceptions/ResourceException.h"

#include <string>

namespace ORVO {

struct ResourceException::Record {
    std::string sFile_;
    std::size_t iLine_;
    std::string sMessage_;
    std::string sWhat_;
};

ResourceException::ResourceException(char const* file, std::size_t line, char const* message) {
    std::string sFile(file != nullptr ? file : "");
    std::string sMessage(message != nullptr ? message : "");
    std::string sWhat = sMessage + " (" + sFile + ":" + std::to_string(line) + ")";
    spRecord_ =
        std::make_shared<Record const>(Record{std::move(sFile), line, std::move(sMessage), std::move(sWhat)});
}

ResourceException::ResourceException(ResourceException const& other) noexcept = default;
ResourceException& ResourceException::operator=(ResourceException const& other) noexcept = default;
ResourceException::~ResourceException() = default;

char const* ResourceException::what() const noexcept { return spRecord_->sWhat_.c_str(); }
ResourceException* ResourceException::clone() const { return new ResourceException(*this); }

char const* ResourceException::file() const noexcept { return spRecord_->sFile_.c_str(); }
std::size_t ResourceException::line() const noexcept { return spRecord_->iLine_; }
char const* ResourceException::message() const noexcept { return spRecord_->sMessage_.c_str(); }

} // namespace ORVO
