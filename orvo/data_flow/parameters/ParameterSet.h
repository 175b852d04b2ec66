#pragma once

#include "orvo/core/Export.h"

#include <cstddef>
#include <iosfwd>
#include <memory>
#include <string>
#include <vector>

namespace ORVO::DataFlow {

class ParameterBase;

/// An ordered list of parameters, found by number or name. Names may repeat; the first one is found.
///
/// Elements are shared with whoever inserted them; copying the set clones them, so that a copy is
/// independent.
///
/// Threads: one at a time.
class ORVO_API ParameterSet {
public:
    using container = std::vector<std::shared_ptr<ParameterBase>>;
    using iterator = container::iterator;
    using const_iterator = container::const_iterator;

    /// An empty set.
    ParameterSet();

    /// Clones every element of `oOther`.
    ParameterSet(ParameterSet const& oOther);

    /// Replaces the elements by clones of those of `oOther`. If a clone throws, the set stays as it was.
    ParameterSet& operator=(ParameterSet const& oOther);

    virtual ~ParameterSet();

    /// Appends the parameter itself, which is shared from now on. Throws `InternalException`
    /// "Enforce spParameter.get() != NULL".
    void insert(std::shared_ptr<ParameterBase> spParameter);

    /// Appends the parameter, wherever the position points, and returns where it stands. The same failure.
    iterator insert(iterator itPosition, std::shared_ptr<ParameterBase> spParameter);

    /// Appends a clone of each element of the range of shared pointers, which may lie in this set. If a clone
    /// throws, the set stays as it was.
    template <typename InputIterator>
    void insert(InputIterator itFirst, InputIterator itLast) {
        insertClones(container(itFirst, itLast));
    }

    /// The elements in the order of insertion. Invalidated by whatever changes the set.
    iterator begin() { return aParameters_.begin(); }
    /// Behind the last element.
    iterator end() { return aParameters_.end(); }
    /// The same of a const set.
    const_iterator begin() const { return aParameters_.begin(); }
    /// Behind the last element.
    const_iterator end() const { return aParameters_.end(); }

    /// The number of elements.
    std::size_t size() const { return aParameters_.size(); }
    /// Lets go of all elements, which live on with their other holders.
    void clear() { aParameters_.clear(); }

    /// Exchanges the elements, which stay shared with their other holders.
    void swap(ParameterSet& oOther) { aParameters_.swap(oOther.aParameters_); }

    /// Element number `iParameter`. Throws `InternalException` "Range error: iParameter < size()".
    std::shared_ptr<ParameterBase> parameter(std::size_t iParameter) const;

    /// The first element of that name, or an empty pointer.
    std::shared_ptr<ParameterBase> getParameter(std::string const& sName) const;

private:
    void insertClones(container const& aOriginals);

    container aParameters_;
};

/// Writes each parameter, followed by "\n".
ORVO_API std::ostream& operator<<(std::ostream& oStream, ParameterSet const& oSet);

/// Clones of the elements of `a`, followed by clones of those of `b`. Elements of the same name are all kept.
ORVO_API ParameterSet combine(ParameterSet const& a, ParameterSet const& b);

} // namespace ORVO::DataFlow
