#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/RangeIterator.h"

#include <cstddef>
#include <string>
#include <vector>

namespace ORVO::FilterGraph::Internal {

/// A list of inputs in the order of their insertion: those of a filter, or those that an output feeds. It
/// does not own them.
///
/// Threads: as `IFilter`.
class ORVO_API InputSet {
public:
    /// Predicate that accepts the inputs of one name.
    class ORVO_API NameEquals {
    public:
        explicit NameEquals(std::string const& name);
        virtual ~NameEquals();
        virtual bool operator()(Input const* pInput) const;

    private:
        std::string name_;
    };

    InputSet();
    virtual ~InputSet();

    InputSet(InputSet const&) = delete;
    InputSet& operator=(InputSet const&) = delete;

    /// Appends an input.
    /// @throws InternalException "Enforce pInput != NULL" for null, "aInputs_.end() == iInput" if it is there
    /// already.
    void insert(Input* pInput);

    /// Takes an input out of the list; one that is not there is ignored.
    void remove(Input* pInput);

    /// The first input of that name, or null.
    Input* input(std::string const& name);
    Input const* input(std::string const& name) const;

    /// All inputs; valid until the next insertion or removal.
    InputIterator inputs();
    InputConstIterator inputs() const;

    std::size_t size() const { return aInputs_.size(); }

private:
    std::vector<Input*> aInputs_;
};

} // namespace ORVO::FilterGraph::Internal
