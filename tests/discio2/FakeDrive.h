// A drive without hardware, for processes that run under umockdev-wrapper.
#pragma once

#include "discio2/FakeDisc.h"
#include "support/Process.h"

#include <filesystem>
#include <umockdev.h>

namespace tests {

// /dev/sr0, and /dev/sdb, which is a USB stick.
class CFakeDrive {
public:
    CFakeDrive();
    ~CFakeDrive();
    CFakeDrive(const CFakeDrive&) = delete;
    CFakeDrive& operator=(const CFakeDrive&) = delete;

    // The event of the kernel about the medium of a device, "sr0" or "sdb".
    void announce(const std::string& name, bool hasMedium, bool isChanged = true);
    // The sectors of a data track from that block on, 2048 bytes each. There is no other data then.
    void setData(const std::string& bytes, int block = 0);

private:
    UMockdevTestbed* m_testbed;
    UMockdevIoctlBase* m_handler;
};

// Runs disabled cases of this program in a process under umockdev-wrapper, the only place for a faked drive.
// The leak sanitizer misreads the thread-local storage of libraries that are loaded there.
inline SProcessResult runWithFakeDrive(const std::string& filter) {
    const std::string self = std::filesystem::read_symlink("/proc/self/exe");
    return run({"env", "ASAN_OPTIONS=verify_asan_link_order=0:intercept_tls_get_addr=0", "timeout", "100",
                "umockdev-wrapper", self, "--gtest_filter=" + filter, "--gtest_also_run_disabled_tests",
                "--gtest_brief=1"});
}

} // namespace tests
