#include "orvo/ogl/ExceptionOGL.h"

#include <gtest/gtest.h>

#include <memory>
#include <sstream>
#include <type_traits>

namespace {

using namespace ORVO;

TEST(ExceptionOGL, CarriesItsPlaceItsTextAndTheCode) {
    OGL::ExceptionOGL const exception("orvo/ogl/x.cpp", 12, "it failed", 0x0505);
    EXPECT_STREQ("orvo/ogl/x.cpp", exception.file());
    EXPECT_EQ(12, exception.line());
    EXPECT_STREQ("it failed", exception.message());
    EXPECT_EQ(0x0505U, exception.glError());
    EXPECT_STREQ("it failed (orvo/ogl/x.cpp:12)", exception.what());
}

TEST(ExceptionOGL, IsALogicalException) {
    static_assert(std::is_base_of_v<LogicalException, OGL::ExceptionOGL>);
    static_assert(std::has_virtual_destructor_v<OGL::ExceptionOGL>);
    static_assert(std::is_nothrow_copy_constructible_v<OGL::ExceptionOGL>);
    EXPECT_THROW(throw OGL::ExceptionOGL("f", 1, "m", 2), LogicalException);
}

TEST(ExceptionOGL, TakesNullTexts) {
    OGL::ExceptionOGL const exception(nullptr, 0, nullptr, 0);
    EXPECT_STREQ("", exception.file());
    EXPECT_STREQ("", exception.message());
}

TEST(ExceptionOGL, KeepsEverythingInClonesAndCopies) {
    std::unique_ptr<ExceptionBase> pClone;
    {
        OGL::ExceptionOGL const first("f.cpp", 3, "lost", 7);
        OGL::ExceptionOGL copy("other", 1, "text", 1);
        copy = first;
        pClone.reset(copy.clone());
    }
    auto const* const pException = dynamic_cast<OGL::ExceptionOGL const*>(pClone.get());
    ASSERT_NE(nullptr, pException);
    EXPECT_STREQ("lost", pException->message());
    EXPECT_STREQ("f.cpp", pException->file());
    EXPECT_EQ(3, pException->line());
    EXPECT_EQ(7U, pException->glError());
    std::ostringstream text;
    text << *pClone;
    EXPECT_EQ("lost (f.cpp:3)", text.str());
}

} // namespace
