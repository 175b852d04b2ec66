// A host that is not linked to the library: it loads two modules with local symbols, each of which brings the
// library along. What one throws, the other must catch by its class. The paths of the modules are the
// arguments; the result is 0 if all holds.
#include <dlfcn.h>

#include <cstdio>

#include "tests/support/ThrowingPlugin.h"

namespace {

ORVO::Test::PluginTable const* load(char const* pPath) {
    void* const pModule = dlopen(pPath, RTLD_NOW | RTLD_LOCAL);
    if (pModule == nullptr) {
        std::fprintf(stderr, "%s\n", dlerror());
        return nullptr;
    }
    auto const getTable = reinterpret_cast<ORVO::Test::GetPluginTable>(dlsym(pModule, "getPluginTable"));
    return getTable != nullptr ? getTable() : nullptr;
}

bool expect(bool bHolds, char const* pText) {
    if (!bHolds)
        std::fprintf(stderr, "does not hold: %s\n", pText);
    return bHolds;
}

} // namespace

int main(int argc, char** argv) {
    if (!expect(argc == 3, "two modules are given"))
        return 2;
    auto const* const pFirst = load(argv[1]);
    auto const* const pSecond = load(argv[2]);
    if (!expect(pFirst != nullptr && pSecond != nullptr, "both modules load"))
        return 2;
    bool bAll = expect(pFirst != pSecond, "the modules are two");
    bAll &=
        expect(pSecond->catchesInternal(pFirst->throwInternal), "the second catches what the first throws");
    bAll &= expect(!pSecond->catchesInternal(pFirst->throwParameter),
                   "a ParameterException is no InternalException");
    bAll &=
        expect(pFirst->catchesInternal(pSecond->throwInternal), "the first catches what the second throws");
    return bAll ? 0 : 1;
}
