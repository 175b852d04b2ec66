// Nodes, connectors and parameters work between a host and a module that was loaded with RTLD_LOCAL, where
// each side has type records of its own.

#include "tests/data_flow/modules/ModuleNode.h"

#include "orvo/core/math/Float.h"
#include "orvo/data_flow/connectors/Connect.h"
#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <dlfcn.h>

#include <memory>
#include <vector>

namespace {

using namespace ORVO;
using namespace ORVO::DataFlow;
using ORVO::Test::SharedPayload;

class ModulesTest : public testing::Test {
protected:
    void SetUp() override {
        pModule_ = dlopen(ORVO_TEST_MODULE, RTLD_NOW | RTLD_LOCAL);
        ASSERT_NE(nullptr, pModule_) << dlerror();
        spNode_ = {function<ORVO::Test::CreateModuleNode>("createModuleNode")(),
                   function<ORVO::Test::DestroyModuleNode>("destroyModuleNode")};
    }
    void TearDown() override {
        spNode_.reset();
        if (pModule_ != nullptr) {
            dlclose(pModule_);
        }
    }

    template <typename Function>
    Function function(char const* pName) {
        return reinterpret_cast<Function>(dlsym(pModule_, pName));
    }

    ORVO::Test::DataFlowLayers oLayers_;
    void* pModule_ = nullptr;
    std::unique_ptr<Node, ORVO::Test::DestroyModuleNode> spNode_{nullptr, nullptr};
};

TEST_F(ModulesTest, ParametersAreRecognised) {
    auto* const pOffset = dynamic_cast<Parameter<float2>*>(spNode_->parameter("offset"));
    auto* const pSize = dynamic_cast<IntervalParameter<int>*>(spNode_->parameter("size"));
    auto* const pPoints = dynamic_cast<Parameter<std::vector<float2>>*>(spNode_->parameter("points"));
    ASSERT_TRUE(pOffset && pSize && pPoints);
    pOffset->setValueFromParameter(Parameter<float2>(float2(2.0f, 3.0f), "host"));
    EXPECT_EQ(float2(2.0f, 3.0f), pOffset->value());
    pSize->setValueFromParameter(IntervalParameter<int>(5, 1, 6, "host"));
    EXPECT_EQ(5, pSize->value());
    EXPECT_EQ(6, pSize->upperBound());
    pPoints->setValue({float2(1.0f)});
    Parameter<std::vector<float2>> oHost({}, "host");
    oHost.setValueFromParameter(*pPoints);
    EXPECT_EQ(pPoints->value(), oHost.value());
    ORVO_EXPECT_INTERNAL(pOffset->setValueFromParameter(*pSize), "isOfType<T>()");
    // A clone made by the module outlives the original.
    auto const spClone = pSize->clone("clone");
    EXPECT_EQ(5, dynamic_cast<Parameter<int> const&>(*spClone).value());
}

TEST_F(ModulesTest, DataPassesBothWays) {
    ConstOutput<SharedPayload> oSource("source", nullptr);
    ConstInput<SharedPayload> oResult("result", nullptr);
    ConstInput<float4> oColour("colour", nullptr);
    ConstInput<float2> oOther("other", nullptr);
    Connect(*spNode_->input("payload"), oSource);
    Connect(*spNode_->output("payload"), oResult);
    Connect(*spNode_->output("colour"), oColour);
    EXPECT_FALSE(oOther.canConnect(spNode_->output("colour")));

    auto* const pPayload = ORVO_NEW SharedPayload{41};
    oSource.setData(pPayload);
    spNode_->process();
    oResult.fetchInput();
    oColour.fetchInput();
    EXPECT_EQ(pPayload, oResult.get());
    EXPECT_EQ(42, oResult->iValue_);
    EXPECT_EQ(float4(0.0f, 0.0f, 0.0f, 1.0f), *oColour);
    spNode_->disconnect();
}

TEST_F(ModulesTest, OwnershipPassesToo) {
    ConstOutput<SharedPayload> oSource("source", nullptr);
    Connect(*spNode_->input("payload"), oSource);
    // Shared by the host, so the module's input takes a copy, which the host then takes over for good.
    ConstDataPointer<SharedPayload> const spKept(ORVO_NEW SharedPayload{1});
    oSource = spKept;
    spNode_->process();
    EXPECT_EQ(1, spKept->iValue_);
    Input<SharedPayload> oResult("result", nullptr);
    Connect(*spNode_->output("payload"), oResult);
    oResult.fetchInput();
    SharedPayload* const pResult = oResult.releaseData();
    ASSERT_NE(nullptr, pResult);
    EXPECT_NE(spKept.get(), pResult);
    EXPECT_EQ(2, pResult->iValue_);
    spNode_->disconnect();
    spNode_.reset();
    EXPECT_EQ(2, pResult->iValue_);
    trackedDelete(pResult);
}

TEST_F(ModulesTest, FailuresAreRecognised) {
    auto const pfnFail = function<ORVO::Test::FailInModule>("failInModule");
    ORVO_EXPECT_INTERNAL(pfnFail(), "module");
    ORVO_EXPECT_INTERNAL(spNode_->process(), "Enforce pConnectedOutput_ != NULL");
}

} // namespace
