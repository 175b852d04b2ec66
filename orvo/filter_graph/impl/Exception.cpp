#include "orvo/filter_graph/impl/Exception.h"

#include <ostream>

namespace ORVO::FilterGraph {

struct Exception::Records {
    explicit Records(std::vector<ErrorOrWarningInfo> const& given) : infos(given) {
        for (ErrorOrWarningInfo const& info : given)
            text += (text.empty() ? "" : "\n") + info.message();
    }

    std::vector<ErrorOrWarningInfo> infos;
    std::string text;
};

Exception::Exception() : Exception("Internal ORVO Filter Graph Exception") {}

Exception::Exception(std::string const& message)
    : Exception(ErrorOrWarningInfo(ErrorOrWarningInfo::ERROR_TYPE_ERROR, message, 0, 0)) {}

Exception::Exception(ErrorOrWarningInfo const& info) : Exception(std::vector<ErrorOrWarningInfo>(1, info)) {}

Exception::Exception(std::vector<ErrorOrWarningInfo> const& infos)
    : spRecords_(std::make_shared<Records const>(infos)) {}

Exception::Exception(Exception const& other) noexcept = default;

Exception& Exception::operator=(Exception const& other) noexcept = default;

Exception::~Exception() = default;

std::vector<ErrorOrWarningInfo> const& Exception::errorsAndWarnings() const { return spRecords_->infos; }

void Exception::add(ErrorOrWarningInfo const& info) {
    std::vector<ErrorOrWarningInfo> infos = spRecords_->infos;
    infos.push_back(info);
    spRecords_ = std::make_shared<Records const>(infos);
}

char const* Exception::what() const noexcept { return spRecords_->text.c_str(); }

ExceptionBase* Exception::clone() const { return new Exception(*this); }

void Exception::write(std::ostream& stream) const { stream << spRecords_->infos; }

} // namespace ORVO::FilterGraph
