// Files that a slave process leaves behind.
#pragma once

#include "peru/uri/IURI.h"
#include "sonora2/Api.h"

#include <cstdint>
#include <string>

namespace sonora2::common {

using peru::P;

// Creates an empty file with a new name, "sonora2_slave_..._log", that only this user can access. Returns its
// path, or an empty text if the folder cannot be written. The first call for a folder removes the empty files
// there of hosts that were killed: their slaves ended without being able to remove anything.
SONORA2_API std::string createCrashLog(const std::string& folder);
// Removes this user's empty crash logs in the folder that are older than a minute and not locked. A slave
// holds a lock on its own.
SONORA2_API void removeStaleCrashLogs(const std::string& folder) noexcept;

// The file that a format in a slave creates. If the slave dies, nobody else can remove it.
class SONORA2_API CUnfinishedOutput {
public:
    // Before the format is opened: notes whether the file exists.
    void expect(const P<peru::IURI>& target);
    // The format is open, so a file that was not there is its own.
    void opened();
    // The format has been closed or has removed the file itself.
    void forget() { m_path.clear(); }
    // Removes a file that the format has created, and no other one.
    void remove() noexcept;

private:
    std::string m_path; // empty if the file has existed before or is not a local one
    bool m_isKnown = false;
    uint64_t m_identity[2] = {}; // device and number
};

} // namespace sonora2::common
