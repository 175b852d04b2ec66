#include "orvo/ogl/Context.h"

#include <gtest/gtest.h>

#include <memory>
#include <type_traits>

namespace {

using namespace ORVO;

TEST(Context, IsAnAbstractHandle) {
    static_assert(std::is_abstract_v<OGL::Context>);
    static_assert(std::has_virtual_destructor_v<OGL::Context>);
    static_assert(!std::is_copy_constructible_v<OGL::Context>);
}

TEST(Context, IsImplementedAndDestroyedThroughItsBase) {
    static bool bDestroyed = false;
    struct HostContext : OGL::Context {
        explicit HostContext(int& nCurrent) : nCurrent_(nCurrent) {}
        ~HostContext() override { bDestroyed = true; }
        void makeCurrent() const override { ++nCurrent_; }
        bool isSharingWithCurrentContext() const override { return nCurrent_ > 0; }
        int& nCurrent_;
    };
    int nCurrent = 0;
    {
        std::unique_ptr<OGL::Context const> const pContext = std::make_unique<HostContext>(nCurrent);
        EXPECT_FALSE(pContext->isSharingWithCurrentContext());
        pContext->makeCurrent();
        EXPECT_TRUE(pContext->isSharingWithCurrentContext());
    }
    EXPECT_TRUE(bDestroyed);
}

} // namespace
