#pragma once

#include "orvo/colour_engine/ProfileCodes.h"
#include "orvo/core/Export.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

namespace ORVO::ColourEngine::Internal {

/// A colour space of one or three channels, immutable.
///
/// Threads: any; what reads handle() takes the lock of the resolver.
class ORVO_API Profile {
public:
    /// Throws `std::bad_alloc` alone.
    explicit Profile(BuiltInProfile const& space);
    /// Copies the bytes of an ICC profile. Throws `ParameterException` with the texts of `registerProfile`.
    Profile(void const* pBytes, std::size_t nBytes);
    ~Profile();

    Profile(Profile const&) = delete;
    Profile& operator=(Profile const&) = delete;

    /// The colour library's profile.
    void* handle() const noexcept { return pHandle_; }
    bool isGray() const noexcept { return bGray_; }
    bool canBeSource() const noexcept { return bSource_; }
    bool canBeDestination() const noexcept { return bDestination_; }
    /// Tells this profile from every other that ever existed in the process.
    std::uint64_t serial() const noexcept { return iSerial_; }
    /// Whether it was made from these bytes.
    bool isMadeFrom(void const* pBytes, std::size_t nBytes) const noexcept;

private:
    void findDirections();

    void* pHandle_ = nullptr;
    std::vector<unsigned char> aBytes_; ///< empty for a built-in space
    std::uint64_t iSerial_;
    bool bGray_ = false;
    bool bSource_ = false;
    bool bDestination_ = false;
};

/// The profile of a code, null if there is none. Built-in ones are made on first use.
/// Threads: any.
ORVO_API std::shared_ptr<Profile const> profileFromCode(std::uint32_t code);

} // namespace ORVO::ColourEngine::Internal
