/// Replaces the loader's function pointers by functions that count objects, can make a chosen call fail, and
/// call the driver's.
#pragma once

#include <cstdint>
#include <map>
#include <string>

namespace ORVO::Test {

/// Objects that are alive, by kind ("texture", "buffer", ...). Kinds without one are left out.
using ObjectCounts = std::map<std::string, long>;

class GLHooks {
public:
    GLHooks() = delete;

    /// Replaces the pointers, once for the process. Needs EGL, whose resolver gives the driver's functions.
    static void install();
    /// The same for the entry points of GLX.
    static void installGLX();

    /// Objects made and not deleted since install, in all contexts.
    static ObjectCounts objects();
    /// Forgets what is alive: for tests that end a share group with objects in it.
    static void forgetObjects();

    /// Calls since install of one entry point, such as "glTexImage2D".
    static std::uint64_t calls(std::string const& sName);
};

/// While one lives, the n-th call that can fail (counted from 1, from its construction on) does not reach the
/// driver: it answers as a driver answers that is out of memory. Calls that can fail are those that make
/// something: names, storage, shaders, programs, mappings, contexts, attachments.
///
///     for (std::uint64_t n = 1;; ++n) {
///         GLCallFailure failure(n);
///         ... run the code under test, which may throw ...
///         if (!failure.hasFired())
///             break;
///     }
class GLCallFailure {
public:
    explicit GLCallFailure(std::uint64_t n);
    /// Only calls of the named entry point count.
    GLCallFailure(std::string const& sName, std::uint64_t n);
    ~GLCallFailure();
    GLCallFailure(GLCallFailure const&) = delete;
    GLCallFailure& operator=(GLCallFailure const&) = delete;

    bool hasFired() const noexcept;
    /// The entry point that was made to fail; empty if none was.
    std::string name() const;
};

} // namespace ORVO::Test
