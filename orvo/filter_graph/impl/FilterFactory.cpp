#include "orvo/filter_graph/impl/FilterFactory.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/Exception.h"
#include "orvo/filter_graph/impl/FilterEquality.h"
#include "orvo/filter_graph/impl/IFilter.h"
#include "orvo/filter_graph/internal/Filter.h"

#include <algorithm>
#include <iterator>
#include <sstream>

namespace ORVO::FilterGraph {

namespace {

FilterFactory* pInstance = nullptr;

/// The family of an identifier: the same filter in any version.
Identifier anyVersionOf(Identifier const& id) {
    return {id.name(), id.nameSpace(), id.vendor(), id.ioDataDescriptors()};
}

/// The same query whatever the descriptors are.
Identifier anyDescriptorsOf(Identifier const& id) {
    if (id.ignoresVersion())
        return {id.name(), id.nameSpace(), id.vendor()};
    return {id.name(), id.nameSpace(), id.vendor(), id.version()};
}

} // namespace

FilterFactory* FilterFactory::Instance() {
    ORVO_CHECK(isInitialized());
    return pInstance;
}

void FilterFactory::create() {
    ORVO_CHECK(!isInitialized());
    pInstance = new FilterFactory;
}

void FilterFactory::destroy() {
    ORVO_CHECK(isInitialized());
    delete pInstance;
    pInstance = nullptr;
}

bool FilterFactory::isInitialized() { return pInstance != nullptr; }

Identifier FilterFactory::insert(IFilter const& prototype) {
    auto const* pPrototypeFilter = dynamic_cast<Internal::Filter const*>(&prototype);
    ORVO_CHECK(pPrototypeFilter != nullptr, "pPrototypeFilter");
    // `clone` leaves what it is called on as it is, and is not declared const for the sake of composites.
    std::shared_ptr<IFilter> const clone = const_cast<Internal::Filter*>(pPrototypeFilter)->clone();
    ORVO_ENFORCE(clone, "clone");
    find_position_and_insert(clone);
    return clone->identifier();
}

void FilterFactory::find_position_and_insert(std::shared_ptr<IFilter> const& f) {
    Identifier const& id = f->identifier();
    if (id.ignoresVersion())
        throw Exception("Error inserting filter in the filter library: invalid id:\nf->identifier()\n"
                        "Must have version >=0");

    FilterEquality const isOfFamily(anyVersionOf(id));
    auto position = std::find_if(aFilters_.begin(), aFilters_.end(), isOfFamily);
    for (; position != aFilters_.end() && isOfFamily(*position); ++position) {
        int const version = (*position)->identifier().version();
        if (version == id.version()) {
            std::ostringstream message;
            message << "Cannot insert filter into the factory :  id " << id << " already exists";
            throw Exception(message.str());
        }
        if (version < id.version())
            break;
    }
    aFilters_.insert(position, f);
}

std::vector<std::shared_ptr<IFilter>> FilterFactory::findMatchingFilters(Identifier const& identifier) const {
    std::vector<std::shared_ptr<IFilter>> matches;
    std::copy_if(aFilters_.begin(), aFilters_.end(), std::back_inserter(matches),
                 FilterEquality(anyDescriptorsOf(identifier)));
    return matches;
}

IFilter const* FilterFactory::find(Identifier const& identifier) const {
    auto const matches = findMatchingFilters(identifier);
    if (matches.empty())
        return nullptr;

    auto const hasDescriptors = [](IODataDescriptors const& descriptors) {
        return [&descriptors](std::shared_ptr<IFilter> const& match) {
            return match->identifier().ioDataDescriptors() == descriptors;
        };
    };
    if (identifier.ioDataDescriptors().isInitialized()) {
        auto const match =
            std::find_if(matches.begin(), matches.end(), hasDescriptors(identifier.ioDataDescriptors()));
        return match != matches.end() ? match->get() : nullptr;
    }
    auto const& firstDescriptors = matches.front()->identifier().ioDataDescriptors();
    bool const isUnambiguous = std::all_of(matches.begin(), matches.end(), hasDescriptors(firstDescriptors));
    return isUnambiguous ? matches.front().get() : nullptr;
}

IFilter const* FilterFactory::prototype(Identifier const& identifier) const {
    IFilter const* pPrototype = find(identifier);
    ORVO_ENFORCE(pPrototype);
    return pPrototype;
}

std::shared_ptr<IFilter> FilterFactory::create(Identifier const& identifier) {
    auto const* pPrototypeFilter = dynamic_cast<Internal::Filter const*>(prototype(identifier));
    ORVO_CHECK(pPrototypeFilter != nullptr, "pPrototypeFilter");
    pPrototypeFilter->initialize();
    return const_cast<Internal::Filter*>(pPrototypeFilter)->clone();
}

std::shared_ptr<IFilter> FilterFactory::remove(Identifier const& identifier) {
    auto const iter = std::find_if(aFilters_.begin(), aFilters_.end(), FilterEquality(identifier));
    ORVO_CHECK(iter != aFilters_.end());
    std::shared_ptr<IFilter> removed = *iter;
    aFilters_.erase(iter);
    return removed;
}

void FilterFactory::removeAll() { aFilters_.clear(); }

IFilterIterator FilterFactory::prototypes() { return {aFilters_.begin(), aFilters_.end()}; }

IFilterConstIterator FilterFactory::prototypes() const { return {aFilters_.begin(), aFilters_.end()}; }

std::size_t FilterFactory::numberOfPrototypes() const { return aFilters_.size(); }

} // namespace ORVO::FilterGraph
