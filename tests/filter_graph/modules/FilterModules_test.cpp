// Filters, parameters and exceptions work between a host and a module that was loaded with RTLD_LOCAL, where
// each side has type records of its own.
#include "tests/filter_graph/modules/FilterModule.h"

#include <dlfcn.h>
#include <gtest/gtest.h>

#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/Exception.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/Expect.h"
#include "tests/support/FilterGraphLayers.h"

namespace ORVO::FilterGraph {
namespace {

class FilterModulesTest : public testing::Test {
protected:
    void SetUp() override {
        pModule_ = dlopen(ORVO_TEST_FILTER_MODULE, RTLD_NOW | RTLD_LOCAL);
        ASSERT_NE(nullptr, pModule_) << dlerror();
    }

    void TearDown() override {
        if (pModule_ != nullptr)
            dlclose(pModule_);
    }

    template <typename Function>
    Function function(char const* name) {
        return reinterpret_cast<Function>(dlsym(pModule_, name));
    }

    ORVO::Test::FilterGraphLayers oLayers_;
    void* pModule_ = nullptr;
};

TEST_F(FilterModulesTest, AModuleBringsFiltersOfItsOwn) {
    function<ORVO::Test::ChangeFactory>("insertModuleFilter")();
    std::shared_ptr<IFilter> filter = FilterFactory::Instance()->create({"module filter", "test", "ORVO"});
    function<ORVO::Test::ChangeFactory>("removeModuleFilter")();
    EXPECT_EQ(FilterFactory::Instance()->numberOfPrototypes(), 0u);

    ASSERT_TRUE(filter->parameter("offset") && filter->parameter("title"));
    Parameter<float2>& offset = filter->parameter("offset")->as<float2>();
    EXPECT_TRUE(offset.value() == float2(1.0F, 2.0F));
    offset.setValue(float2(3.0F, 4.0F));
    EXPECT_EQ(filter->parameter("title")->as<std::string>().value(), "module");
    ORVO_EXPECT_INTERNAL(filter->parameter("title")->as<float2>(),
                         "Data type retrieved must match parameter exactly");
    EXPECT_TRUE(dynamic_cast<Parameter<float2>*>(filter->parameter("offset")));
    EXPECT_TRUE(filter->metadataItem("Corner")->as<float3>().value() == float3(1.0F, 2.0F, 3.0F));

    auto* const pFilter = dynamic_cast<Internal::Filter*>(filter.get());
    ASSERT_TRUE(pFilter);
    std::shared_ptr<IFilter> clone = pFilter->clone();
    EXPECT_TRUE(clone->parameter("offset")->as<float2>().value() == float2(3.0F, 4.0F));
}

TEST_F(FilterModulesTest, AModulesFilterStandsInAGraphOfTheHost) {
    function<ORVO::Test::ChangeFactory>("insertModuleFilter")();
    std::shared_ptr<IFilter> filter = FilterFactory::Instance()->create({"module filter", "test", "ORVO"});
    function<ORVO::Test::ChangeFactory>("removeModuleFilter")();
    auto const source = ORVO::Test::makePlain("source", {}, 3);
    auto const grey = ORVO::Test::makePlain("grey", {}, 1);
    auto const target = ORVO::Test::makePlain("target", {"src"});
    Connect(source, filter);
    Connect(filter, target);
    EXPECT_EQ(filter->input("src")->producerFilter(), source.get());
    EXPECT_EQ(target->input("src")->producerFilter(), filter.get());
    EXPECT_THROW(Connect(grey, filter), Exception);
    filter.reset();
    EXPECT_EQ(target->input("src")->producerFilter(), nullptr);
}

TEST_F(FilterModulesTest, ExceptionsAreRecognisedOnBothSides) {
    try {
        function<ORVO::Test::ThrowInModule>("throwInModule")();
        FAIL() << "nothing was thrown";
    } catch (Exception const& exception) {
        ASSERT_EQ(exception.errorsAndWarnings().size(), 2u);
        EXPECT_EQ(exception.errorsAndWarnings()[0].message(), "from the module");
        EXPECT_TRUE(exception.errorsAndWarnings()[1].isWarning());
        EXPECT_STREQ(exception.what(), "from the module\nand more");
    }
    EXPECT_TRUE(function<ORVO::Test::CatchInModule>("catchInModule")());
}

} // namespace
} // namespace ORVO::FilterGraph
