#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/DataItemType.h"
#include "orvo/filter_graph/impl/MetadataItemBase.h"

#include <string>

namespace ORVO::FilterGraph {

/// A metadata item with a value of type `T`, one of the types of `DataItemType`.
///
/// Threads: immutable; any thread.
template <class T>
class ORVO_API MetadataItem : public MetadataItemBase {
public:
    MetadataItem(std::string const& name, T const& value);
    ~MetadataItem() override;

    T const& value() const { return value_; }

    MetadataItem<T>* clone() const override;

private:
    T value_;
};

template <class T>
MetadataItem<T> const& MetadataItemBase::as() const {
    checkType(DataItemType<T>::value);
    return static_cast<MetadataItem<T> const&>(*this);
}

// The instances are made once, in the library. They name their visibility themselves, which value types
// without one of their own would otherwise take away.
#define ORVO_EXTERN_METADATA_ITEM(T) extern template class ORVO_API MetadataItem<T>;
ORVO_FOR_EACH_DATA_ITEM_TYPE(ORVO_EXTERN_METADATA_ITEM)
#undef ORVO_EXTERN_METADATA_ITEM

} // namespace ORVO::FilterGraph
