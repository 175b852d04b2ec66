/// Expectations on failures of the public filter graph.
#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "orvo/filter_graph/impl/ErrorOrWarningInfo.h"
#include "orvo/filter_graph/impl/Exception.h"

// The statement must throw a FilterGraph::Exception with exactly one record: an error with exactly the given
// message, which is about no text of the host's (both numbers are 0).
#define ORVO_EXPECT_FILTERGRAPH(statement, text)                                                             \
    do {                                                                                                     \
        try {                                                                                                \
            statement;                                                                                       \
            ADD_FAILURE() << #statement << " threw nothing; expected FilterGraph::Exception: " << (text);    \
        } catch (::ORVO::FilterGraph::Exception const& orvoCaught) {                                         \
            ASSERT_EQ(1u, orvoCaught.errorsAndWarnings().size()) << #statement;                              \
            EXPECT_TRUE(orvoCaught.errorsAndWarnings()[0].isError()) << #statement;                          \
            EXPECT_EQ(std::string(text), std::string(orvoCaught.errorsAndWarnings()[0].message()))           \
                << #statement;                                                                               \
            EXPECT_EQ(0, orvoCaught.errorsAndWarnings()[0].inputStringId()) << #statement;                   \
            EXPECT_EQ(0, orvoCaught.errorsAndWarnings()[0].line()) << #statement;                            \
        } catch (std::exception const& orvoCaught) {                                                         \
            ADD_FAILURE() << #statement << " threw " << typeid(orvoCaught).name() << ": "                    \
                          << orvoCaught.what() << "; expected FilterGraph::Exception: " << (text);           \
        }                                                                                                    \
    } while (false)
