/// What the module for the tests of exceptions across modules offers.
#pragma once

namespace ORVO {
class ExceptionBase;
}

namespace ORVO::Test {

struct PluginTable {
    /// Throws InternalException "thrown in the module".
    void (*throwInternal)();
    /// Lets a check of the library throw: ParameterException "value <= 0x80000000u".
    void (*throwParameter)();
    /// Throws a class derived from ExceptionBase that only the module knows, with the text "class of the
    /// module".
    void (*throwOwnClass)();
    /// Whether the module catches as InternalException what the function throws.
    bool (*catchesInternal)(void (*function)());
    /// Whether the module's dynamic_cast makes a LogicalException of it.
    bool (*isLogical)(ExceptionBase const* pException);
    /// A new InternalException, owned by the caller.
    ExceptionBase* (*makeInternal)();
};

using GetPluginTable = PluginTable const* (*)();

} // namespace ORVO::Test
