#pragma once

#include "orvo/core/exceptions/CPURuntimeException.h"
#include "orvo/core/exceptions/SharedException.h"

#include <gtest/gtest.h>

#include <string>

namespace ORVO::Test {

/// Runs the statement, which must throw a SharedException, and hands the exception inside to `look`: null if
/// it is no `Exception`.
template <typename Exception, typename Statement, typename Look>
void lookIntoShared(Statement const& statement, Look const& look) {
    try {
        statement();
        ADD_FAILURE() << "nothing was thrown";
    } catch (SharedException const& shared) {
        auto const* const pInner = dynamic_cast<Exception const*>(shared.exception().get());
        EXPECT_NE(nullptr, pInner) << "another class: " << shared.what();
        look(pInner);
    }
}

/// The statement must throw a SharedException around an `Exception` with exactly the given message.
template <typename Exception, typename Statement>
void expectShared(Statement const& statement, std::string const& sMessage) {
    lookIntoShared<Exception>(statement, [&sMessage](Exception const* pInner) {
        EXPECT_EQ(sMessage, pInner != nullptr ? pInner->message() : "");
    });
}

/// The statement must throw a SharedException around what stands for every failure that is none of the
/// library's: a CPURuntimeException with condition 6.
template <typename Statement>
void expectSharedUnknown(Statement const& statement) {
    lookIntoShared<CPURuntimeException>(statement, [](CPURuntimeException const* pInner) {
        EXPECT_EQ(6, pInner != nullptr ? static_cast<int>(pInner->condition()) : -1);
    });
}

} // namespace ORVO::Test
