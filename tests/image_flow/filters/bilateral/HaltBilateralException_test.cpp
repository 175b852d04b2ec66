#include "orvo/image_flow/filters/bilateral/HaltBilateralException.h"

#include "orvo/core/utility/SharedPtr.h"

#include <gtest/gtest.h>

#include <memory>
#include <sstream>
#include <string>

namespace {

char const* const kText = "HaltBilateralException exception.  This should not be exposed to any clients";

TEST(HaltBilateralException, TellsThatItIsPrivate) { EXPECT_STREQ(kText, HaltBilateralException().what()); }

TEST(HaltBilateralException, CloneIsOfTheSameClass) {
    HaltBilateralException const exception;
    std::shared_ptr<ORVO::ExceptionBase> const spClone(exception.clone(),
                                                       ORVO::ORVODeleter<ORVO::ExceptionBase>());
    EXPECT_NE(nullptr, dynamic_cast<HaltBilateralException*>(spClone.get()));
    EXPECT_STREQ(kText, spClone->what());
}

TEST(HaltBilateralException, WritesItsText) {
    std::ostringstream stream;
    stream << HaltBilateralException();
    EXPECT_EQ(kText, stream.str());
}

} // namespace
