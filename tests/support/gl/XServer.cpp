#include "tests/support/gl/XServer.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <stdexcept>

namespace ORVO::Test {

namespace {

/// Time for the server to come up on a busy machine, in milliseconds.
constexpr int nPatience = 60000;

/// Runs in the new process: becomes the server, which writes its display's number to the pipe.
[[noreturn]] void becomeServer(int nPipe) {
    prctl(PR_SET_PDEATHSIG, SIGTERM); // it ends with the tests, however they end
    int const nNull = open("/dev/null", O_RDWR);
    dup2(nNull, STDOUT_FILENO);
    dup2(nNull, STDERR_FILENO);
    std::string const sPipe = std::to_string(nPipe);
    execlp("Xvfb", "Xvfb", "-displayfd", sPipe.c_str(), "-screen", "0", "320x240x24", "-nolisten", "tcp",
           "+extension", "GLX", static_cast<char*>(nullptr));
    _exit(127);
}

std::string readLine(int nPipe) {
    std::string sLine;
    for (;;) {
        pollfd waited{nPipe, POLLIN, 0};
        char c = 0;
        if (poll(&waited, 1, nPatience) <= 0 || read(nPipe, &c, 1) != 1)
            return {};
        if (c == '\n')
            return sLine;
        sLine += c;
    }
}

} // namespace

XServer::XServer() {
    int aPipe[2];
    if (pipe(aPipe) != 0)
        throw std::runtime_error("no pipe for the X server");
    nProcess_ = fork();
    if (nProcess_ == 0) {
        close(aPipe[0]);
        becomeServer(aPipe[1]);
    }
    close(aPipe[1]);
    std::string const sNumber = readLine(aPipe[0]);
    close(aPipe[0]);
    if (sNumber.empty())
        throw std::runtime_error("Xvfb does not start");
    sDisplay_ = ":" + sNumber;
}

XServer::~XServer() {
    kill(nProcess_, SIGTERM);
    waitpid(nProcess_, nullptr, 0);
}

std::string const& XServer::display() {
    static XServer const oServer;
    return oServer.sDisplay_;
}

} // namespace ORVO::Test
