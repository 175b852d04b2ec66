#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/RangeIterator.h"

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

namespace ORVO::DataFlow {
class ParameterBase;
}

namespace ORVO::FilterGraph::Internal {

/// The parameters of a filter in the order of their insertion, each name once. It does not own them until
/// `deleteAll`.
///
/// Threads: as `IFilter`.
class ORVO_API ParameterSet {
public:
    /// Predicate that accepts the parameters of one name.
    class ORVO_API NameEquals {
    public:
        explicit NameEquals(std::string const& name);
        virtual ~NameEquals();
        virtual bool operator()(ParameterBase const* pParameter) const;

    private:
        std::string name_;
    };

    ParameterSet();
    virtual ~ParameterSet();

    ParameterSet(ParameterSet const&) = delete;
    ParameterSet& operator=(ParameterSet const&) = delete;

    /// Appends a parameter.
    /// @throws InternalException "Enforce pParameter != NULL" for null, "!iParameter" if its name is there
    /// already.
    void insert(ParameterBase* pParameter);

    /// Takes the first entry of this pointer out of the list without deleting it; one that is not there is
    /// ignored.
    void remove(ParameterBase* pParameter);

    /// The first parameter of that name, or null.
    ParameterBase* parameter(std::string const& name);
    ParameterBase const* parameter(std::string const& name) const;

    /// All parameters; valid until the next insertion or removal.
    ParameterIterator parameters();
    ParameterConstIterator parameters() const;

    std::size_t size() const { return aParameters_.size(); }

    /// Forgets all parameters.
    void clear();

    /// Deletes all parameters and forgets them.
    void deleteAll();

    /// A client's parameter with the name and the value of a node's parameter, and the metadata items "Name"
    /// and "Description" (unless empty), "Default Value", and for an interval "Minimum Value" and "Maximum
    /// Value". Null if the type has no client's form. The caller owns it.
    /// @throws InternalException "Enforce source != NULL" for null.
    static ParameterBase* createParameterFromDataFlow(DataFlow::ParameterBase const* source);

    /// The parameter of the data-flow layer inside a client's parameter.
    static std::shared_ptr<DataFlow::ParameterBase> const& getDataPtr(ParameterBase& parameter);
    static std::shared_ptr<DataFlow::ParameterBase> const& getDataPtr(ParameterBase const& parameter);

    /// Gives a client's parameter the value of a data-flow parameter.
    /// @throws InternalException "isOfType<T>()" if the types differ.
    static void setValue(ParameterBase& parameter, DataFlow::ParameterBase const& source);

private:
    std::vector<ParameterBase*> aParameters_;
};

} // namespace ORVO::FilterGraph::Internal
