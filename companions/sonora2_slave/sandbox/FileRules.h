// The files that a process may open, enforced by Landlock.
#pragma once

#include <filesystem>

namespace slave {

// Everything that is not allowed is refused with EACCES. Newer kernels refuse more: connections over TCP and
// to abstract sockets, signals to other processes, requests to devices. Without Landlock all operations do
// nothing. Throws std::system_error on failures.
class CFileRules {
public:
    CFileRules();
    ~CFileRules();
    CFileRules(const CFileRules&) = delete;
    CFileRules& operator=(const CFileRules&) = delete;

    // Paths that do not exist, or that the user cannot reach, are skipped.
    void allowReading(const std::filesystem::path& path);
    void allowWriting(const std::filesystem::path& path);
    // For all threads and for good, with no_new_privs; false without Landlock.
    bool enforce();

private:
    void allow(const std::filesystem::path& path, uint64_t rights);

    int m_ruleset = -1;
    uint64_t m_handled = 0; // rights that this kernel knows
};

} // namespace slave
