#include "orvo/core/Check.h"

#include <memory>

#include "tests/support/Expect.h"

namespace {

using ORVO::InternalException;
using ORVO::ParameterException;

int nEvaluations = 0;

bool countedFalse() {
    ++nEvaluations;
    return false;
}

std::string countedText() {
    ++nEvaluations;
    return "built text";
}

TEST(Check, CarriesTheBareExpression) {
    int const ret = 0;
    ORVO_EXPECT_INTERNAL(ORVO_CHECK(ret != 0), "ret != 0");
    ORVO_EXPECT_PARAMETER(ORVO_CHECK_PARAMETER(ret >= 1), "ret >= 1");
    ORVO_EXPECT_INTERNAL(ORVO_CHECK(false), "false");
}

TEST(Check, KeepsMacrosInTheExpressionAsTheyAreWritten) {
    int const* const pNothing = nullptr;
    ORVO_EXPECT_INTERNAL(ORVO_CHECK(pNothing != NULL), "pNothing != NULL");
    ORVO_EXPECT_PARAMETER(ORVO_CHECK_PARAMETER(pNothing != NULL), "pNothing != NULL");
}

TEST(Check, TakesATextOfItsOwn) {
    ORVO_EXPECT_INTERNAL(ORVO_CHECK(1 > 2, "one is small"), "one is small");
    ORVO_EXPECT_INTERNAL(ORVO_CHECK(1 > 2, std::string("one") + " is small"), "one is small");
    ORVO_EXPECT_PARAMETER(ORVO_CHECK_PARAMETER(1 > 2, "one is small"), "one is small");
    ORVO_EXPECT_PARAMETER(ORVO_CHECK_PARAMETER(1 > 2, std::string("one") + " is small"), "one is small");
}

TEST(Check, PassesOnSuccess) {
    std::shared_ptr<int> const spObject = std::make_shared<int>(1);
    EXPECT_NO_THROW(ORVO_CHECK(true));
    EXPECT_NO_THROW(ORVO_CHECK(true, "text"));
    EXPECT_NO_THROW(ORVO_CHECK_PARAMETER(true));
    EXPECT_NO_THROW(ORVO_CHECK_PARAMETER(true, "text"));
    EXPECT_NO_THROW(ORVO_ENFORCE(spObject));
    EXPECT_NO_THROW(ORVO_ENFORCE(spObject.get(), "pObject"));
}

TEST(Check, EvaluatesTheConditionOnceAndTheTextOnFailureAlone) {
    nEvaluations = 0;
    EXPECT_THROW(ORVO_CHECK(countedFalse()), InternalException);
    EXPECT_EQ(1, nEvaluations);
    nEvaluations = 0;
    EXPECT_THROW(ORVO_CHECK(countedFalse(), countedText()), InternalException);
    EXPECT_EQ(2, nEvaluations);
    nEvaluations = 0;
    ORVO_CHECK(true, countedText());
    EXPECT_EQ(0, nEvaluations);
}

TEST(Check, IsOneStatement) {
    bool bElse = false;
    if (nEvaluations < 0)
        ORVO_CHECK(false);
    else
        bElse = true;
    EXPECT_TRUE(bElse);
}

TEST(Enforce, NamesTheCheckedExpression) {
    int const* const pImageFilter = nullptr;
    std::shared_ptr<int> const spClone;
    std::unique_ptr<int> const pOwned;
    ORVO_EXPECT_INTERNAL(ORVO_ENFORCE(pImageFilter), "Enforce pImageFilter != NULL");
    ORVO_EXPECT_INTERNAL(ORVO_ENFORCE(spClone.get()), "Enforce spClone.get() != NULL");
    ORVO_EXPECT_INTERNAL(ORVO_ENFORCE(spClone), "Enforce spClone != NULL");
    ORVO_EXPECT_INTERNAL(ORVO_ENFORCE(pOwned), "Enforce pOwned != NULL");
    ORVO_EXPECT_INTERNAL(ORVO_ENFORCE(pImageFilter, "pInput"), "Enforce pInput != NULL");
}

TEST(Fail, ThrowsAlways) {
    ORVO_EXPECT_INTERNAL(ORVO_FAIL("ImageCPU already set on input"), "ImageCPU already set on input");
    ORVO_EXPECT_PARAMETER(ORVO_FAIL_PARAMETER(std::string("bad ") + "name"), "bad name");
}

TEST(Check, ReportsItsOwnPlace) {
    int line = 0;
    try {
        line = __LINE__ + 1;
        ORVO_CHECK(1 == 2);
        FAIL();
    } catch (InternalException const& e) {
        EXPECT_EQ(line, e.line());
        EXPECT_STREQ(__FILE__, e.file());
        // Relative to the root of the sources, whatever folder the build stands in.
        EXPECT_STREQ("tests/core/Check_test.cpp", e.file());
    }
}

} // namespace
