#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <set>
#include <string>

#include "orvo/ogl/ExceptionOGL.h"
#include "tests/support/gl/GLHooks.h"

namespace ORVO::Test {

/// Runs the code once for each call in it that can fail, with that call failing. Each run must throw
/// ExceptionOGL or, where the entry point is named in mayPass, may pass; each leaves no object behind.
/// cleanUp is run after each. Returns the entry points that have failed.
template <typename Code, typename CleanUp>
std::set<std::string> failEveryCall(Code code, CleanUp cleanUp, std::set<std::string> const& mayPass = {}) {
    std::set<std::string> aFailed;
    ObjectCounts const before = GLHooks::objects();
    for (std::uint64_t n = 1; n < 1000; ++n) {
        GLCallFailure const failure(n);
        bool bThrown = false;
        try {
            code();
        } catch (OGL::ExceptionOGL const&) {
            bThrown = true;
        }
        if (!failure.hasFired())
            return aFailed;
        aFailed.insert(failure.name());
        EXPECT_TRUE(bThrown || mayPass.count(failure.name()) != 0) << failure.name() << " failed unseen";
        EXPECT_EQ(before, GLHooks::objects()) << "after a failed " << failure.name();
        cleanUp();
    }
    ADD_FAILURE() << "The code never ended without a failure";
    return aFailed;
}

} // namespace ORVO::Test
