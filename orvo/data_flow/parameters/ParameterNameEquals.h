#pragma once

#include "orvo/core/Export.h"

#include <memory>
#include <string>

namespace ORVO::DataFlow {

class ParameterBase;

/// Predicate for searches: is this the parameter of that name?
///
/// Threads: any; the object never changes.
class ORVO_API ParameterNameEquals {
public:
    /// A predicate for `sName`, which is copied.
    explicit ParameterNameEquals(std::string const& sName);

    /// Whether the parameter bears exactly the name, byte for byte; false for null.
    bool operator()(ParameterBase const* pParameter) const;
    /// The same for an element of a set.
    bool operator()(std::shared_ptr<ParameterBase> const& spParameter) const;

private:
    std::string sName_;
};

} // namespace ORVO::DataFlow
