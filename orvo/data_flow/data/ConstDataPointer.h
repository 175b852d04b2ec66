#pragma once

#include "orvo/core/Check.h"
#include "orvo/core/Export.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"

#include <memory>

namespace ORVO::DataFlow {

/// Holds the data object that travels between two nodes, or nothing.
///
/// The object is shared by all copies of the pointer. What happens when the last of them goes is chosen when
/// the object is set: `setData` and `setDataWithReleasableOwnership` free it unless `release` gave it up,
/// `setDataWithRegularOwnership` frees it always, `setDataWithNoOwnership` leaves it alone. Owned objects
/// come from the tracked or the plain `new`. An object must not be set as owned in two pointers that do not
/// share it.
///
/// Constness is passed on: a const pointer gives a const object. T needs a copy constructor where copies are
/// made (`moveToMutable`); it may be incomplete where the pointer is only held.
///
/// Threads: the reference count is atomic, so copies may be held and dropped on any thread; one pointer
/// object is used by one thread at a time.
template <typename T>
class ORVO_API ConstDataPointer {
public:
    /// Holds nothing.
    ConstDataPointer() = default;

    /// Holds `pData` with releasable ownership; null holds nothing.
    explicit ConstDataPointer(T* pData) { setDataWithReleasableOwnership(pData); }

    /// The object, or null. Ownership stays here.
    T const* get() const { return spData_.get(); }
    /// The object, or null. Ownership stays here.
    T* get() { return spData_.get(); }

    /// The object's members. Throws `InternalException` "Enforce spData_.get() != NULL" when empty.
    T const* operator->() const { return &**this; }
    /// The object's members. Throws `InternalException` "Enforce spData_.get() != NULL" when empty.
    T* operator->() { return &**this; }

    /// The object. Throws `InternalException` "Enforce spData_.get() != NULL" when empty.
    T const& operator*() const {
        ORVO_ENFORCE(spData_.get());
        return *spData_;
    }
    /// The object. Throws `InternalException` "Enforce spData_.get() != NULL" when empty.
    T& operator*() {
        ORVO_ENFORCE(spData_.get());
        return *spData_;
    }

    /// Number of pointers that share the object, this one included; 0 when empty.
    long useCount() const { return spData_.use_count(); }

    /// The same as `setDataWithReleasableOwnership`.
    void setData(T* pData) { setDataWithReleasableOwnership(pData); }

    /// Takes over `pData` (null empties the pointer) in a way that `release` can undo. The object held before
    /// is dropped. If memory for the bookkeeping runs out, `pData` is freed, the old object stays, and
    /// `std::bad_alloc` leaves.
    void setDataWithReleasableOwnership(T* pData) { assign(pData, ReleasableDeleter<T>()); }

    /// Takes over `pData` (null empties the pointer) for good. Otherwise like
    /// `setDataWithReleasableOwnership`.
    void setDataWithRegularOwnership(T* pData) { assign(pData, ORVODeleter<T>()); }

    /// Refers to `pData` (null empties the pointer), which stays its owner's and must outlive all copies of
    /// this pointer. The object held before is dropped.
    void setDataWithNoOwnership(T* pData) { assign(pData, NullDeleter()); }

    /// Drops the object and holds nothing.
    void reset() { spData_.reset(); }

    /// Gives the object to `oDestination`, which drops what it held; this pointer is empty afterwards. Moving
    /// to itself does nothing.
    void moveTo(ConstDataPointer& oDestination) {
        if (&oDestination == this) {
            return;
        }
        oDestination.reset();
        oDestination.spData_.swap(spData_);
    }

    /// Gives `oDestination` an object that nobody else can see: the object itself if this pointer is its only
    /// holder, else a copy with releasable ownership. This pointer is empty afterwards; other holders keep
    /// their object untouched. If the copy throws, both pointers stay as they are.
    void moveToMutable(ConstDataPointer& oDestination) {
        if (!spData_ || spData_.use_count() == 1) {
            moveTo(oDestination);
            return;
        }
        oDestination.setDataWithReleasableOwnership(ORVO_NEW T(*spData_));
        if (&oDestination != this) {
            reset();
        }
    }

    /// Gives up ownership: the object survives its last holder and belongs to the caller, who must have read
    /// its address before. This pointer is empty afterwards. Returns whether it was the only holder (true
    /// when empty). Throws `InternalException` "Enforce deleter != NULL", changing nothing, if the object is
    /// held with regular or no ownership.
    bool release() {
        if (!spData_) {
            return true;
        }
        bool const bOnlyHolder = spData_.use_count() == 1;
        releasable().release();
        spData_.reset();
        return bOnlyHolder;
    }

private:
    template <typename Deleter>
    void assign(T* pData, Deleter const& oDeleter) {
        if (pData == nullptr) {
            spData_.reset();
            return;
        }
        std::shared_ptr<T>(pData, oDeleter).swap(spData_);
    }

    ReleasableDeleter<T>& releasable() const {
        auto* const deleter = std::get_deleter<ReleasableDeleter<T>>(spData_);
        ORVO_ENFORCE(deleter);
        return *deleter;
    }

    std::shared_ptr<T> spData_;
};

} // namespace ORVO::DataFlow
