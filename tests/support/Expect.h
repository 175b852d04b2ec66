/// Expectations on failures: each compares the whole text.
#pragma once

#include <gtest/gtest.h>

#include <string>
#include <typeinfo>

#include "orvo/core/exceptions/InternalException.h"
#include "orvo/core/exceptions/ParameterException.h"
#include "orvo/core/exceptions/ResourceException.h"

namespace ORVO::Test {

/// The text that the exception's interface calls its message.
template <typename Exception>
std::string messageOf(Exception const& exception) {
    return exception.message();
}

} // namespace ORVO::Test

// The statement must throw exactly the given class (no subclass of it) with exactly the given message.
#define ORVO_EXPECT_THROW_MESSAGE(statement, Exception, text)                                                \
    do {                                                                                                     \
        try {                                                                                                \
            statement;                                                                                       \
            ADD_FAILURE() << #statement << " threw nothing; expected " #Exception ": " << (text);            \
        } catch (Exception const& orvoCaught) {                                                              \
            EXPECT_EQ(std::string(text), ::ORVO::Test::messageOf(orvoCaught)) << #statement;                 \
            EXPECT_TRUE(typeid(orvoCaught) == typeid(Exception)) << "threw " << typeid(orvoCaught).name();   \
        } catch (std::exception const& orvoCaught) {                                                         \
            ADD_FAILURE() << #statement << " threw " << typeid(orvoCaught).name() << ": "                    \
                          << orvoCaught.what() << "; expected " #Exception ": " << (text);                   \
        }                                                                                                    \
    } while (false)

#define ORVO_EXPECT_INTERNAL(statement, text)                                                                \
    ORVO_EXPECT_THROW_MESSAGE(statement, ::ORVO::InternalException, text)
#define ORVO_EXPECT_PARAMETER(statement, text)                                                               \
    ORVO_EXPECT_THROW_MESSAGE(statement, ::ORVO::ParameterException, text)
#define ORVO_EXPECT_RESOURCE(statement, text)                                                                \
    ORVO_EXPECT_THROW_MESSAGE(statement, ::ORVO::ResourceException, text)
