#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/DataItemBase.h"

#include <string>

namespace ORVO::FilterGraph {

template <class T>
class MetadataItem;

/// A named value that describes a filter or a parameter, without its type. `as<T>()` gives the typed item:
///
///     if (MetadataItemBase const* text = parameter->metadataItem("Description"))
///         std::cout << text->as<std::string>().value();
///
/// Threads: immutable; any thread.
class ORVO_API MetadataItemBase : public DataItemBase {
public:
    ~MetadataItemBase() override;

    /// A copy, which the caller owns.
    virtual MetadataItemBase* clone() const = 0;

    /// The typed item; include `orvo/filter_graph/impl/MetadataItem.h` to use it.
    /// @throws InternalException "Data type retrieved must match metadata item exactly" if `T` is not the
    /// type.
    template <class T>
    MetadataItem<T> const& as() const;

protected:
    MetadataItemBase(std::string const& name, teType type);

private:
    void checkType(teType type) const;
};

} // namespace ORVO::FilterGraph
