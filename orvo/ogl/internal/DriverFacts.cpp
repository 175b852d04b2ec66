#include "orvo/ogl/internal/DriverFacts.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <list>
#include <mutex>

#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"

namespace ORVO::OGL::Internal {

namespace {

struct ExtensionRow {
    teExtension eExtension_;
    char const* pName_;
    /// The core version that contains the feature, as major * 10 + minor; 0 if none does.
    unsigned nCoreVersion_;
};

constexpr std::array<ExtensionRow, 16> aRows{{
    {EXTENSION_ARB_PIXEL_BUFFER_OBJECT, "GL_ARB_pixel_buffer_object", 21},
    {EXTENSION_ARB_TEXTURE_FLOAT, "GL_ARB_texture_float", 30},
    {EXTENSION_ATI_TEXTURE_FLOAT, "GL_ATI_texture_float", 30},
    {EXTENSION_ARB_HALF_FLOAT_PIXEL, "GL_ARB_half_float_pixel", 30},
    {EXTENSION_EXT_FRAMEBUFFER_OBJECT, "GL_EXT_framebuffer_object", 30},
    {EXTENSION_EXT_PIXEL_BUFFER_OBJECT, "GL_EXT_pixel_buffer_object", 21},
    {EXTENSION_ARB_FRAMEBUFFER_OBJECT, "GL_ARB_framebuffer_object", 30},
    {EXTENSION_APPLE_FLOAT_PIXELS, "GL_APPLE_float_pixels", 30},
    {EXTENSION_ARB_TEXTURE_NON_POWER_OF_TWO, "GL_ARB_texture_non_power_of_two", 20},
    {EXTENSION_ARB_TEXTURE_RECTANGLE, "GL_ARB_texture_rectangle", 31},
    {EXTENSION_EXT_TEXTURE3D, "GL_EXT_texture3D", 12},
    {EXTENSION_SGIS_TEXTURE_EDGE_CLAMP, "GL_SGIS_texture_edge_clamp", 12},
    {EXTENSION_ARB_SHADER_OBJECTS, "GL_ARB_shader_objects", 20},
    {EXTENSION_APPLE_FENCE, "GL_APPLE_fence", 0},
    {EXTENSION_ARB_VERTEX_PROGRAM, "GL_ARB_vertex_program", 0},
    {EXTENSION_ARB_FRAGMENT_PROGRAM, "GL_ARB_fragment_program", 0},
}};

std::string textOf(GLenum name) {
    auto const* const pText = reinterpret_cast<char const*>(glGetString(name));
    return pText != nullptr ? pText : "";
}

unsigned unsignedOf(GLenum name) {
    GLint value = 0;
    glGetIntegerv(name, &value);
    return value > 0 ? static_cast<unsigned>(value) : 0;
}

bool isSoftware(std::string const& sRenderer) {
    static constexpr std::array<char const*, 3> aMarks{"llvmpipe", "softpipe", "Software Rasterizer"};
    return std::any_of(aMarks.begin(), aMarks.end(), [&sRenderer](char const* pMark) {
        return sRenderer.find(pMark) != std::string::npos;
    });
}

DriverFacts readFacts() {
    DriverFacts facts;
    facts.sVendor_ = textOf(GL_VENDOR);
    facts.sRenderer_ = textOf(GL_RENDERER);
    facts.sVersion_ = textOf(GL_VERSION);
    auto const nVersion = static_cast<unsigned>(std::max(epoxy_gl_version(), 0));
    facts.nMajor_ = nVersion / 10;
    facts.nMinor_ = nVersion % 10;
    facts.nFixedFunctionUnits_ = unsignedOf(GL_MAX_TEXTURE_UNITS);
    for (ExtensionRow const& row : aRows)
        if (epoxy_has_gl_extension(row.pName_))
            facts.aNamed_.insert(row.eExtension_);
    facts.nUnits_ = facts.nFixedFunctionUnits_;
    if (facts.supports(EXTENSION_ARB_SHADER_OBJECTS, facts.nMajor_, facts.nMinor_))
        facts.nUnits_ = std::max(facts.nUnits_, unsignedOf(GL_MAX_TEXTURE_IMAGE_UNITS));
    facts.nSelectableUnits_ = facts.nUnits_;
    if (facts.nMajor_ >= 2)
        facts.nSelectableUnits_ = std::max({facts.nUnits_, unsignedOf(GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS),
                                            unsignedOf(GL_MAX_TEXTURE_COORDS)});
    facts.eVendor_ = vendorOf(facts.sVendor_, facts.sRenderer_);
    facts.bSoftware_ = isSoftware(facts.sRenderer_);
    return facts;
}

/// Whether the facts are those of the current context's driver.
bool isCurrentDriver(DriverFacts const& facts) {
    auto const isSame = [](GLenum name, std::string const& sText) {
        auto const* const pText = reinterpret_cast<char const*>(glGetString(name));
        return pText != nullptr && sText == pText;
    };
    return isSame(GL_VERSION, facts.sVersion_) && isSame(GL_RENDERER, facts.sRenderer_) &&
           isSame(GL_VENDOR, facts.sVendor_);
}

} // namespace

bool DriverFacts::supports(teExtension extension, unsigned major, unsigned minor) const {
    auto const row = std::find_if(aRows.begin(), aRows.end(),
                                  [extension](ExtensionRow const& r) { return r.eExtension_ == extension; });
    if (row == aRows.end())
        return false;
    bool const bCore = row->nCoreVersion_ != 0 && major * 10 + minor >= row->nCoreVersion_;
    return bCore || aNamed_.count(extension) != 0;
}

DriverFacts const& DriverFacts::current() {
    // Never destroyed, and nodes of a list stay where they are: references stay valid.
    static auto* const pKnown = new std::list<DriverFacts>;
    static std::mutex oLock;
    static std::atomic<DriverFacts const*> pLast{nullptr};

    DriverFacts const* const pCandidate = pLast.load(std::memory_order_acquire);
    if (NativeContext::currentHandle() == nullptr) {
        if (pCandidate == nullptr)
            ORVO_OGL_FAIL("No OpenGL context is current", 0);
        return *pCandidate;
    }
    if (pCandidate != nullptr && isCurrentDriver(*pCandidate))
        return *pCandidate;
    std::lock_guard const guard(oLock);
    auto known = std::find_if(pKnown->begin(), pKnown->end(), isCurrentDriver);
    if (known == pKnown->end())
        known = pKnown->insert(pKnown->end(), readFacts());
    pLast.store(&*known, std::memory_order_release);
    return *known;
}

ExtensionManager::teVendor vendorOf(std::string const& sVendor, std::string const& sRenderer) {
    struct Mark {
        char const* pText_;
        ExtensionManager::teVendor eVendor_;
    };
    // The software driver's renderer may name the maker of the processor that it runs on: it is asked for
    // first.
    static constexpr std::array<Mark, 9> aMarks{{{"llvmpipe", ExtensionManager::VENDOR_MESA},
                                                 {"softpipe", ExtensionManager::VENDOR_MESA},
                                                 {"NVIDIA", ExtensionManager::VENDOR_NVIDIA},
                                                 {"nouveau", ExtensionManager::VENDOR_MESA},
                                                 {"ATI", ExtensionManager::VENDOR_ATI},
                                                 {"AMD", ExtensionManager::VENDOR_ATI},
                                                 {"Intel", ExtensionManager::VENDOR_INTEL},
                                                 {"Mesa", ExtensionManager::VENDOR_MESA},
                                                 {"X.Org", ExtensionManager::VENDOR_MESA}}};
    std::string const sBoth = sVendor + "\n" + sRenderer;
    for (Mark const& mark : aMarks)
        if (sBoth.find(mark.pText_) != std::string::npos)
            return mark.eVendor_;
    return ExtensionManager::VENDOR_UNKNOWN;
}

} // namespace ORVO::OGL::Internal
