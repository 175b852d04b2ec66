#include "orvo/data_flow/parameters/ParameterSet.h"

#include "orvo/data_flow/parameters/ParameterBase.h"
#include "orvo/data_flow/parameters/ParameterNameEquals.h"

#include "orvo/core/Check.h"

#include <algorithm>
#include <iterator>
#include <ostream>
#include <utility>

namespace ORVO::DataFlow {

ParameterSet::ParameterSet() = default;
ParameterSet::~ParameterSet() = default;

ParameterSet::ParameterSet(ParameterSet const& oOther) { insertClones(oOther.aParameters_); }

ParameterSet& ParameterSet::operator=(ParameterSet const& oOther) {
    ParameterSet oCopy(oOther);
    swap(oCopy);
    return *this;
}

void ParameterSet::insert(std::shared_ptr<ParameterBase> spParameter) {
    ORVO_ENFORCE(spParameter.get());
    aParameters_.push_back(std::move(spParameter));
}

ParameterSet::iterator ParameterSet::insert(iterator, std::shared_ptr<ParameterBase> spParameter) {
    insert(std::move(spParameter));
    return std::prev(end());
}

std::shared_ptr<ParameterBase> ParameterSet::parameter(std::size_t iParameter) const {
    ORVO_CHECK(iParameter < size(), "Range error: iParameter < size()");
    return aParameters_[iParameter];
}

std::shared_ptr<ParameterBase> ParameterSet::getParameter(std::string const& sName) const {
    auto const it = std::find_if(begin(), end(), ParameterNameEquals(sName));
    return it == end() ? nullptr : *it;
}

void ParameterSet::insertClones(container const& aOriginals) {
    container aClones;
    aClones.reserve(aOriginals.size());
    for (auto const& spOriginal : aOriginals) {
        ORVO_ENFORCE(spOriginal.get(), "spParameter.get()");
        aClones.push_back(spOriginal->clone());
    }
    aParameters_.insert(aParameters_.end(), aClones.begin(), aClones.end());
}

std::ostream& operator<<(std::ostream& oStream, ParameterSet const& oSet) {
    for (auto const& spParameter : oSet) {
        oStream << *spParameter << "\n";
    }
    return oStream;
}

ParameterSet combine(ParameterSet const& a, ParameterSet const& b) {
    ParameterSet oCombined(a);
    oCombined.insert(b.begin(), b.end());
    return oCombined;
}

} // namespace ORVO::DataFlow
