#pragma once

#include <cstddef>
#include <memory>

#include "orvo/core/exceptions/ExceptionBase.h"

namespace ORVO {

/// A resource or a capability that is missing, for instance "Minimum OpenGL Version (1.5) not supported.".
///
/// what() reads "<message> (<file>:<line>)"; message() is the bare text. Copies share the texts.
///
/// Threads: an object is immutable after construction and may be read from any thread.
class ORVO_API ResourceException : public ExceptionBase {
public:
    /// Copies both texts; null pointers count as empty texts.
    ResourceException(char const* file, std::size_t line, char const* message);
    ResourceException(ResourceException const& other) noexcept;
    ResourceException& operator=(ResourceException const& other) noexcept;
    ~ResourceException() override;

    char const* what() const noexcept override;
    ResourceException* clone() const override;

    /// Path of the source file that raised the failure, as the build saw it; never null.
    char const* file() const noexcept;
    /// Line that raised the failure.
    std::size_t line() const noexcept;
    /// The text of the failure, word for word; never null.
    char const* message() const noexcept;

private:
    struct Record;
    std::shared_ptr<Record const> spRecord_;
};

} // namespace ORVO
