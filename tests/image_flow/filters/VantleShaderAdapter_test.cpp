#include "orvo/image_flow/filters/VantleShaderAdapter.h"

#include <gtest/gtest.h>

#include <memory>
#include <numeric>
#include <vector>

#include "orvo/image_flow/colour/CQuorError.h"
#include "orvo/image_flow/colour/QuorClient.h"
#include "orvo/image_flow/colour/TrelException.h"
#include "tests/image_flow/colour/FakeEngine.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"
#include "tests/support/RecordingEngine.h"

namespace ORVO {
namespace {

using ImageFlow::QuorClient;
using Test::FakeEngine;
using Test::RecordingEngine;
using Lines = std::vector<std::string>;

/// The layers with an engine of the test's own in front of the embedded one.
struct EngineLayers {
    EngineLayers() {
        RecordingEngine::install();
        oRuntime_.emplace(static_cast<OGL::Context const*>(nullptr), VideoMemory::Configuration());
        oDataFlow_.emplace();
        oImageFlow_.emplace(false);
    }

    Core::AutoInitializer oCore_;
    OGL::AutoInitializer oOGL_;
    std::optional<ImageRuntime::AutoInitializer> oRuntime_;
    std::optional<DataFlow::AutoInitializer> oDataFlow_;
    std::optional<ImageFlow::AutoInitializer> oImageFlow_;
};

class VantleShaderAdapterTest : public testing::Test {
protected:
    VantleShaderAdapterTest() {
        RecordingEngine::shader().sEntryPoint_ = "entry";
        RecordingEngine::shader().sCode_ = "void entry(inout vec4 c) {}\n";
    }
    ~VantleShaderAdapterTest() override {
        EXPECT_EQ(0, RecordingEngine::transforms());
        EXPECT_EQ(0, RecordingEngine::shaders());
        EXPECT_EQ(0, RecordingEngine::strings());
    }
    static Lines take() {
        Lines const aLines(RecordingEngine::log().begin() + static_cast<std::ptrdiff_t>(nTaken_),
                           RecordingEngine::log().end());
        nTaken_ = RecordingEngine::log().size();
        return aLines;
    }
    void SetUp() override { nTaken_ = 0; }

    static inline std::size_t nTaken_ = 0;

private:
    EngineLayers oLayers_;
};

TEST_F(VantleShaderAdapterTest, HoldsTheTransformAndItsShader) {
    {
        VantleShaderAdapter adapter(RecordingEngine::ownTransform(), nullptr);
        EXPECT_TRUE(adapter.isValid());
        // 0x73616673 is "safs".
        EXPECT_EQ((Lines{"ReferenceTransform", "NewShader 1935763059"}), take());
    }
    EXPECT_EQ((Lines{"Release", "UnReferenceTransform"}), take());
    int nOptions = 0;
    VantleShaderAdapter const adapter(RecordingEngine::ownTransform(),
                                      reinterpret_cast<_t_Vantle_Options*>(&nOptions));
    EXPECT_EQ((Lines{"ReferenceTransform", "NewShader 1935763059 options"}), take());
}

TEST_F(VantleShaderAdapterTest, AsksForLengthsBeforeTexts) {
    VantleShaderAdapter adapter(RecordingEngine::ownTransform(), nullptr);
    take();
    std::string sEntryPoint;
    std::string sCode;
    adapter.getShaderInfo(sEntryPoint, sCode);
    EXPECT_EQ("entry", sEntryPoint);
    EXPECT_EQ("void entry(inout vec4 c) {}\n", sCode);
    EXPECT_EQ((Lines{"Strings", "StringASCII size 1024", "StringASCII text 5", "UnReferenceString",
                     "StringASCII size 8192", "StringASCII text 28", "UnReferenceString"}),
              take());
    // Texts with an end mark, and empty ones.
    RecordingEngine::shader().sEntryPoint_ = std::string("name\0", 5);
    RecordingEngine::shader().sCode_.clear();
    adapter.getShaderInfo(sEntryPoint, sCode);
    EXPECT_EQ("name", sEntryPoint);
    EXPECT_EQ("", sCode);
}

TEST_F(VantleShaderAdapterTest, HandsOnParametersAndMatrices) {
    std::vector<float> aNine(9);
    std::iota(aNine.begin(), aNine.end(), 1.0F);
    auto& aTables = RecordingEngine::shader().aTables_;
    aTables.resize(2);
    aTables[0].sName_ = "table";
    aTables[0].record_.kind = _t_Vantle_ShaderParameterData::KIND_TEXTURE_2D;
    aTables[0].record_.wrapT = 77;
    aTables[0].aData_ = {0.5F};
    aTables[1].sName_ = "matrix";
    aTables[1].aData_ = aNine;
    VantleShaderAdapter adapter(RecordingEngine::ownTransform(), nullptr);
    take();
    EXPECT_EQ(2U, adapter.numParameters());
    std::string sName;
    _t_Vantle_ShaderParameterData const record = adapter.getParameter(0, sName);
    EXPECT_EQ("table", sName);
    EXPECT_EQ(_t_Vantle_ShaderParameterData::KIND_TEXTURE_2D, record.kind);
    EXPECT_EQ(77U, record.wrapT);
    EXPECT_EQ(aTables[0].aData_.data(), record.data);
    EXPECT_EQ(nullptr, record.name);
    EXPECT_EQ((Lines{"NumParameters", "Parameter 0", "StringASCII size 1024", "StringASCII text 5",
                     "UnReferenceString"}),
              take());

    std::vector<float> aValues(16, -1.0F);
    unsigned size = 0;
    adapter.copyMatrixData(aValues.data(), 1, size);
    EXPECT_EQ(36U, size);
    EXPECT_TRUE(std::equal(aNine.begin(), aNine.end(), aValues.begin()));
    EXPECT_EQ(-1.0F, aValues[9]);
    EXPECT_EQ((Lines{"CopyData 1 size", "CopyData 1 data"}), take());
    // What has no room is not copied.
    aTables[1].aData_.assign(17, 3.0F);
    aValues.assign(16, -1.0F);
    adapter.copyMatrixData(aValues.data(), 1, size);
    EXPECT_EQ(68U, size);
    EXPECT_EQ(std::vector<float>(16, -1.0F), aValues);
}

TEST_F(VantleShaderAdapterTest, IsNotValidWithoutATransform) {
    VantleShaderAdapter empty;
    VantleShaderAdapter null(nullptr, nullptr);
    for (VantleShaderAdapter* const pAdapter : {&empty, &null}) {
        EXPECT_FALSE(pAdapter->isValid());
        std::string sText;
        float value = 0.0F;
        unsigned size = 0;
        constexpr char const* pMessage = "vantleShader_ != NULL";
        ORVO_EXPECT_INTERNAL(pAdapter->getShaderInfo(sText, sText), pMessage);
        ORVO_EXPECT_INTERNAL(pAdapter->getParameter(0, sText), pMessage);
        ORVO_EXPECT_INTERNAL(pAdapter->copyMatrixData(&value, 0, size), pMessage);
        ORVO_EXPECT_INTERNAL(pAdapter->numParameters(), pMessage);
    }
    EXPECT_EQ(Lines(), take());
}

TEST_F(VantleShaderAdapterTest, IsNotValidWhereTheEngineRefuses) {
    for (char const* pSelector : {"ReferenceTransform", "NewShader"}) {
        RecordingEngine::fail(pSelector);
        VantleShaderAdapter adapter(RecordingEngine::ownTransform(), nullptr);
        EXPECT_FALSE(adapter.isValid()) << pSelector;
        EXPECT_EQ(0, RecordingEngine::transforms()) << pSelector;
        RecordingEngine::failNothing();
    }
}

TEST_F(VantleShaderAdapterTest, PassesOnWhatTheEngineRefusesLater) {
    RecordingEngine::shader().aTables_.resize(1);
    RecordingEngine::shader().aTables_[0].sName_ = "matrix";
    VantleShaderAdapter adapter(RecordingEngine::ownTransform(), nullptr);
    std::string sEntryPoint = "old entry";
    std::string sCode = "old code";
    float value = 0.0F;
    unsigned size = 0;
    auto const expectRefusal = [](char const* pSelector, auto const& code) {
        RecordingEngine::fail(pSelector);
        try {
            code();
            ADD_FAILURE() << pSelector << " failed unseen";
        } catch (Quor_T_MT::CQuorError const& error) {
            EXPECT_STREQ("refused", error.what()) << pSelector;
        }
        RecordingEngine::failNothing();
        EXPECT_EQ(0, RecordingEngine::strings()) << pSelector;
    };
    for (char const* pSelector : {"Strings", "StringASCII"})
        expectRefusal(pSelector, [&] { adapter.getShaderInfo(sEntryPoint, sCode); });
    for (char const* pSelector : {"Parameter", "StringASCII"})
        expectRefusal(pSelector, [&] { adapter.getParameter(0, sEntryPoint); });
    expectRefusal("CopyData", [&] { adapter.copyMatrixData(&value, 0, size); });
    expectRefusal("NumParameters", [&] { adapter.numParameters(); });
    EXPECT_EQ("old entry", sEntryPoint);
    EXPECT_EQ("old code", sCode);
    EXPECT_TRUE(adapter.isValid());
}

TEST(VantleShaderAdapterWithoutEngineTest, IsNotValid) {
    Core::AutoInitializer const core;
    Core::Library::setQuorGetAddressProc(nullptr);
    OGL::AutoInitializer const ogl;
    ImageRuntime::AutoInitializer const runtime(nullptr, VideoMemory::Configuration());
    DataFlow::AutoInitializer const dataFlow;
    ImageFlow::AutoInitializer const imageFlow(false);
    VantleShaderAdapter adapter(RecordingEngine::ownTransform(), nullptr);
    EXPECT_FALSE(adapter.isValid());
}

/// An adapter over an engine that records all calls, without any layer.
class VantleShaderAdapterBindingTest : public testing::Test {
protected:
    VantleShaderAdapterBindingTest() {
        FakeEngine::reset();
        EXPECT_EQ(1, QuorClient::start(&FakeEngine::address));
        apAdapter_ = std::make_unique<VantleShaderAdapter>(FakeEngine::handle<VantleTransform>(5), nullptr);
        EXPECT_TRUE(apAdapter_->isValid());
        EXPECT_EQ((Lines{"ReferenceTransform 5", "NewShader 1935763059 5 0"}), FakeEngine::calls());
        FakeEngine::calls().clear();
    }
    ~VantleShaderAdapterBindingTest() override { QuorClient::stop(); }

    std::unique_ptr<VantleShaderAdapter> apAdapter_;
};

TEST_F(VantleShaderAdapterBindingTest, DropsItsHandlesWhereTheyCameFrom) {
    apAdapter_.reset();
    // The engine's shaders are numbered 4000.
    EXPECT_EQ((Lines{"Release 4000", "UnReferenceTransform 5"}), FakeEngine::calls());
}

TEST_F(VantleShaderAdapterBindingTest, LetsItsHandlesGoAfterTheEnd) {
    QuorClient::stop();
    EXPECT_THROW(apAdapter_->numParameters(), TrelException);
    apAdapter_.reset();
    EXPECT_EQ(Lines(), FakeEngine::calls());
}

TEST_F(VantleShaderAdapterBindingTest, HandsNothingToAnotherEngine) {
    QuorClient::stop();
    FakeEngine::reset();
    ASSERT_EQ(1, QuorClient::start(&FakeEngine::address));
    EXPECT_FALSE(apAdapter_->isValid());
    std::string sText;
    float value = 0.0F;
    unsigned size = 0;
    constexpr char const* pMessage = "vantleShader_ != NULL";
    ORVO_EXPECT_INTERNAL(apAdapter_->getShaderInfo(sText, sText), pMessage);
    ORVO_EXPECT_INTERNAL(apAdapter_->getParameter(0, sText), pMessage);
    ORVO_EXPECT_INTERNAL(apAdapter_->copyMatrixData(&value, 0, size), pMessage);
    ORVO_EXPECT_INTERNAL(apAdapter_->numParameters(), pMessage);
    apAdapter_.reset();
    EXPECT_EQ(Lines(), FakeEngine::calls());
    // The engine that is bound now is asked for what is made now.
    apAdapter_ = std::make_unique<VantleShaderAdapter>(FakeEngine::handle<VantleTransform>(6), nullptr);
    apAdapter_.reset();
    EXPECT_EQ(
        (Lines{"ReferenceTransform 6", "NewShader 1935763059 6 0", "Release 4000", "UnReferenceTransform 6"}),
        FakeEngine::calls());
}

} // namespace
} // namespace ORVO
