#include "orvo/colour_engine/ProfileRegistry.h"

#include "orvo/colour_engine/internal/Profile.h"
#include "orvo/core/Check.h"

#include <algorithm>
#include <map>
#include <mutex>

namespace ORVO::ColourEngine {

namespace {

using Internal::Profile;

struct Registry {
    std::mutex oLock;
    std::map<std::uint32_t, std::shared_ptr<Profile const>> aBuiltIn; ///< those that were asked for
    std::map<std::uint32_t, std::shared_ptr<Profile const>> aRegistered;
};

Registry& registry() {
    // Never destroyed: a host may drop its last handle in a static destructor.
    static auto* const pRegistry = new Registry;
    return *pRegistry;
}

BuiltInProfile const* builtIn(std::uint32_t code) {
    auto const found = std::find_if(BUILT_IN_PROFILES.begin(), BUILT_IN_PROFILES.end(),
                                    [code](BuiltInProfile const& profile) { return profile.code == code; });
    return found != BUILT_IN_PROFILES.end() ? &*found : nullptr;
}

} // namespace

void registerProfile(std::uint32_t code, void const* pBytes, std::size_t nBytes) {
    ORVO_CHECK_PARAMETER(pBytes != nullptr, "Enforce pBytes != NULL");
    ORVO_CHECK_PARAMETER(builtIn(code) == nullptr, "Profile code is built in");
    {
        std::lock_guard<std::mutex> const lock(registry().oLock);
        auto const found = registry().aRegistered.find(code);
        if (found != registry().aRegistered.end() && found->second->isMadeFrom(pBytes, nBytes)) {
            return;
        }
    }
    auto spProfile = std::make_shared<Profile const>(pBytes, nBytes);
    std::lock_guard<std::mutex> const lock(registry().oLock);
    registry().aRegistered[code].swap(spProfile);
}

bool unregisterProfile(std::uint32_t code) {
    std::lock_guard<std::mutex> const lock(registry().oLock);
    return registry().aRegistered.erase(code) != 0;
}

bool isKnownProfile(std::uint32_t code) {
    if (builtIn(code) != nullptr) {
        return true;
    }
    std::lock_guard<std::mutex> const lock(registry().oLock);
    return registry().aRegistered.count(code) != 0;
}

std::shared_ptr<Profile const> Internal::profileFromCode(std::uint32_t code) {
    BuiltInProfile const* const pSpace = builtIn(code);
    std::lock_guard<std::mutex> const lock(registry().oLock);
    if (pSpace == nullptr) {
        auto const found = registry().aRegistered.find(code);
        return found != registry().aRegistered.end() ? found->second : nullptr;
    }
    auto& spProfile = registry().aBuiltIn[code];
    if (spProfile == nullptr) {
        spProfile = std::make_shared<Profile const>(*pSpace);
    }
    return spProfile;
}

} // namespace ORVO::ColourEngine
