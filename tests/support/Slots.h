/// The place of a virtual operation in the function table of its class: part of the binary interface that
/// hosts and their modules are built against.
#pragma once

#include <cstddef>
#include <cstring>

namespace ORVO::Test {

/// The slot of a virtual operation, counted from 0; a virtual destructor takes two. By the Itanium C++ ABI, a
/// pointer to a virtual member holds one more than the operation's distance in bytes from the table's start.
template <typename Class, typename Result, typename... Arguments>
std::ptrdiff_t slotOf(Result (Class::*pOperation)(Arguments...)) {
    std::ptrdiff_t words[2];
    static_assert(sizeof(words) == sizeof(pOperation));
    std::memcpy(words, &pOperation, sizeof(words));
    return (words[0] - 1) / static_cast<std::ptrdiff_t>(sizeof(void*));
}

/// The same for an operation on constant objects.
template <typename Class, typename Result, typename... Arguments>
std::ptrdiff_t constSlotOf(Result (Class::*pOperation)(Arguments...) const) {
    std::ptrdiff_t words[2];
    static_assert(sizeof(words) == sizeof(pOperation));
    std::memcpy(words, &pOperation, sizeof(words));
    return (words[0] - 1) / static_cast<std::ptrdiff_t>(sizeof(void*));
}

} // namespace ORVO::Test
