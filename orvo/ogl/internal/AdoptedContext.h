#pragma once

#include "orvo/ogl/Context.h"
#include "orvo/ogl/internal/ContextRecord.h"

namespace ORVO::OGL::Internal {

/// A host's context, taken over as a handle while it was current.
///
/// Threads: as OGL::Context.
class AdoptedContext final : public Context, public RecordHolder {
public:
    /// Takes the calling thread's current context; throws ExceptionOGL if there is none.
    AdoptedContext();
    ~AdoptedContext() override;

    void makeCurrent() const override;
    bool isSharingWithCurrentContext() const override;
    ContextRecord const& record() const noexcept override;

private:
    ContextRecord oRecord_;
};

} // namespace ORVO::OGL::Internal
