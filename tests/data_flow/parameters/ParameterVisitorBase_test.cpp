#include "orvo/data_flow/parameters/ParameterVisitorBase.h"

#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "tests/data_flow/parameters/ParameterSamples.h"
#include "tests/support/Expect.h"
#include "tests/support/Slots.h"

#include <gtest/gtest.h>

#include <string>
#include <type_traits>
#include <vector>

namespace {

using namespace ORVO;
using namespace ORVO::DataFlow;
using ORVO::Test::Samples;

/// Notes which overload was called, and with what.
class Recorder : public ParameterVisitorBase {
public:
    void visit(ParameterBase* pParameter) override { record("base", pParameter); }
    void visit(Parameter<std::string>* pParameter) override { record("string", pParameter); }
    void visit(Parameter<float4x4>* pParameter) override { record("float4x4", pParameter); }
    void visit(Parameter<float3x3>* pParameter) override { record("float3x3", pParameter); }
    void visit(Parameter<float2x2>* pParameter) override { record("float2x2", pParameter); }
    void visit(Parameter<float4>* pParameter) override { record("float4", pParameter); }
    void visit(Parameter<float3>* pParameter) override { record("float3", pParameter); }
    void visit(Parameter<float2>* pParameter) override { record("float2", pParameter); }
    void visit(Parameter<float>* pParameter) override { record("float", pParameter); }
    void visit(Parameter<bool4>* pParameter) override { record("bool4", pParameter); }
    void visit(Parameter<bool3>* pParameter) override { record("bool3", pParameter); }
    void visit(Parameter<bool2>* pParameter) override { record("bool2", pParameter); }
    void visit(Parameter<bool>* pParameter) override { record("bool", pParameter); }
    void visit(Parameter<int4>* pParameter) override { record("int4", pParameter); }
    void visit(Parameter<int3>* pParameter) override { record("int3", pParameter); }
    void visit(Parameter<int2>* pParameter) override { record("int2", pParameter); }
    void visit(Parameter<int>* pParameter) override { record("int", pParameter); }

    std::string sOverload_;
    ParameterBase const* pVisited_ = nullptr;

private:
    void record(char const* pOverload, ParameterBase const* pParameter) {
        sOverload_ = pOverload;
        pVisited_ = pParameter;
    }
};

template <typename T>
std::string expectedOverload() {
    if constexpr (std::is_same_v<T, std::string>)
        return "string";
    else if constexpr (std::is_same_v<T, float4x4>)
        return "float4x4";
    else if constexpr (std::is_same_v<T, float3x3>)
        return "float3x3";
    else if constexpr (std::is_same_v<T, float2x2>)
        return "float2x2";
    else if constexpr (std::is_same_v<T, float4>)
        return "float4";
    else if constexpr (std::is_same_v<T, float3>)
        return "float3";
    else if constexpr (std::is_same_v<T, float2>)
        return "float2";
    else if constexpr (std::is_same_v<T, float>)
        return "float";
    else if constexpr (std::is_same_v<T, bool4>)
        return "bool4";
    else if constexpr (std::is_same_v<T, bool3>)
        return "bool3";
    else if constexpr (std::is_same_v<T, bool2>)
        return "bool2";
    else if constexpr (std::is_same_v<T, bool>)
        return "bool";
    else if constexpr (std::is_same_v<T, int4>)
        return "int4";
    else if constexpr (std::is_same_v<T, int3>)
        return "int3";
    else if constexpr (std::is_same_v<T, int2>)
        return "int2";
    else if constexpr (std::is_same_v<T, int>)
        return "int";
    else
        return "base";
}

template <typename T>
std::ptrdiff_t slotOfVisit() {
    return ORVO::Test::slotOf(static_cast<void (ParameterVisitorBase::*)(T*)>(&ParameterVisitorBase::visit));
}

TEST(ParameterVisitorSlotsTest, HasItsOverloadsInOrder) {
    // The destructor stands first.
    EXPECT_EQ(2, slotOfVisit<ParameterBase>());
    EXPECT_EQ(3, slotOfVisit<Parameter<std::string>>());
    EXPECT_EQ(4, slotOfVisit<Parameter<float4x4>>());
    EXPECT_EQ(5, slotOfVisit<Parameter<float3x3>>());
    EXPECT_EQ(6, slotOfVisit<Parameter<float2x2>>());
    EXPECT_EQ(7, slotOfVisit<Parameter<float4>>());
    EXPECT_EQ(8, slotOfVisit<Parameter<float3>>());
    EXPECT_EQ(9, slotOfVisit<Parameter<float2>>());
    EXPECT_EQ(10, slotOfVisit<Parameter<float>>());
    EXPECT_EQ(11, slotOfVisit<Parameter<bool4>>());
    EXPECT_EQ(12, slotOfVisit<Parameter<bool3>>());
    EXPECT_EQ(13, slotOfVisit<Parameter<bool2>>());
    EXPECT_EQ(14, slotOfVisit<Parameter<bool>>());
    EXPECT_EQ(15, slotOfVisit<Parameter<int4>>());
    EXPECT_EQ(16, slotOfVisit<Parameter<int3>>());
    EXPECT_EQ(17, slotOfVisit<Parameter<int2>>());
    EXPECT_EQ(18, slotOfVisit<Parameter<int>>());
}

template <typename T>
class ParameterVisitorTest : public testing::Test {};
TYPED_TEST_SUITE(ParameterVisitorTest, ORVO::Test::AllParameterTypes);

TYPED_TEST(ParameterVisitorTest, ComesThroughTheOverloadOfItsType) {
    using T = TypeParam;
    Parameter<T> oParameter(Samples<T>::first(), "name");
    Recorder oRecorder;
    static_cast<ParameterBase&>(oParameter).visit(&oRecorder);
    EXPECT_EQ(expectedOverload<T>(), oRecorder.sOverload_);
    EXPECT_EQ(&oParameter, oRecorder.pVisited_);
    ORVO_EXPECT_INTERNAL(oParameter.visit(nullptr), "Enforce pVisitor != NULL");
}

template <typename T>
class IntervalParameterVisitorTest : public testing::Test {};
TYPED_TEST_SUITE(IntervalParameterVisitorTest, ORVO::Test::IntervalParameterTypes);

TYPED_TEST(IntervalParameterVisitorTest, ComesAsThePlainParameterOfItsType) {
    using T = TypeParam;
    IntervalParameter<T> oParameter(Samples<T>::first(), Samples<T>::first(), Samples<T>::second(), "name");
    Recorder oRecorder;
    static_cast<ParameterBase&>(oParameter).visit(&oRecorder);
    EXPECT_EQ(expectedOverload<T>(), oRecorder.sOverload_);
    EXPECT_EQ(&oParameter, oRecorder.pVisited_);
}

} // namespace
