#pragma once

#include "orvo/core/Check.h"
#include "orvo/core/Export.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/data_flow/connectors/InputConnector.h"
#include "orvo/data_flow/connectors/OutputConnector.h"
#include "orvo/data_flow/data/ConstDataPointer.h"

#include <string>
#include <typeinfo>

namespace ORVO::DataFlow {

template <typename T>
class OutputTemplate;
template <typename T>
class ConstOutput;
template <typename T>
class Output;

/// What the inputs for data of type T share: the object taken over, and its bookkeeping. T may be any type
/// with a copy constructor. An output whose `datatype()` is T's derives from `OutputTemplate<T>`.
///
/// Threads: as stated for `Connector`.
template <typename T>
class ORVO_API InputTemplate : public InputConnector {
public:
    /// An empty, unconnected input named `sName` of `pNode` (not owned, may be null).
    InputTemplate(std::string const& sName, Node* pNode) : InputConnector(sName, pNode) {}

    /// A copy is empty and unconnected.
    InputTemplate(InputTemplate const& oOther) : InputConnector(oOther) {}

    std::type_info const& datatype() const override { return typeid(T); }

    /// Drops the object, if there is one. Throws `InternalException` "!this->bound()" for a bound input that
    /// owns one.
    void removeData() override {
        if (spData_.get() != nullptr) {
            setData(nullptr);
        }
    }

    /// The same as `removeData`.
    void flushInput() override { removeData(); }

    /// The object, or null. Ownership stays here.
    T const* get() const { return spData_.get(); }
    /// The object's members. Throws `InternalException` "Enforce spData_.get() != NULL" when empty.
    T const* operator->() const { return spData_.operator->(); }
    /// The object. Throws `InternalException` "Enforce spData_.get() != NULL" when empty.
    T const& operator*() const { return *spData_; }

    /// Takes over `pData` with releasable ownership; null empties the input. Throws `InternalException`
    /// "!this->bound()" for a bound input, and `pData` stays the caller's.
    void setData(T* pData) {
        ORVO_CHECK(!this->bound());
        spData_.setData(pData);
        this->setDataPtr(spData_.get());
    }

    /// Shares the object of `spData`. Throws `InternalException` "!this->bound()" for a bound input.
    void setData(ConstDataPointer<T> const& spData) {
        ORVO_CHECK(!this->bound());
        spData_ = spData;
        this->setDataPtr(spData_.get());
    }

    /// Gives the object up to the caller, who frees it with `ORVODeleter<T>`; null when empty. `data()` keeps
    /// the address. Throws `InternalException` "Enforce deleter != NULL" if the object is held with regular
    /// or no ownership.
    T* releaseData() {
        T* const pData = spData_.get();
        if (pData != nullptr) {
            spData_.release();
        }
        return pData;
    }

protected:
    /// The connected output as what it is for this data type, never null. Not owned. Throws
    /// `InternalException` "Enforce pConnectedOutput_ != NULL" when unconnected.
    OutputTemplate<T>* typedOutput() const {
        OutputConnector* const pOutput = this->connectedOutput();
        ORVO_ENFORCE(pOutput, "pConnectedOutput_");
        // The types were compared when the two were connected.
        return static_cast<OutputTemplate<T>*>(pOutput);
    }

    /// Stores in `oDestination` what this input holds, and leaves the input empty.
    void moveDataTo(ConstDataPointer<T>& oDestination) {
        spData_.moveTo(oDestination);
        this->setDataPtr(nullptr);
    }

    /// The same with `ConstDataPointer::moveToMutable`.
    void moveDataToMutable(ConstDataPointer<T>& oDestination) {
        spData_.moveToMutable(oDestination);
        this->setDataPtr(nullptr);
    }

    ConstDataPointer<T> spData_;

private:
    friend class ConstOutput<T>;
    friend class Output<T>;
};

/// An input whose node only reads the object, which other holders may share.
///
/// Threads: as stated for `Connector`.
template <typename T>
class ORVO_API ConstInput : public InputTemplate<T> {
public:
    using InputTemplate<T>::InputTemplate;

    /// Takes the object over from the connected output, or shares or copies it: `OutputTemplate<T>::moveTo`.
    void fetchInput() override { this->typedOutput()->moveTo(*this); }

    /// Shares the object of `oOutput`. Throws `InternalException` "!this->bound()" for a bound input.
    ConstInput& operator=(ConstOutput<T> const& oOutput) {
        this->setData(oOutput.dataPointer());
        return *this;
    }

    /// Hands the object on to `oDestination`; the input is empty afterwards.
    void moveTo(ConstDataPointer<T>& oDestination) { this->moveDataTo(oDestination); }

    /// Hands the object on to an output of the node; the input is empty afterwards.
    void moveTo(ConstOutput<T>& oOutput) {
        this->moveDataTo(oOutput.spData_);
        oOutput.setDataPtr(oOutput.get());
    }

    /// Hands on an object that the node may write: the object itself if nobody shares it, else a copy. The
    /// input is empty afterwards.
    void moveTo(Output<T>& oOutput) {
        this->moveDataToMutable(oOutput.spData_);
        oOutput.setDataPtr(oOutput.get());
    }
};

/// An input whose node may change the object it receives: nobody else sees that object.
///
/// Threads: as stated for `Connector`.
template <typename T>
class ORVO_API Input : public InputTemplate<T> {
public:
    using InputTemplate<T>::InputTemplate;
    using InputTemplate<T>::get;
    using InputTemplate<T>::operator->;
    using InputTemplate<T>::operator*;

    /// Takes the object over from the connected output, or copies it: `OutputTemplate<T>::moveTo`.
    void fetchInput() override { this->typedOutput()->moveTo(*this); }

    /// The object, or null. Ownership stays here.
    T* get() { return this->spData_.get(); }
    /// The object's members. Throws `InternalException` "Enforce spData_.get() != NULL" when empty.
    T* operator->() { return this->spData_.operator->(); }
    /// The object. Throws `InternalException` "Enforce spData_.get() != NULL" when empty.
    T& operator*() { return *this->spData_; }

    /// Takes a copy of the object of `oOutput`. Throws `InternalException` "!this->bound()" for a bound input
    /// and "Enforce spData_.get() != NULL" if the output is empty.
    Input& operator=(ConstOutput<T> const& oOutput) {
        ORVO_CHECK(!this->bound());
        this->setData(ORVO_NEW T(*oOutput));
        return *this;
    }

    /// Hands the object on to `oDestination`; the input is empty afterwards.
    void moveTo(ConstDataPointer<T>& oDestination) { this->moveDataTo(oDestination); }

    /// Hands the object on to an output of the node; the input is empty afterwards.
    void moveTo(ConstOutput<T>& oOutput) {
        this->moveDataTo(oOutput.spData_);
        oOutput.setDataPtr(oOutput.get());
    }

    /// Hands the object on to an output of the node; the input is empty afterwards.
    void moveTo(Output<T>& oOutput) {
        this->moveDataTo(oOutput.spData_);
        oOutput.setDataPtr(oOutput.get());
    }
};

} // namespace ORVO::DataFlow

// The two families are written in terms of each other.
#include "orvo/data_flow/connectors/Outputs.h"
