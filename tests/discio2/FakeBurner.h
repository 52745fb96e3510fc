// A drive that writes, without hardware: what is written becomes the disc of the fake drive.
#pragma once

#include "discio2/FakeDrive.h"

#include <cstdint>
#include <map>

namespace tests {

struct SFakeBurner {
    bool isRewritable = false;
    unsigned profile = 0;      // of the medium; 0 for a CD
    int offset = 0;            // frames that audio is placed behind its place
    int failsAt = INT32_MIN;   // the block whose writing fails
    int damagedAt = INT32_MIN; // the block that is not written as it was sent
    int writeMicroseconds = 0; // the time that a write takes
    int speed = 0;             // kB in a second
    bool wasBlanked = false;
    bool isDummy = false;
    std::string cueSheet; // entries of 8 bytes
    std::map<int, std::string> blocks;
    std::string leadIn;  // CD-TEXT packs as they are repeated there
    std::string unknown; // commands that were refused
};
SFakeBurner& fakeBurner();

class CFakeBurner {
public:
    CFakeBurner();
    ~CFakeBurner();
    CFakeBurner(const CFakeBurner&) = delete;
    CFakeBurner& operator=(const CFakeBurner&) = delete;

private:
    UMockdevTestbed* m_testbed;
    UMockdevIoctlBase* m_handler;
};

} // namespace tests
