#pragma once

#include "orvo/core/Check.h"
#include "orvo/core/Export.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/OutputConnector.h"
#include "orvo/data_flow/data/ConstDataPointer.h"

#include <new>
#include <string>
#include <typeinfo>
#include <utility>

namespace ORVO::DataFlow {

/// What the outputs for data of type T share: the object that waits for its consumer, and its bookkeeping. T
/// may be any type with a copy constructor.
///
/// Threads: as stated for `Connector`.
template <typename T>
class ORVO_API OutputTemplate : public OutputConnector {
public:
    /// An empty, unconnected output named `sName` of `pNode` (not owned, may be null).
    OutputTemplate(std::string const& sName, Node* pNode) : OutputConnector(sName, pNode) {}

    /// A copy is empty and unconnected.
    OutputTemplate(OutputTemplate const& oOther) : OutputConnector(oOther) {}

    std::type_info const& datatype() const override { return typeid(T); }

    /// Makes the output refer to the client's object at `pData`, a T, without owning it. The object must
    /// outlive the output's use, and is written by nodes: it must not be a const object.
    void setBoundData(void const* pData) override {
        spData_.setDataWithNoOwnership(const_cast<T*>(static_cast<T const*>(pData)));
        OutputConnector::setBoundData(pData);
    }

    /// Drops the object; a bound output keeps it.
    void flushOutput() override {
        if (!this->bound()) {
            spData_.reset();
            this->setDataPtr(nullptr);
        }
    }

    /// Hands the object to `oInput`, by the rules of the derived class. This class has none: throws
    /// `InternalException` "0".
    virtual void moveTo(Input<T>& oInput);

    /// Hands the object to `oInput`, by the rules of the derived class. This class has none: throws
    /// `InternalException` "0".
    virtual void moveTo(ConstInput<T>& oInput);

    /// Takes over `pData` with releasable ownership; null empties the output.
    void setData(T* pData) {
        spData_.setData(pData);
        this->setDataPtr(spData_.get());
    }

    /// Shares the object of `spData`.
    void setData(ConstDataPointer<T> const& spData) {
        spData_ = spData;
        this->setDataPtr(spData_.get());
    }

    /// The object, or null. Ownership stays here.
    T const* get() const { return spData_.get(); }
    /// The object's members. Throws `InternalException` "Enforce spData_.get() != NULL" when empty.
    T const* operator->() const { return spData_.operator->(); }
    /// The object. Throws `InternalException` "Enforce spData_.get() != NULL" when empty.
    T const& operator*() const { return *spData_; }

    /// The object with its ownership, to be shared.
    ConstDataPointer<T> const& dataPointer() const { return spData_; }

protected:
    /// Gives the object to the input's pointer `oDestination` for good; this output is empty afterwards.
    void giveTo(ConstDataPointer<T>& oDestination) {
        spData_.moveTo(oDestination);
        this->setDataPtr(nullptr);
    }

    ConstDataPointer<T> spData_;

private:
    friend class ConstInput<T>;
    friend class Input<T>;
};

/// An output whose object no consumer may change, so that several can share it.
///
/// What `moveTo` does depends on `keepsCache`: where the output keeps its object, a `ConstInput` shares it
/// and an `Input` receives a copy; where it does not, a `ConstInput` receives the object and an `Input`
/// receives the object if nobody else holds it, else a copy.
///
/// Threads: as stated for `Connector`.
template <typename T>
class ORVO_API ConstOutput : public OutputTemplate<T> {
public:
    using OutputTemplate<T>::OutputTemplate;

    /// Hands the object to an input that may change it. Throws `InternalException` "!this->bound()" if this
    /// output is bound; where it keeps its object also if the input is bound, and "Enforce spData_.get() !=
    /// NULL" if there is no object to copy.
    void moveTo(Input<T>& oInput) override;

    /// Hands the object to an input that only reads it. Throws `InternalException` "!this->bound()" if this
    /// output is bound, and where it keeps its object also if the input is bound.
    void moveTo(ConstInput<T>& oInput) override;

    /// Shares the object of `spData`.
    ConstOutput& operator=(ConstDataPointer<T> const& spData) {
        this->setData(spData);
        return *this;
    }

    /// Shares the object of an input of the node.
    ConstOutput& operator=(ConstInput<T> const& oInput) {
        this->setData(oInput.spData_);
        return *this;
    }

    /// Shares the object of another output.
    void cloneDataFrom(ConstOutput const& oOther) { this->setData(oOther.spData_); }
};

/// An output whose object the node may write through the output. Consumers never share it: where the output
/// keeps its object (`keepsCache`) they receive a copy, else the object itself.
///
/// Threads: as stated for `Connector`.
template <typename T>
class ORVO_API Output : public OutputTemplate<T> {
public:
    using OutputTemplate<T>::OutputTemplate;
    using OutputTemplate<T>::get;
    using OutputTemplate<T>::operator->;
    using OutputTemplate<T>::operator*;

    /// Hands the object to an input. Throws `InternalException` "!this->bound()" if this output is bound;
    /// where it keeps its object also if the input is bound, and "Enforce spData_.get() != NULL" if there is
    /// no object to copy.
    void moveTo(Input<T>& oInput) override { handTo(oInput); }

    /// Hands the object to an input, with the same failures.
    void moveTo(ConstInput<T>& oInput) override { handTo(oInput); }

    /// The object, or null. Ownership stays here.
    T* get() { return this->spData_.get(); }
    /// The object's members. Throws `InternalException` "Enforce spData_.get() != NULL" when empty.
    T* operator->() { return this->spData_.operator->(); }
    /// The object. Throws `InternalException` "Enforce spData_.get() != NULL" when empty.
    T& operator*() { return *this->spData_; }

    /// Takes a copy of the object of `spSource`. A bound output keeps its client's object at its address and
    /// gives it the new value: the object is destroyed and constructed again there; the copy is made before,
    /// so that a failing copy leaves the old value. If T has no move constructor that never throws, its
    /// constructor must not throw a second time. Throws `InternalException` "Enforce spData_.get() != NULL"
    /// if there is no source object.
    Output& operator=(ConstDataPointer<T> const& spSource) {
        copyFrom(*spSource);
        return *this;
    }

    /// The same from an input of the node.
    Output& operator=(ConstInput<T> const& oInput) {
        copyFrom(*oInput);
        return *this;
    }

private:
    template <typename AnyInput>
    void handTo(AnyInput& oInput);

    void copyFrom(T const& oSource);
};

template <typename T>
void OutputTemplate<T>::moveTo(Input<T>&) {
    ORVO_FAIL("0");
}

template <typename T>
void OutputTemplate<T>::moveTo(ConstInput<T>&) {
    ORVO_FAIL("0");
}

template <typename T>
void ConstOutput<T>::moveTo(Input<T>& oInput) {
    ORVO_CHECK(!this->bound());
    if (this->keepsCache()) {
        oInput = *this;
        return;
    }
    this->spData_.moveToMutable(oInput.spData_);
    oInput.setDataPtr(oInput.get());
    this->setDataPtr(nullptr);
}

template <typename T>
void ConstOutput<T>::moveTo(ConstInput<T>& oInput) {
    ORVO_CHECK(!this->bound());
    if (this->keepsCache()) {
        oInput.setData(this->spData_);
        return;
    }
    this->giveTo(oInput.spData_);
    oInput.setDataPtr(oInput.get());
}

template <typename T>
template <typename AnyInput>
void Output<T>::handTo(AnyInput& oInput) {
    ORVO_CHECK(!this->bound());
    if (this->keepsCache()) {
        ORVO_CHECK(!oInput.bound(), "!this->bound()");
        oInput.setData(ORVO_NEW T(*this->spData_));
        return;
    }
    this->giveTo(oInput.spData_);
    oInput.setDataPtr(oInput.get());
}

template <typename T>
void Output<T>::copyFrom(T const& oSource) {
    if (!this->bound()) {
        this->setData(ORVO_NEW T(oSource));
        return;
    }
    // The client knows the object by its address, which therefore stays.
    T oCopy(oSource);
    T* const pBound = &**this;
    pBound->~T();
    ::new (static_cast<void*>(pBound)) T(std::move(oCopy));
}

} // namespace ORVO::DataFlow
