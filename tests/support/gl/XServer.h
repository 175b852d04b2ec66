#pragma once

#include <string>

namespace ORVO::Test {

/// An X server without a screen, started on first use and ended with the process.
class XServer {
public:
    /// Its display, such as ":99". Throws std::runtime_error if it cannot be started.
    static std::string const& display();

    XServer(XServer const&) = delete;
    XServer& operator=(XServer const&) = delete;

private:
    XServer();
    ~XServer();

    int nProcess_ = -1;
    std::string sDisplay_;
};

} // namespace ORVO::Test
