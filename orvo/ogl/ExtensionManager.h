#pragma once

#include <memory>

#include "orvo/core/Export.h"
#include "orvo/ogl/Extension.h"
#include "orvo/ogl/FunctionTable.h"

namespace ORVO::OGL {

/// What the driver can do: a singleton that answers for the calling thread's current context, or, where none
/// is current, for the driver that was asked last. Answers are kept for each driver, so that asking is cheap.
///
///     if (OGL::ExtensionManager::Instance()->supportsFloatingPointTextures()) ...
///
/// Every query throws ExceptionOGL "No OpenGL context is current" if no driver was ever asked and none can
/// be.
///
/// Threads: any; overriding answers is for tests, while no other thread asks.
class ORVO_API ExtensionManager {
public:
    /// GPU vendors that the engine tells apart.
    enum teVendor {
        VENDOR_UNKNOWN = 0,
        VENDOR_ATI = 1,
        /// The vendor whose hardware filters float textures linearly.
        VENDOR_NVIDIA = 2,
        VENDOR_INTEL = 3,
        VENDOR_MESA = 4
    };

    /// The one object, never null.
    static ExtensionManager* Instance();

    /// Entry points beyond OpenGL 1.1; never null, and valid for the rest of the process.
    FunctionTable const* table() const noexcept;

    /// Whether the driver names the extension, or has a core version that contains it.
    bool isSupported(teExtension extension) const;

    /// Whether textures may have sizes other than powers of two.
    bool supportsNonPowerOfTwoTextures() const;
    /// Whether textures may hold floats, through any of the three extensions.
    bool supportsFloatingPointTextures() const;
    /// Whether pixels may be passed as 16-bit floats and textures may hold them.
    bool supports16BitFloat() const;
    bool supportsClampToEdge() const;
    bool supportsTexture3D() const;

    /// Texture units that a fragment shader can read (at least those of fixed function).
    unsigned numberOfTextureUnits() const;
    unsigned majorVersion() const;
    unsigned minorVersion() const;
    teVendor vendor() const;
    /// Whether the processor does the driver's work. Such a driver has copied what it is given to copy when
    /// the call returns.
    bool isSoftwareDriver() const;

    // Overriding answers, for tests. An overridden answer needs no context.

    /// From now on isSupported gives the stated answer for one extension.
    void overrideSupport(teExtension extension, bool bSupported);
    /// From now on the version is the stated one; extensions that the driver names stay supported.
    void overrideVersion(unsigned major, unsigned minor);
    void overrideVendor(teVendor vendor);
    void overrideSoftwareDriver(bool bSoftware);
    void overrideNumberOfTextureUnits(unsigned n);
    /// Takes all overridden answers back.
    void clearOverrides() noexcept;

    ExtensionManager(ExtensionManager const&) = delete;
    ExtensionManager& operator=(ExtensionManager const&) = delete;

private:
    struct Overrides;
    ExtensionManager();
    ~ExtensionManager();

    std::unique_ptr<Overrides> pOverrides_;
};

} // namespace ORVO::OGL
