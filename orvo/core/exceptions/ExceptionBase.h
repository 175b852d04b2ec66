#pragma once

#include <exception>
#include <iosfwd>

#include "orvo/core/Export.h"

namespace ORVO {

/// Root of everything that the system throws by design. A copy of an exception never throws.
///
/// Code on a worker thread lets no exception escape: it stores a clone(), which is rethrown on the caller's
/// thread inside a SharedException.
///
/// Threads: an object is immutable after construction and may be read from any thread.
class ORVO_API ExceptionBase : public std::exception {
public:
    ExceptionBase() noexcept;
    ExceptionBase(ExceptionBase const& other) noexcept;
    ExceptionBase& operator=(ExceptionBase const& other) noexcept;
    ~ExceptionBase() override;

    /// The text of the failure; valid as long as this object or a copy of it lives.
    char const* what() const noexcept override;

    /// A new object of the same dynamic type, owned by the caller, freed with delete or ORVODeleter.
    virtual ExceptionBase* clone() const = 0;

    /// Writes the text of what() to the stream; subclasses may write more.
    virtual void write(std::ostream& stream) const;
};

/// Calls write().
ORVO_API std::ostream& operator<<(std::ostream& stream, ExceptionBase const& exception);

} // namespace ORVO
