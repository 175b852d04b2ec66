#pragma once

#include <set>
#include <string>

#include "orvo/ogl/ExtensionManager.h"

namespace ORVO::OGL::Internal {

/// What one driver says of itself. Immutable once it is made; kept for the rest of the process.
struct DriverFacts {
    std::string sVendor_;
    std::string sRenderer_;
    std::string sVersion_;
    unsigned nMajor_ = 0;
    unsigned nMinor_ = 0;
    /// Units that fixed function reads.
    unsigned nFixedFunctionUnits_ = 0;
    /// Units that a fragment shader reads, at least those of fixed function.
    unsigned nUnits_ = 0;
    /// Units that can be made active.
    unsigned nSelectableUnits_ = 0;
    ExtensionManager::teVendor eVendor_ = ExtensionManager::VENDOR_UNKNOWN;
    /// Whether the processor does the driver's work.
    bool bSoftware_ = false;
    /// Those of teExtension that the driver names; core versions are not looked at here.
    std::set<teExtension> aNamed_;

    /// Whether the driver names the extension or the given version contains it.
    bool supports(teExtension extension, unsigned major, unsigned minor) const;

    /// The facts of the calling thread's current context, or where none is current those that were asked for
    /// last. Throws ExceptionOGL "No OpenGL context is current".
    static DriverFacts const& current();
};

/// The vendor that the driver's texts name.
ExtensionManager::teVendor vendorOf(std::string const& sVendor, std::string const& sRenderer);

} // namespace ORVO::OGL::Internal
