#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/Identifier.h"
#include "orvo/filter_graph/impl/RangeIterator.h"

#include <cstddef>
#include <memory>
#include <vector>

namespace ORVO::FilterGraph {

class IFilter;
class Library;

/// The collection of filter prototypes, one for the whole process, from which a host creates its filters:
///
///     FilterFactory* factory = FilterFactory::Instance();
///     IFilter::Identifier const anyVersion("FastBilateralBlur", "Motion Loft", "Norvane Works");
///     std::shared_ptr<IFilter> blur = factory->create(anyVersion);
///
/// The factory stores a clone of each filter that it is given and hands out clones of what it stores, so
/// neither the caller's filters nor the prototypes are ever part of a graph. Versions of one filter stand
/// next to each other, higher versions first.
///
/// Threads: no locks. It is used from the host's set-up path; a host that inserts and creates from several
/// threads must serialise these calls itself.
class ORVO_API FilterFactory {
public:
    /// The factory, which lives from `Library::initialize` to `Library::terminate`.
    /// @throws InternalException "isInitialized()" outside that time.
    static FilterFactory* Instance();

    FilterFactory(FilterFactory const&) = delete;
    FilterFactory& operator=(FilterFactory const&) = delete;

    /// Stores a clone of `prototype` and returns the clone's identifier.
    /// @throws Exception if the identifier has no version, or if that version is there already.
    /// @throws InternalException "pPrototypeFilter" if `prototype` is not a filter of this library.
    Identifier insert(IFilter const& prototype);

    /// Takes the first prototype that matches `identifier` out of the factory. Filters created from it live
    /// on.
    /// @throws InternalException "iter != aFilters_.end()" if none matches.
    std::shared_ptr<IFilter> remove(Identifier const& identifier);

    /// Takes all prototypes out of the factory.
    void removeAll();

    /// The prototype that `identifier` means, or null. Without a version it means the highest one. The
    /// descriptors decide where they are initialised; where they are not, and those of the matches differ,
    /// the query is ambiguous and the answer is null.
    IFilter const* find(Identifier const& identifier) const;

    /// As `find`, but never null.
    /// @throws InternalException "Enforce pPrototype != NULL" where `find` gives null.
    IFilter const* prototype(Identifier const& identifier) const;

    /// A new, unconnected filter: a clone of the prototype that `find` gives. The prototype finishes its own
    /// set-up the first time.
    /// @throws InternalException "Enforce pPrototype != NULL" where `find` gives null.
    std::shared_ptr<IFilter> create(Identifier const& identifier);

    /// All prototypes; valid until the next insertion or removal.
    IFilterIterator prototypes();
    IFilterConstIterator prototypes() const;

    /// The number of prototypes, each version counted.
    std::size_t numberOfPrototypes() const;

private:
    friend class Library;

    FilterFactory() = default;
    ~FilterFactory() = default;

    static void create();
    static void destroy();
    static bool isInitialized();

    std::vector<std::shared_ptr<IFilter>> findMatchingFilters(Identifier const& identifier) const;
    void find_position_and_insert(std::shared_ptr<IFilter> const& f);

    std::vector<std::shared_ptr<IFilter>> aFilters_;
};

} // namespace ORVO::FilterGraph
