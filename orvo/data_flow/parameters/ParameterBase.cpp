#include "orvo/data_flow/parameters/ParameterBase.h"

#include <ostream>

namespace ORVO::DataFlow {

ParameterBase::ParameterBase(std::string const& sName, std::string const& sDescription)
    : sName_(sName), sDescription_(sDescription) {}

ParameterBase::ParameterBase(ParameterBase const&) = default;
ParameterBase& ParameterBase::operator=(ParameterBase const&) = default;
ParameterBase::~ParameterBase() = default;

bool ParameterBase::isInterval() const { return false; }

std::shared_ptr<ParameterBase> ParameterBase::clone(std::string const& sNewName) {
    std::shared_ptr<ParameterBase> spClone = clone();
    spClone->sName_ = sNewName;
    return spClone;
}

std::string ParameterBase::data_type_name() const { return datatype().name(); }

void ParameterBase::setDirty() {
    bDirty_ = true;
    bDirtySimpleCaching_ = true;
    bDirtyGlyphcast_ = true;
}

std::ostream& operator<<(std::ostream& oStream, ParameterBase const& oParameter) {
    oParameter.write(oStream);
    return oStream;
}

} // namespace ORVO::DataFlow
