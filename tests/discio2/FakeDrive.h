// A drive without hardware, for processes that run under umockdev-wrapper.
#pragma once

#include "discio2/FakeDisc.h"
#include "support/Process.h"

#include <filesystem>
#include <gtest/gtest.h>
#include <memory>
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

// Runs disabled cases of this program in processes under umockdev-wrapper, the only place for a faked drive;
// all at the same time, since they wait for the drive most of it. The leak sanitizer misreads the
// thread-local storage of libraries that are loaded there.
inline void runWithFakeDrive(const std::vector<std::string>& filters) {
    const std::string self = std::filesystem::read_symlink("/proc/self/exe");
    std::vector<std::unique_ptr<CProcess>> processes;
    for (const std::string& filter : filters)
        processes.push_back(std::make_unique<CProcess>(std::vector<std::string>{
            "env", "ASAN_OPTIONS=verify_asan_link_order=0:intercept_tls_get_addr=0", "timeout", "240",
            "umockdev-wrapper", self, "--gtest_filter=DISABLED_" + filter, "--gtest_also_run_disabled_tests",
            "--gtest_brief=1"}));
    for (const auto& process : processes) {
        const SProcessResult result = process->wait();
        EXPECT_EQ(result.exitCode, 0) << result.out << result.err;
    }
}

} // namespace tests
