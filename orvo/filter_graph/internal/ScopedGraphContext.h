#pragma once

#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/ScopedContextWrapper.h"

#include <memory>
#include <optional>

namespace ORVO::FilterGraph::Internal {

/// Makes a graph's own context current for a scope, where there is one: what nodes hold of OpenGL is made and
/// freed in it.
class ScopedGraphContext {
public:
    explicit ScopedGraphContext(std::shared_ptr<OGL::ContextOffscreen> const& spContext) {
        if (spContext) {
            oSaved_.emplace();
            spContext->makeCurrent();
        }
    }

    /// Makes the former context current before the end of the scope. Throws OGL::ExceptionOGL if the driver
    /// refuses.
    void restore() {
        if (oSaved_) {
            oSaved_->restore();
        }
    }

private:
    std::optional<OGL::ScopedContextWrapper> oSaved_;
};

} // namespace ORVO::FilterGraph::Internal
