#pragma once

#include <memory>

#include "orvo/core/exceptions/ExceptionBase.h"

namespace ORVO {

/// Carries an exception from the worker that caught it to the thread that rethrows it. Copies share the
/// exception.
///
/// Threads: an object is immutable after construction and may be read from any thread.
class ORVO_API SharedException : public ExceptionBase {
public:
    /// Shares the given exception, which may be null.
    explicit SharedException(std::shared_ptr<std::exception> spException) noexcept;
    SharedException(SharedException const& other) noexcept;
    SharedException& operator=(SharedException const& other) noexcept;
    ~SharedException() override;

    /// The text of the carried exception; "Shared exception without content" if there is none.
    char const* what() const noexcept override;
    SharedException* clone() const override;
    /// Writes the carried exception, by its own write() if it is an ExceptionBase.
    void write(std::ostream& stream) const override;

    /// The carried exception, null if it was made of null.
    std::shared_ptr<std::exception> const& exception() const noexcept;

private:
    std::shared_ptr<std::exception> spException_;
};

} // namespace ORVO
