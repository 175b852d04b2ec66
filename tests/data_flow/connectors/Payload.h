#pragma once

#include <stdexcept>

namespace ORVO::Test {

/// A data object that counts itself: how many live, how many copies were made. A copy can be made to fail.
struct Payload {
    explicit Payload(int iValue) : iValue_(iValue) { ++nAlive; }
    Payload(Payload const& oOther) : iValue_(oOther.iValue_) {
        if (bCopiesFail) {
            throw std::runtime_error("no copy");
        }
        ++nAlive;
        ++nCopies;
    }
    Payload& operator=(Payload const&) = delete;
    ~Payload() { --nAlive; }

    static void resetCounts() {
        nAlive = 0;
        nCopies = 0;
        bCopiesFail = false;
    }

    int iValue_;
    inline static int nAlive = 0;
    inline static int nCopies = 0;
    inline static bool bCopiesFail = false;
};

/// Another data type, so that connectors can differ.
struct OtherPayload {
    int iValue_ = 0;
};

} // namespace ORVO::Test
