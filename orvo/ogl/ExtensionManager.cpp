#include "orvo/ogl/ExtensionManager.h"

#include <map>
#include <optional>
#include <utility>

#include "orvo/ogl/internal/DriverFacts.h"
#include "orvo/ogl/internal/FunctionTable.h"

namespace ORVO::OGL {

using Internal::DriverFacts;

struct ExtensionManager::Overrides {
    std::map<teExtension, bool> aSupport_;
    std::optional<std::pair<unsigned, unsigned>> oVersion_;
    std::optional<teVendor> oVendor_;
    std::optional<unsigned> oUnits_;
    std::optional<bool> oSoftware_;
};

ExtensionManager::ExtensionManager() : pOverrides_(std::make_unique<Overrides>()) {}
ExtensionManager::~ExtensionManager() = default;

ExtensionManager* ExtensionManager::Instance() {
    // Never destroyed: hosts' static objects may ask at the end of the process.
    static auto* const pInstance = new ExtensionManager;
    return pInstance;
}

FunctionTable const* ExtensionManager::table() const noexcept { return &Internal::functionTable(); }

bool ExtensionManager::isSupported(teExtension extension) const {
    auto const known = pOverrides_->aSupport_.find(extension);
    if (known != pOverrides_->aSupport_.end())
        return known->second;
    return DriverFacts::current().supports(extension, majorVersion(), minorVersion());
}

bool ExtensionManager::supportsNonPowerOfTwoTextures() const {
    return isSupported(EXTENSION_ARB_TEXTURE_NON_POWER_OF_TWO);
}

bool ExtensionManager::supportsFloatingPointTextures() const {
    return isSupported(EXTENSION_ARB_TEXTURE_FLOAT) || isSupported(EXTENSION_ATI_TEXTURE_FLOAT) ||
           isSupported(EXTENSION_APPLE_FLOAT_PIXELS);
}

bool ExtensionManager::supports16BitFloat() const {
    return isSupported(EXTENSION_ARB_HALF_FLOAT_PIXEL) && supportsFloatingPointTextures();
}

bool ExtensionManager::supportsClampToEdge() const { return isSupported(EXTENSION_SGIS_TEXTURE_EDGE_CLAMP); }
bool ExtensionManager::supportsTexture3D() const { return isSupported(EXTENSION_EXT_TEXTURE3D); }

unsigned ExtensionManager::numberOfTextureUnits() const {
    return pOverrides_->oUnits_ ? *pOverrides_->oUnits_ : DriverFacts::current().nUnits_;
}

unsigned ExtensionManager::majorVersion() const {
    return pOverrides_->oVersion_ ? pOverrides_->oVersion_->first : DriverFacts::current().nMajor_;
}

unsigned ExtensionManager::minorVersion() const {
    return pOverrides_->oVersion_ ? pOverrides_->oVersion_->second : DriverFacts::current().nMinor_;
}

ExtensionManager::teVendor ExtensionManager::vendor() const {
    return pOverrides_->oVendor_ ? *pOverrides_->oVendor_ : DriverFacts::current().eVendor_;
}

bool ExtensionManager::isSoftwareDriver() const {
    return pOverrides_->oSoftware_ ? *pOverrides_->oSoftware_ : DriverFacts::current().bSoftware_;
}

void ExtensionManager::overrideSupport(teExtension extension, bool bSupported) {
    pOverrides_->aSupport_[extension] = bSupported;
}

void ExtensionManager::overrideVersion(unsigned major, unsigned minor) {
    pOverrides_->oVersion_ = {major, minor};
}

void ExtensionManager::overrideVendor(teVendor vendor) { pOverrides_->oVendor_ = vendor; }
void ExtensionManager::overrideSoftwareDriver(bool bSoftware) { pOverrides_->oSoftware_ = bSoftware; }
void ExtensionManager::overrideNumberOfTextureUnits(unsigned n) { pOverrides_->oUnits_ = n; }

void ExtensionManager::clearOverrides() noexcept {
    pOverrides_->aSupport_.clear();
    pOverrides_->oVersion_.reset();
    pOverrides_->oVendor_.reset();
    pOverrides_->oUnits_.reset();
    pOverrides_->oSoftware_.reset();
}

} // namespace ORVO::OGL
