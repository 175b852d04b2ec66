#include <memory>
#include <new>
#include <sstream>
#include <string>

#include "orvo/core/exceptions/CPURuntimeException.h"
#include "orvo/core/exceptions/SharedException.h"
#include "orvo/core/utility/SharedPtr.h"
#include "tests/support/Expect.h"
#include "tests/support/Slots.h"

namespace {

using namespace ORVO;

std::string written(ExceptionBase const& exception) {
    std::ostringstream stream;
    stream << exception;
    return stream.str();
}

class PlainException : public ExceptionBase {
public:
    PlainException* clone() const override { return new PlainException(*this); }
};

TEST(ExceptionBase, IsAStandardExceptionWithATextAndAClone) {
    static_assert(std::is_base_of_v<std::exception, ExceptionBase>);
    static_assert(std::is_abstract_v<ExceptionBase>);
    PlainException const original;
    PlainException copy(original);
    copy = original;
    EXPECT_STREQ("ORVO exception", copy.what());
    EXPECT_EQ("ORVO exception", written(copy));
    std::unique_ptr<ExceptionBase> const pClone(static_cast<ExceptionBase const&>(original).clone());
    EXPECT_NE(nullptr, dynamic_cast<PlainException*>(pClone.get()));
}

/// what() is noexcept, which is part of its type.
std::ptrdiff_t slotOfWhat() {
    return ORVO::Test::constSlotOf(static_cast<char const* (ExceptionBase::*)() const>(&ExceptionBase::what));
}

TEST(ExceptionBase, HasItsOperationsInOrder) {
    // The destructor stands first.
    EXPECT_EQ(2, slotOfWhat());
    EXPECT_EQ(3, ORVO::Test::constSlotOf(&ExceptionBase::clone));
    EXPECT_EQ(4, ORVO::Test::constSlotOf(&ExceptionBase::write));
}

TEST(Exceptions, HaveTheirBases) {
    static_assert(std::is_base_of_v<ExceptionBase, LogicalException>);
    static_assert(std::is_base_of_v<LogicalException, InternalException>);
    static_assert(std::is_base_of_v<LogicalException, ParameterException>);
    static_assert(std::is_base_of_v<ExceptionBase, ResourceException>);
    static_assert(!std::is_base_of_v<LogicalException, ResourceException>);
    static_assert(std::is_base_of_v<ExceptionBase, CPURuntimeException>);
    static_assert(std::is_base_of_v<ExceptionBase, SharedException>);
    // Copies cross threads and catch clauses: they must not throw themselves.
    static_assert(std::is_nothrow_copy_constructible_v<InternalException>);
    static_assert(std::is_nothrow_copy_constructible_v<ParameterException>);
    static_assert(std::is_nothrow_copy_constructible_v<ResourceException>);
    static_assert(std::is_nothrow_copy_constructible_v<CPURuntimeException>);
    static_assert(std::is_nothrow_copy_constructible_v<SharedException>);
    EXPECT_THROW(throw InternalException("f", 1, "m"), LogicalException);
    EXPECT_THROW(throw ParameterException("f", 1, "m"), LogicalException);
    EXPECT_THROW(throw ResourceException("f", 1, "m"), ExceptionBase);
    EXPECT_THROW(throw CPURuntimeException(CPURuntimeException::CONDITION_UNKNOWN), ExceptionBase);
    EXPECT_THROW(throw SharedException(nullptr), ExceptionBase);
}

template <typename Exception>
class LocatedException : public testing::Test {};
using LocatedExceptions = testing::Types<InternalException, ParameterException, ResourceException>;
TYPED_TEST_SUITE(LocatedException, LocatedExceptions);

TYPED_TEST(LocatedException, CarriesPlaceAndMessage) {
    TypeParam const exception("image_runtime/TexturePool.cpp", 42, "Enforce pTexture != NULL");
    EXPECT_STREQ("image_runtime/TexturePool.cpp", exception.file());
    EXPECT_EQ(42u, static_cast<unsigned>(exception.line()));
    EXPECT_STREQ("Enforce pTexture != NULL", exception.message());
    EXPECT_STREQ("Enforce pTexture != NULL (image_runtime/TexturePool.cpp:42)", exception.what());
    EXPECT_EQ(exception.what(), written(exception));
}

TYPED_TEST(LocatedException, CloneOutlivesTheOriginal) {
    auto pOriginal =
        std::make_unique<TypeParam>(std::string("a/file.cpp").c_str(), 7, std::string("text").c_str());
    std::unique_ptr<ExceptionBase> const pClone(static_cast<ExceptionBase const&>(*pOriginal).clone());
    pOriginal.reset();
    auto const* const pTyped = dynamic_cast<TypeParam const*>(pClone.get());
    ASSERT_NE(nullptr, pTyped);
    EXPECT_STREQ("text", pTyped->message());
    EXPECT_STREQ("a/file.cpp", pTyped->file());
    EXPECT_EQ(7u, static_cast<unsigned>(pTyped->line()));
    EXPECT_STREQ("text (a/file.cpp:7)", pTyped->what());
}

TYPED_TEST(LocatedException, IsCopiedAndAssigned) {
    TypeParam const a("a", 1, "first");
    TypeParam copy(a);
    EXPECT_STREQ("first", copy.message());
    copy = TypeParam("b", 2, "second");
    EXPECT_STREQ("second", copy.message());
    EXPECT_STREQ("b", copy.file());
    EXPECT_STREQ("first", a.message());
}

TYPED_TEST(LocatedException, TakesNullForAnEmptyText) {
    TypeParam const exception(nullptr, 0, nullptr);
    EXPECT_STREQ("", exception.file());
    EXPECT_STREQ("", exception.message());
}

TEST(CPURuntimeException, KeepsItsCondition) {
    struct Row {
        CPURuntimeException::ExceptionCondition eCondition_;
        int iValue_;
        char const* pText_;
    };
    Row const rows[] = {
        {CPURuntimeException::CONDITION_NONE, 0, "CPU runtime exception: none"},
        {CPURuntimeException::CONDITION_OUT_OF_MEMORY, 1, "CPU runtime exception: out of memory"},
        {CPURuntimeException::CONDITION_DIVISION_BY_ZERO, 2, "CPU runtime exception: division by zero"},
        {CPURuntimeException::CONDITION_INVALID_OPERATION, 3, "CPU runtime exception: invalid operation"},
        {CPURuntimeException::CONDITION_NUMERIC_OVERFLOW, 4, "CPU runtime exception: numeric overflow"},
        {CPURuntimeException::CONDITION_ILLEGAL_ACCESS, 5, "CPU runtime exception: illegal access"},
        {CPURuntimeException::CONDITION_UNKNOWN, 6, "CPU runtime exception: unknown"},
        {CPURuntimeException::ExceptionCondition(77), 77, "CPU runtime exception: unknown"},
    };
    for (Row const& row : rows) {
        SCOPED_TRACE(row.pText_);
        CPURuntimeException const exception(row.eCondition_);
        EXPECT_EQ(row.iValue_, static_cast<int>(exception.condition()));
        EXPECT_STREQ(row.pText_, exception.what());
        std::unique_ptr<ExceptionBase> const pClone(exception.clone());
        auto const* const pTyped = dynamic_cast<CPURuntimeException const*>(pClone.get());
        ASSERT_NE(nullptr, pTyped);
        EXPECT_EQ(row.eCondition_, pTyped->condition());
        EXPECT_EQ(row.pText_, written(*pTyped));
    }
}

TEST(SharedException, CarriesAnExceptionOfTheSystem) {
    std::shared_ptr<std::exception> const spInner(new InternalException("f.cpp", 3, "ret != 0"),
                                                  ORVODeleter<InternalException>());
    SharedException const shared(spInner);
    EXPECT_EQ(spInner, shared.exception());
    EXPECT_STREQ("ret != 0 (f.cpp:3)", shared.what());
    EXPECT_EQ("ret != 0 (f.cpp:3)", written(shared));
    SharedException const copy(shared);
    EXPECT_EQ(spInner, copy.exception());
    std::unique_ptr<ExceptionBase> const pClone(shared.clone());
    EXPECT_EQ(spInner, dynamic_cast<SharedException&>(*pClone).exception());
}

TEST(SharedException, CarriesAForeignException) {
    SharedException const shared(std::make_shared<std::bad_alloc>());
    EXPECT_STREQ(std::bad_alloc().what(), shared.what());
    EXPECT_EQ(std::bad_alloc().what(), written(shared));
}

TEST(SharedException, MayBeEmpty) {
    SharedException const shared(nullptr);
    EXPECT_EQ(nullptr, shared.exception());
    EXPECT_STREQ("Shared exception without content", shared.what());
    EXPECT_EQ("Shared exception without content", written(shared));
}

TEST(SharedException, KeepsItsContentAliveAfterTheWorkerIsGone) {
    auto const carry = [] {
        std::shared_ptr<std::exception> spInner;
        try {
            throw ParameterException("g.cpp", 9, "boundary > 0");
        } catch (ExceptionBase& e) {
            spInner.reset(e.clone(), ORVODeleter<std::exception>());
        }
        return SharedException(spInner);
    };
    SharedException const shared = carry();
    auto const* const pInner = dynamic_cast<ParameterException const*>(shared.exception().get());
    ASSERT_NE(nullptr, pInner);
    EXPECT_STREQ("boundary > 0", pInner->message());
}

} // namespace
