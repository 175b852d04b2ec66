#pragma once

#include "orvo/core/Export.h"

#include <exception>
#include <string>

namespace ORVO {

/// The colour engine cannot be reached. Outside the family of `ExceptionBase`, as everything of the engine's
/// is.
///
/// Threads: as any value.
class ORVO_API TrelException : public std::exception {
public:
    explicit TrelException(std::string sText);
    TrelException(TrelException const&);
    TrelException& operator=(TrelException const&);
    ~TrelException() override;

    char const* what() const noexcept override;

private:
    std::string sText_;
};

} // namespace ORVO
