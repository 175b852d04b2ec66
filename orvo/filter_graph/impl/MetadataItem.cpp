#include "orvo/filter_graph/impl/MetadataItem.h"

#include "orvo/core/memory/TrackedNew.h"

namespace ORVO::FilterGraph {

template <class T>
MetadataItem<T>::MetadataItem(std::string const& name, T const& value)
    : MetadataItemBase(name, DataItemType<T>::value), value_(value) {}

template <class T>
MetadataItem<T>::~MetadataItem() = default;

template <class T>
MetadataItem<T>* MetadataItem<T>::clone() const {
    return ORVO_NEW MetadataItem<T>(name(), value_);
}

#define ORVO_INSTANTIATE_METADATA_ITEM(T) template class MetadataItem<T>;
ORVO_FOR_EACH_DATA_ITEM_TYPE(ORVO_INSTANTIATE_METADATA_ITEM)
#undef ORVO_INSTANTIATE_METADATA_ITEM

} // namespace ORVO::FilterGraph
