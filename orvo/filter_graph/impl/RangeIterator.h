#pragma once

#include "orvo/core/Check.h"

#include <iterator>
#include <memory>
#include <type_traits>
#include <vector>

namespace ORVO::FilterGraph {

class IFilter;
class Input;
class MetadataItemBase;
class ParameterBase;

/// A range over a vector together with a position in it: what filters hand out to list their inputs,
/// parameters and metadata, and the factory to list its prototypes. `T` is the iterator type of the vector.
///
/// Either walk it by hand, which ends when `isValid()` is false, or in a range-based loop:
///
///     for (auto input = filter->inputs(); input.isValid(); ++input)
///         std::cout << input->name();
///     for (Input* input : filter->inputs())
///         std::cout << input->name();
///
/// A range is a view: it becomes invalid with the next insertion into or removal from what it looks at.
///
/// Threads: one at a time, together with the object that gave it.
template <class T>
class RangeIterator {
public:
    using value_type = typename std::iterator_traits<T>::value_type;

    /// An empty range.
    RangeIterator() = default;

    /// The range from `first` up to, and without, `last`, at its first element.
    RangeIterator(T first, T last) : iFirst_(first), iLast_(last), iCurrent_(first) {}

    /// The const form from the plain form, at its first element.
    template <class Other, std::enable_if_t<std::is_convertible_v<Other, T>, int> = 0>
    RangeIterator(RangeIterator<Other> const& other) : RangeIterator(T(other.begin()), T(other.end())) {}

    /// The first element, as an iterator of the vector.
    T begin() const { return iFirst_; }

    /// One past the last element, as an iterator of the vector.
    T end() const { return iLast_; }

    /// True while the position is on an element.
    bool isValid() const { return iCurrent_ != iLast_; }

    /// The element by value, or a null value past the end.
    value_type operator*() const { return isValid() ? *iCurrent_ : value_type(); }

    /// The element, which is a pointer itself; null past the end.
    value_type operator->() const { return **this; }

    /// Moves to the next element.
    /// @throws InternalException "iCurrent_ != iLast_" if the position is past the end already.
    RangeIterator& operator++() {
        next();
        return *this;
    }

protected:
    bool isDone() const { return !isValid(); }

    void next() {
        ORVO_CHECK(iCurrent_ != iLast_);
        ++iCurrent_;
    }

    void rewind() { iCurrent_ = iFirst_; }

private:
    T iFirst_{};
    T iLast_{};
    T iCurrent_{};
};

using InputIterator = RangeIterator<std::vector<Input*>::iterator>;
using InputConstIterator = RangeIterator<std::vector<Input*>::const_iterator>;
using ParameterIterator = RangeIterator<std::vector<ParameterBase*>::iterator>;
using ParameterConstIterator = RangeIterator<std::vector<ParameterBase*>::const_iterator>;
using MetadataIterator = RangeIterator<std::vector<MetadataItemBase const*>::iterator>;
using MetadataConstIterator = RangeIterator<std::vector<MetadataItemBase const*>::const_iterator>;
using IFilterIterator = RangeIterator<std::vector<std::shared_ptr<IFilter>>::iterator>;
using IFilterConstIterator = RangeIterator<std::vector<std::shared_ptr<IFilter>>::const_iterator>;

} // namespace ORVO::FilterGraph
