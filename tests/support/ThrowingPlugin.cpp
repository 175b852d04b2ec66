#include "tests/support/ThrowingPlugin.h"

#include "orvo/core/exceptions/InternalException.h"
#include "orvo/core/utility/Integers.h"

namespace {

using namespace ORVO;

class OwnException : public ExceptionBase {
public:
    char const* what() const noexcept override { return "class of the module"; }
    OwnException* clone() const override { return new OwnException(*this); }
};

void throwInternal() { throw InternalException("module.cpp", 1, "thrown in the module"); }

void throwParameter() { nextPowerOfTwo(0x80000001u); }

void throwOwnClass() { throw OwnException(); }

bool catchesInternal(void (*function)()) {
    try {
        function();
    } catch (InternalException const&) {
        return true;
    } catch (...) {
        return false;
    }
    return false;
}

bool isLogical(ExceptionBase const* pException) {
    return dynamic_cast<LogicalException const*>(pException) != nullptr;
}

ExceptionBase* makeInternal() { return new InternalException("module.cpp", 1, "made in the module"); }

} // namespace

extern "C" __attribute__((visibility("default"))) Test::PluginTable const* getPluginTable() {
    static Test::PluginTable const table = {throwInternal,   throwParameter, throwOwnClass,
                                            catchesInternal, isLogical,      makeInternal};
    return &table;
}
