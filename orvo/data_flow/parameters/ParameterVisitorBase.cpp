#include "orvo/data_flow/parameters/ParameterVisitorBase.h"

namespace ORVO::DataFlow {

ParameterVisitorBase::~ParameterVisitorBase() = default;

} // namespace ORVO::DataFlow
