#pragma once

#include "orvo/colour_engine/internal/HandleTable.h"

#include <cstdint>
#include <memory>
#include <mutex>

namespace ORVO::ColourEngine::Internal {

class Applier;
class Profile;
class ResolvedTransform;

/// What a transform's handle stands for: two profiles, an intent and options. What follows from them is
/// worked out once, when somebody needs it, and shared from then on.
///
/// Threads: any.
class Transform {
public:
    Transform(std::shared_ptr<Profile const> spSource, std::shared_ptr<Profile const> spDestination,
              std::uint32_t intent, std::uint32_t options);
    ~Transform();

    Transform(Transform const&) = delete;
    Transform& operator=(Transform const&) = delete;

    HandleTable::InternKey key() const;

    /// Throws `std::runtime_error` where there is no road between the profiles.
    std::shared_ptr<ResolvedTransform const> resolved() const;
    /// What applies it to pixels, made on first use. Throws as resolved().
    Applier const& applier() const;

    /// How many transforms were resolved since the library was loaded.
    static std::uint64_t nResolved();

private:
    std::shared_ptr<Profile const> spSource_;
    std::shared_ptr<Profile const> spDestination_;
    std::uint32_t intent_;
    std::uint32_t options_;
    mutable std::once_flag oResolvedOnce_;
    mutable std::once_flag oApplierOnce_;
    mutable std::shared_ptr<ResolvedTransform const> spResolved_;
    mutable std::unique_ptr<Applier const> apApplier_;
};

} // namespace ORVO::ColourEngine::Internal
