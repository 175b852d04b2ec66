#include "orvo/filter_graph/internal/InputSet.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/Input.h"

#include <algorithm>

namespace ORVO::FilterGraph::Internal {

InputSet::NameEquals::NameEquals(std::string const& name) : name_(name) {}

InputSet::NameEquals::~NameEquals() = default;

bool InputSet::NameEquals::operator()(Input const* pInput) const { return pInput && pInput->name() == name_; }

InputSet::InputSet() = default;

InputSet::~InputSet() = default;

void InputSet::insert(Input* pInput) {
    ORVO_ENFORCE(pInput);
    auto const iInput = std::find(aInputs_.begin(), aInputs_.end(), pInput);
    ORVO_CHECK(aInputs_.end() == iInput);
    aInputs_.push_back(pInput);
}

void InputSet::remove(Input* pInput) {
    auto const iInput = std::find(aInputs_.begin(), aInputs_.end(), pInput);
    if (iInput != aInputs_.end())
        aInputs_.erase(iInput);
}

Input* InputSet::input(std::string const& name) {
    auto const iInput = std::find_if(aInputs_.begin(), aInputs_.end(), NameEquals(name));
    return iInput != aInputs_.end() ? *iInput : nullptr;
}

Input const* InputSet::input(std::string const& name) const {
    return const_cast<InputSet*>(this)->input(name);
}

InputIterator InputSet::inputs() { return {aInputs_.begin(), aInputs_.end()}; }

InputConstIterator InputSet::inputs() const { return {aInputs_.begin(), aInputs_.end()}; }

} // namespace ORVO::FilterGraph::Internal
