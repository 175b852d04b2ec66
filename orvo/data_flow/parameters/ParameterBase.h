#pragma once

#include "orvo/core/Export.h"

#include <iosfwd>
#include <memory>
#include <string>
#include <typeinfo>

namespace ORVO::DataFlow {

class InputConnector;
class Node;
class ParameterVisitorBase;

/// A tunable value of a node, seen without its type: name, description, and three flags that tell three
/// independent observers whether the value changed.
///
/// All three flags are true at construction, and every change of the value sets all three. Each goes false
/// through its own `setClean` call alone: the plain flag belongs to `Node::hasDirtyParameters`, the
/// simple-caching flag to the dirty pass of a frame (`Node::updateDirtyState`), the glyphcast flag to the
/// client.
///
/// Threads: written between frames by the thread that owns the graph, read by any thread during a frame. A
/// parameter that an input feeds is written during a frame, under the lock of the input's node.
class ORVO_API ParameterBase {
public:
    virtual ~ParameterBase();

    /// A deep copy of the same dynamic type, with all flags set.
    virtual std::shared_ptr<ParameterBase> clone() = 0;

    /// The type of the value.
    virtual std::type_info const& datatype() const = 0;

    /// Whether the parameter has bounds (`IntervalParameter`): false here.
    virtual bool isInterval() const;

    /// A new input named after the parameter, for `pNode`, that sets the parameter whenever it fetches.
    /// Belongs to the caller, who frees it with `ORVODeleter<InputConnector>`; it fetches only while the
    /// parameter lives.
    virtual InputConnector* createProxyConnector(Node* pNode) = 0;

    /// Writes name, " ", description, " ", value.
    virtual void write(std::ostream& oStream) const = 0;

    /// Takes the value of `oSource`. Throws `InternalException` "isOfType<T>()" if its type is another.
    virtual void setValueFromParameter(ParameterBase const& oSource) = 0;

    /// Sets the value to the default; no flag is touched if it is that already.
    virtual void resetToDefaultValue() = 0;

    /// Calls the overload of `pVisitor` for the type of the value. Throws `InternalException`
    /// "Enforce pVisitor != NULL".
    virtual void visit(ParameterVisitorBase* pVisitor) = 0;

    /// `clone()` under another name.
    std::shared_ptr<ParameterBase> clone(std::string const& sNewName);

    /// The name, the key of the parameter in a set; unique only by convention.
    std::string name() const { return sName_; }

    /// Free text for people.
    std::string description() const { return sDescription_; }

    /// The name of `datatype()` as the compiler writes it.
    std::string data_type_name() const;

    /// Whether the value changed since `setClean`.
    bool isDirty() const { return bDirty_; }
    /// Clears the plain flag alone.
    void setClean() { bDirty_ = false; }

    /// Whether the value changed since `setCleanSimpleCaching`.
    bool isDirtySimpleCaching() const { return bDirtySimpleCaching_; }
    /// Clears the simple-caching flag alone.
    void setCleanSimpleCaching() { bDirtySimpleCaching_ = false; }

    /// Whether the value changed since `setCleanGlyphcast`.
    bool isDirtyGlyphcast() const { return bDirtyGlyphcast_; }
    /// Clears the glyphcast flag alone.
    void setCleanGlyphcast() { bDirtyGlyphcast_ = false; }

protected:
    /// A parameter with all flags set.
    ParameterBase(std::string const& sName, std::string const& sDescription);

    /// Copies take the three flags, the name and the description over.
    ParameterBase(ParameterBase const& oOther);
    ParameterBase& operator=(ParameterBase const& oOther);

    /// Sets all three flags: the value has changed.
    void setDirty();

private:
    bool bDirty_ = true;
    bool bDirtySimpleCaching_ = true;
    bool bDirtyGlyphcast_ = true;
    std::string sName_;
    std::string sDescription_;
};

/// Writes the parameter with `ParameterBase::write`.
ORVO_API std::ostream& operator<<(std::ostream& oStream, ParameterBase const& oParameter);

} // namespace ORVO::DataFlow
