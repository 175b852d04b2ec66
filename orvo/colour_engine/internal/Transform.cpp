#include "orvo/colour_engine/internal/Transform.h"

#include "orvo/colour_engine/internal/Applier.h"
#include "orvo/colour_engine/internal/Profile.h"
#include "orvo/colour_engine/internal/TransformResolver.h"

#include <atomic>
#include <utility>

namespace ORVO::ColourEngine::Internal {

namespace {
std::atomic<std::uint64_t> nTransformsResolved{0};
} // namespace

Transform::Transform(std::shared_ptr<Profile const> spSource, std::shared_ptr<Profile const> spDestination,
                     std::uint32_t intent, std::uint32_t options)
    : spSource_(std::move(spSource)),
      spDestination_(std::move(spDestination)),
      intent_(intent),
      options_(options) {}

Transform::~Transform() = default;

HandleTable::InternKey Transform::key() const {
    return {spSource_->serial(), spDestination_->serial(), intent_, options_};
}

std::shared_ptr<ResolvedTransform const> Transform::resolved() const {
    std::call_once(oResolvedOnce_, [this] {
        spResolved_ = resolveTransform(*spSource_, *spDestination_, intent_, options_);
        ++nTransformsResolved;
    });
    return spResolved_;
}

Applier const& Transform::applier() const {
    std::call_once(oApplierOnce_, [this] { apApplier_ = std::make_unique<Applier const>(resolved()); });
    return *apApplier_;
}

std::uint64_t Transform::nResolved() { return nTransformsResolved; }

} // namespace ORVO::ColourEngine::Internal
