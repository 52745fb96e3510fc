// Confines a process that is about to read media of unknown origin.
#pragma once

#include <cstdint>
#include <filesystem>
#include <string>
#include <vector>

namespace slave {

inline constexpr uint64_t kDefaultMemoryLimit = uint64_t{1} << 30;
inline constexpr unsigned kDefaultFileLimit = 64;

// A file stands for itself, a folder for everything below it. A path that does not exist grants nothing: a
// file to be created needs its folder here, or has to exist already. Links are followed once, at entry.
struct SSandbox {
    std::vector<std::filesystem::path> readable;
    // Files may be read, written and truncated; in folders, files may also be created, renamed and removed.
    std::vector<std::filesystem::path> writable;
    uint64_t memoryLimit = kDefaultMemoryLimit; // bytes in addition to the libraries; 0: no limit
    unsigned fileLimit = kDefaultFileLimit;     // open descriptors; 0: no limit
};

// Confines the whole process for the rest of its life, including threads that are running already; it may be
// called at any time by one thread. From then on
// - only the given files can be opened, and what code needs that is loaded late: system libraries, locales,
//   time zones, random numbers, /dev/null and the process's own entries below /proc;
// - no program can be started, no other process signalled, traced or inspected, no socket made or connected,
//   no file system mounted, and no attribute of a file changed by path; such calls fail with EPERM;
// - there are no core dumps, and memory and descriptors are limited.
// Descriptors that are open stay usable: close what the process should not have.
//
// Returns what this kernel lacks, one sentence each, for the log: the rest is in force. Throws
// std::exception if something fails that the kernel supports; the process is then partly confined and has to
// end. Calls of other threads may be interrupted once (EINTR).
std::vector<std::string> enterSandbox(const SSandbox& sandbox);

} // namespace slave
