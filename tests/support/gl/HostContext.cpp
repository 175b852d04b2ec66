#include "tests/support/gl/HostContext.h"

namespace ORVO::Test {

HostContext::~HostContext() = default;

std::unique_ptr<HostContext> HostContext::create(std::string const& sInterface) {
    return sInterface == "GLX" ? createGLX() : createEGL();
}

} // namespace ORVO::Test
