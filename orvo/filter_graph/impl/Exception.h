#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/exceptions/ExceptionBase.h"
#include "orvo/filter_graph/impl/ErrorOrWarningInfo.h"

#include <iosfwd>
#include <memory>
#include <string>
#include <vector>

namespace ORVO::FilterGraph {

/// A mistake of the client, such as an unconnected input or a channel mismatch, told in records for a person.
/// A broken assumption of the program is an `InternalException` instead.
///
/// Threads: a plain value; any thread, one at a time for each object.
class ORVO_API Exception : public ExceptionBase {
public:
    /// One error record with the message "Internal ORVO Filter Graph Exception".
    Exception();

    /// One error record with the message.
    explicit Exception(std::string const& message);

    explicit Exception(ErrorOrWarningInfo const& info);
    explicit Exception(std::vector<ErrorOrWarningInfo> const& infos);
    Exception(Exception const& other) noexcept;
    Exception& operator=(Exception const& other) noexcept;
    ~Exception() override;

    /// The records in the order in which they were added.
    std::vector<ErrorOrWarningInfo> const& errorsAndWarnings() const;

    /// Appends a record.
    void add(ErrorOrWarningInfo const& info);

    /// The messages of all records, a line each; valid until the next `add`.
    char const* what() const noexcept override;

    /// A copy on the heap, which the caller owns.
    ExceptionBase* clone() const override;

    /// Writes the records, a line each.
    void write(std::ostream& stream) const override;

private:
    struct Records;

    // Shared by copies, so that copying an exception never throws; `add` makes new ones.
    std::shared_ptr<Records const> spRecords_;
};

} // namespace ORVO::FilterGraph
