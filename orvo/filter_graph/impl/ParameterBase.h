#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/DataItemBase.h"
#include "orvo/filter_graph/impl/RangeIterator.h"

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

namespace ORVO::DataFlow {
class ParameterBase;
}

namespace ORVO::FilterGraph {

template <class T>
class Parameter;

namespace Internal {
class ParameterSet;
}

/// A parameter of a filter without its value type: name, type, pin state and metadata. `as<T>()` gives the
/// typed parameter:
///
///     if (ParameterBase* sigma = filter->parameter("rangeSigma"))
///         sigma->as<float>().setValue(0.15f);
///
/// A new value reaches the compiled graph with the next frame; it never makes a processor rebuild anything.
///
/// Metadata items describe the parameter to a host that builds a user interface. Parameters that a filter
/// takes over from an image node carry "Name", "Description", "Default Value" and, where they have bounds,
/// "Minimum Value" and "Maximum Value". Bounds inform; a value outside them is kept as it is.
///
/// Threads: as `IFilter`.
class ORVO_API ParameterBase : public DataItemBase {
public:
    /// Deletes the metadata items.
    ~ParameterBase() override;

    /// An independent parameter with the same name, value and metadata, not pinned. The caller owns it.
    virtual ParameterBase* clone() const = 0;

    /// What the constructor was told: a mark for hosts that pin such parameters of their own accord.
    virtual bool isAutoPin() const;

    /// Takes over the value of another parameter.
    /// @throws InternalException "isOfType<T>()" if it is of another type; the value stays as it was.
    void setValue(ParameterBase const& other);

    /// The pin state is for hosts alone (a parameter that is shown, or exposed at a group's border); the
    /// library keeps it and reads it nowhere. A clone is not pinned.
    void pin() { bPinned_ = true; }

    void unpin() { bPinned_ = false; }

    bool isPinned() const { return bPinned_; }

    /// Appends an item and takes ownership of it; it dies here if it cannot be appended.
    /// @throws InternalException "Enforce pItem != NULL" for null.
    void addMetadataItem(MetadataItemBase const* pItem);

    /// The metadata items in the order in which they were added.
    MetadataIterator metadata();
    MetadataConstIterator metadata() const;

    /// The first metadata item of that name, or null.
    MetadataItemBase const* metadataItem(std::string const& name) const;

    std::size_t getNumberOfMetadataItems() const;

    /// The typed parameter; include `orvo/filter_graph/impl/Parameter.h` to use it.
    /// @throws InternalException "Data type retrieved must match parameter exactly" if `T` is not the type.
    template <class T>
    Parameter<T>& as();
    template <class T>
    Parameter<T> const& as() const;

protected:
    ParameterBase(std::string const& name, teType type, bool autoPin);

    /// The parameter of the data-flow layer that holds the value.
    std::shared_ptr<DataFlow::ParameterBase> const& getData() const { return spData_; }

    void setData(std::shared_ptr<DataFlow::ParameterBase> const& spData) { spData_ = spData; }

    /// Appends clones of all metadata items to another parameter.
    /// @throws InternalException "Enforce pTarget != NULL" for null.
    void cloneMetadata(ParameterBase* pTarget) const;

    /// @throws InternalException "Data type retrieved must match parameter exactly" unless `type` is the
    /// type.
    void checkType(teType type) const;

private:
    friend class Internal::ParameterSet;

    std::shared_ptr<DataFlow::ParameterBase> spData_;
    bool bAutoPin_;
    bool bPinned_ = false;
    std::vector<MetadataItemBase const*> aMetadata_;
};

} // namespace ORVO::FilterGraph
