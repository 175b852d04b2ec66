#include "orvo/data_flow/parameters/ParameterNameEquals.h"

#include "orvo/data_flow/parameters/ParameterBase.h"

namespace ORVO::DataFlow {

ParameterNameEquals::ParameterNameEquals(std::string const& sName) : sName_(sName) {}

bool ParameterNameEquals::operator()(ParameterBase const* pParameter) const {
    return pParameter != nullptr && pParameter->name() == sName_;
}

bool ParameterNameEquals::operator()(std::shared_ptr<ParameterBase> const& spParameter) const {
    return (*this)(spParameter.get());
}

} // namespace ORVO::DataFlow
