#pragma once

#include <memory>

#include "orvo/ogl/NativeContext.h"

namespace ORVO::OGL::Internal {

class ShareGroup;

/// What the library's own contexts have in common: the native context, and a sync object by which any context
/// of its share group is told from others. Integer names would not do: unrelated contexts have the same ones.
///
/// Threads: as OGL::Context.
class ContextRecord {
public:
    /// Names a context that is current on the calling thread, and makes the sync object in it, where the
    /// driver has them (otherwise only the context itself counts as sharing). Throws ExceptionOGL "No OpenGL
    /// context is current", or if the sync object cannot be made.
    explicit ContextRecord(NativeContext const& native);
    /// Deletes the sync object, and what waits to be deleted in its share group: in the current context if
    /// that shares, else with this context made current for the moment; if the driver refuses, they are left
    /// to the group's end.
    ~ContextRecord();
    ContextRecord(ContextRecord const&) = delete;
    ContextRecord& operator=(ContextRecord const&) = delete;

    NativeContext const& native() const noexcept { return oNative_; }

    /// Makes the context current, and deletes what could only be deleted here.
    void makeCurrent() const;
    bool isSharingWithCurrentContext() const noexcept;

private:
    NativeContext oNative_;
    void* pSync_ = nullptr;
    /// Where objects leave the names that they cannot delete.
    std::shared_ptr<ShareGroup const> spGroup_;
};

/// A context that has a record: sharing contexts are made from it without making it current.
class RecordHolder {
public:
    RecordHolder(RecordHolder const&) = delete;
    RecordHolder& operator=(RecordHolder const&) = delete;
    virtual ContextRecord const& record() const noexcept = 0;

protected:
    RecordHolder() noexcept = default;
    virtual ~RecordHolder() = default;
};

} // namespace ORVO::OGL::Internal
