#pragma once

#include <memory>

#include "orvo/core/exceptions/ExceptionBase.h"

namespace ORVO {

/// Root of programming and parameter errors: carries the place of the failed check and its text.
///
/// what() reads "<message> (<file>:<line>)"; message() is the bare text. Copies share the texts.
///
/// Threads: an object is immutable after construction and may be read from any thread.
class ORVO_API LogicalException : public ExceptionBase {
public:
    LogicalException(LogicalException const& other) noexcept;
    LogicalException& operator=(LogicalException const& other) noexcept;
    ~LogicalException() override;

    char const* what() const noexcept override;

    /// Path of the source file that holds the check, as the build saw it; never null.
    char const* file() const noexcept;
    /// Line of the check.
    int line() const noexcept;
    /// The text of the check, word for word; never null.
    char const* message() const noexcept;

protected:
    /// Copies both texts; null pointers count as empty texts.
    LogicalException(char const* file, int line, char const* message);

private:
    struct Record;
    std::shared_ptr<Record const> spRecord_;
};

} // namespace ORVO
