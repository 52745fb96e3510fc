#include "sonora2_slave/sandbox/Sandbox.h"

#include "sonora2_slave/sandbox/FileRules.h"
#include "sonora2_slave/sandbox/SystemCallFilter.h"

#include <algorithm>
#include <cerrno>
#include <fstream>
#include <malloc.h>
#include <sys/resource.h>
#include <system_error>
#include <unistd.h>

namespace slave {

namespace {

// Read late by the C library, codec libraries and the crash handler, after the first byte of a medium.
constexpr const char* kSystemFiles[] = {
    "/usr/lib",                // character sets of iconv and libraries that are loaded on first use
    "/usr/lib32",              //
    "/usr/lib64",              //
    "/usr/local/lib",          //
    "/lib",                    //
    "/lib64",                  //
    "/etc/ld.so.cache",        // finds them
    "/etc/localtime",          // timestamps of the log
    "/usr/share/zoneinfo",     //
    "/usr/share/locale",       //
    "/dev/urandom",            //
    "/dev/random",             //
    "/dev/zero",               //
    "/proc/self",              // memory map, threads
    "/proc/cpuinfo",           // codecs choose their code by the processor
    "/proc/meminfo",           //
    "/sys/devices/system/cpu", // number of processors
};

void setLimit(__rlimit_resource resource, rlim_t value) {
    rlimit limit{};
    if (::getrlimit(resource, &limit) != 0)
        throw std::system_error(errno, std::generic_category(), "getrlimit");
    // The soft limit as well: raising it again is refused, but need not even be tried.
    limit.rlim_max = std::min(limit.rlim_max, value);
    limit.rlim_cur = std::min(limit.rlim_cur, limit.rlim_max);
    if (::setrlimit(resource, &limit) != 0)
        throw std::system_error(errno, std::generic_category(), "setrlimit");
}

#ifdef TONEWRIGHT_SANITIZED
constexpr bool kCanLimitMemory = false; // sanitizers reserve terabytes
#else
constexpr bool kCanLimitMemory = true;
#endif

// Bytes of address space in use.
rlim_t getAddressSpace() {
    std::ifstream file("/proc/self/statm");
    rlim_t pages = 0;
    file >> pages;
    return pages * static_cast<rlim_t>(::sysconf(_SC_PAGESIZE));
}

void limitMemory(uint64_t bytes) {
    // An arena reserves 64 MiB of address space for each thread that allocates.
    ::mallopt(M_ARENA_MAX, 2);
    // Private memory, and the address space for what is mapped in other ways.
    setLimit(RLIMIT_DATA, bytes);
    setLimit(RLIMIT_AS, getAddressSpace() + bytes);
}

bool hasFolder(const std::vector<std::filesystem::path>& paths) {
    std::error_code ignored;
    return std::any_of(paths.begin(), paths.end(),
                       [&](const auto& path) { return std::filesystem::is_directory(path, ignored); });
}

} // namespace

std::vector<std::string> enterSandbox(const SSandbox& sandbox) {
    std::vector<std::string> lacking;
    const bool makesFiles = hasFolder(sandbox.writable);

    CFileRules rules;
    for (const char* path : kSystemFiles) rules.allowReading(path);
    rules.allowWriting("/dev/null");
    for (const std::filesystem::path& path : sandbox.readable) rules.allowReading(path);
    for (const std::filesystem::path& path : sandbox.writable) rules.allowWriting(path);

    setLimit(RLIMIT_CORE, 0);
    if (sandbox.fileLimit) setLimit(RLIMIT_NOFILE, sandbox.fileLimit);
    if (kCanLimitMemory && sandbox.memoryLimit) limitMemory(sandbox.memoryLimit);

    if (!rules.enforce())
        lacking.push_back("The kernel has no Landlock: files are not protected from the slave.");
    // Last: it refuses what the steps above need.
    if (!filterSystemCalls(makesFiles))
        lacking.push_back("The kernel does not filter system calls: the slave may make all of them.");
    return lacking;
}

} // namespace slave
