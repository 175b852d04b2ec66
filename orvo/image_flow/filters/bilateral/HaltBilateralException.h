#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/exceptions/ExceptionBase.h"

#include <iosfwd>

/// Thrown inside the fast bilateral filter when its callback answers false, and caught there: a filter that
/// is stopped returns false. Stands in the global namespace.
///
/// Threads: a plain value.
class ORVO_API HaltBilateralException : public ORVO::ExceptionBase {
public:
    HaltBilateralException();
    HaltBilateralException(HaltBilateralException const& other);
    HaltBilateralException& operator=(HaltBilateralException const& other);
    ~HaltBilateralException() override;

    /// "HaltBilateralException exception.  This should not be exposed to any clients"
    char const* what() const noexcept override;
    ORVO::ExceptionBase* clone() const override;
    /// Writes what().
    void write(std::ostream& stream) const override;
};
