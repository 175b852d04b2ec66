#pragma once

#include "orvo/core/Export.h"

#include <cstdint>
#include <memory>

namespace ORVO {
struct _t_Vantle_PackingSpec;
}

namespace ORVO::ColourEngine::Internal {

class ResolvedTransform;

/// Applies a transform to pixels in memory: what the engine's `ApplyGeneral` runs. One is made for each
/// transform, on its first use, and shared by all threads from then on.
///
/// Threads: any, at once.
class ORVO_API Applier {
public:
    explicit Applier(std::shared_ptr<ResolvedTransform const> spTransform);
    ~Applier();

    Applier(Applier const&) = delete;
    Applier& operator=(Applier const&) = delete;

    /// Transforms rows x columns pixels. False, with nothing written, where a record's space, channels or
    /// bytes are none that the record's description states. Source and destination may be the same memory.
    bool apply(_t_Vantle_PackingSpec const& source, _t_Vantle_PackingSpec const& destination,
               std::uint32_t rows, std::uint32_t columns) const;

private:
    std::shared_ptr<ResolvedTransform const> spTransform_;
};

} // namespace ORVO::ColourEngine::Internal
