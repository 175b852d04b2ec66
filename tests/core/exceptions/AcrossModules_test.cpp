// Exceptions and dynamic_cast between this program and a module that was loaded with local symbols.
#include <dlfcn.h>

#include <memory>

#include "orvo/core/exceptions/CPURuntimeException.h"
#include "tests/support/Expect.h"
#include "tests/support/ThrowingPlugin.h"

namespace {

using namespace ORVO;

class AcrossModules : public testing::Test {
protected:
    void SetUp() override {
        pModule_ = dlopen(ORVO_THROWING_PLUGIN, RTLD_NOW | RTLD_LOCAL);
        ASSERT_NE(nullptr, pModule_) << dlerror();
        auto const getTable = reinterpret_cast<ORVO::Test::GetPluginTable>(dlsym(pModule_, "getPluginTable"));
        ASSERT_NE(nullptr, getTable);
        pTable_ = getTable();
    }
    void TearDown() override {
        if (pModule_ != nullptr)
            dlclose(pModule_);
    }

    void* pModule_ = nullptr;
    ORVO::Test::PluginTable const* pTable_ = nullptr;
};

TEST_F(AcrossModules, CatchesByClassWhatTheModuleThrows) {
    ORVO_EXPECT_INTERNAL(pTable_->throwInternal(), "thrown in the module");
    ORVO_EXPECT_PARAMETER(pTable_->throwParameter(), "value <= 0x80000000u");
}

TEST_F(AcrossModules, CatchesByBaseAClassOfTheModule) {
    try {
        pTable_->throwOwnClass();
        FAIL();
    } catch (ExceptionBase const& e) {
        EXPECT_STREQ("class of the module", e.what());
        std::unique_ptr<ExceptionBase> const pClone(e.clone());
        EXPECT_STREQ("class of the module", pClone->what());
    }
}

TEST_F(AcrossModules, LetsTheModuleCatchAndCast) {
    EXPECT_TRUE(pTable_->catchesInternal([] { throw InternalException("f", 1, "m"); }));
    EXPECT_FALSE(pTable_->catchesInternal([] { throw ParameterException("f", 1, "m"); }));
    InternalException const internal("f", 1, "m");
    CPURuntimeException const other(CPURuntimeException::CONDITION_UNKNOWN);
    EXPECT_TRUE(pTable_->isLogical(&internal));
    EXPECT_FALSE(pTable_->isLogical(&other));
}

TEST_F(AcrossModules, CastsAnObjectOfTheModule) {
    std::unique_ptr<ExceptionBase> const pObject(pTable_->makeInternal());
    EXPECT_NE(nullptr, dynamic_cast<InternalException*>(pObject.get()));
    EXPECT_EQ(nullptr, dynamic_cast<ParameterException*>(pObject.get()));
}

} // namespace
