#pragma once

#include "orvo/colour_engine/internal/ApplyShaper.h"
#include "orvo/colour_engine/internal/ApplyStages.h"
#include "orvo/core/Export.h"

#include <cstdint>
#include <memory>
#include <optional>

namespace ORVO {
struct _t_Vantle_PackingSpec;
}

namespace ORVO::ColourEngine::Internal {

class ResolvedTransform;

/// Applies a transform to pixels in memory: what the engine's `ApplyGeneral` runs. One is made for each
/// transform, on its first use, and shared by all threads from then on.
///
/// Results are the same, bit for bit, for every instruction set and for any division of the pixels into
/// calls.
///
/// Threads: any, at once.
class ORVO_API Applier {
public:
    explicit Applier(std::shared_ptr<ResolvedTransform const> spTransform);
    ~Applier();

    Applier(Applier const&) = delete;
    Applier& operator=(Applier const&) = delete;

    /// Transforms rows x columns pixels. False, with nothing written, where a record's space, channels or
    /// bytes are none that the record's description states, or where one of its planes has no memory. Samples
    /// of 16 bits above 32768 count as 32768. A grey source counts as equal parts of the three channels, a
    /// grey destination receives the green one. Source and destination may be the same memory, packed alike.
    /// Throws std::bad_alloc.
    bool apply(_t_Vantle_PackingSpec const& source, _t_Vantle_PackingSpec const& destination,
               std::uint32_t rows, std::uint32_t columns) const;

private:
    std::shared_ptr<ResolvedTransform const> spTransform_;
    // One of the two.
    std::optional<ApplyShaper> oShaper_;
    std::optional<ApplyStages> oStages_;
};

} // namespace ORVO::ColourEngine::Internal
