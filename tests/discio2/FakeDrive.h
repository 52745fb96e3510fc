// A drive without hardware, for processes that run under umockdev-wrapper.
#pragma once

#include <cstring>
#include <linux/cdrom.h>
#include <string>
#include <umockdev.h>
#include <vector>

namespace tests {

// What is in the drive: audio tracks in a row. Guarded by the tests' order: it changes only between calls.
struct SFakeDisc {
    bool isPresent = true;
    bool isBlank = false;
    bool hasChanged = false; // since the drive was last asked
    std::vector<int> starts; // blocks of the tracks, then of the lead-out
    std::string samples;     // from block 0
    std::string textPacks;
    int badBlock = -1;  // cannot be read
    int shakyReads = 0; // that many reads deliver samples of the wrong place
};
SFakeDisc& fakeDisc();

class CFakeDrive {
public:
    CFakeDrive();
    ~CFakeDrive();
    CFakeDrive(const CFakeDrive&) = delete;
    CFakeDrive& operator=(const CFakeDrive&) = delete;

    // The event of the kernel when a medium is put in or taken out.
    void announce(bool hasMedium);

private:
    UMockdevTestbed* m_testbed;
    UMockdevIoctlBase* m_handler;
    std::string m_device; // in sysfs
};

} // namespace tests
