#include "peru/threads/posix/MutexSegment.h"

#include "peru/posix/PlatformFile.h"

#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <map>
#include <mutex>
#include <sys/file.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

namespace peru::posix {

// A segment is ready once it has a stamp. The stamp is written last, under the file lock, so that the next
// process initialises the segment again if a process dies half way. A stamp from before a reboot is invalid:
// the mutex may have an owner that no longer exists.
struct CMutexSegment::SLayout {
    struct SStamp {
        uint32_t version;
        uint32_t mutexSize; // differs between the word sizes that a machine can run
        char bootId[40];
    };
    SStamp stamp;
    alignas(16) pthread_mutex_t mutex;
};

namespace {

constexpr uint32_t kVersion = 1;
constexpr size_t kLongestName = 150;

// Maps each name to a distinct file name: characters that are special in paths are written in hexadecimal,
// and a name that is too long is cut and ends in a hash of the whole name.
std::string getFileName(const std::string& name) {
    static const char digits[] = "0123456789abcdef";
    std::string result = "tonewright-mutex-" + std::to_string(geteuid()) + "-";
    size_t start = result.size();
    uint64_t hash = 0xcbf29ce484222325u;
    for (unsigned char byte : name) {
        hash = (hash ^ byte) * 0x100000001b3u;
        bool plain = (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z') ||
                     (byte >= '0' && byte <= '9') || byte == '-' || byte == '_';
        if (plain)
            result += static_cast<char>(byte);
        else
            result.append({'%', digits[byte >> 4], digits[byte & 15]});
    }
    if (result.size() - start <= kLongestName) return result;
    result.resize(start + kLongestName);
    result += '.'; // names that are not cut contain no "."
    for (int shift = 60; shift >= 0; shift -= 4) result += digits[hash >> shift & 15];
    return result + '.' + std::to_string(name.size());
}

// The same for every process, whatever its environment: processes with different folders would not exclude
// each other.
std::string getPath(const std::string& name) {
    struct stat status;
    const bool hasSharedMemory = ::stat("/dev/shm", &status) == 0 && S_ISDIR(status.st_mode);
    return (hasSharedMemory ? "/dev/shm/" : "/tmp/") + getFileName(name);
}

bool isUsable(const struct stat& status) {
    return S_ISREG(status.st_mode) && status.st_uid == ::geteuid() && (status.st_mode & 0077) == 0;
}

// Follows no link and accepts only a regular file owned by the user, so that nobody else with write access to
// the folder can substitute the file.
CFileHandle openFile(const std::string& path, int flags) {
    CFileHandle file(::open(path.c_str(), O_RDWR | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK | flags, 0600));
    struct stat status;
    if (file.isOpen() && (::fstat(file.get(), &status) != 0 || !isUsable(status))) file.close();
    return file;
}

bool isRemoved(int file) {
    struct stat status;
    return ::fstat(file, &status) == 0 && status.st_nlink == 0;
}

// Held while a process starts or ends using the file. Unlocks explicitly: a mapping would keep the lock alive
// after the file is closed.
class CFileLock {
public:
    explicit CFileLock(int descriptor) : m_descriptor(descriptor) {
        do m_locked = set(F_WRLCK);
        while (!m_locked && errno == EINTR);
    }
    ~CFileLock() { set(F_UNLCK); }
    CFileLock(const CFileLock&) = delete;
    CFileLock& operator=(const CFileLock&) = delete;

    bool isLocked() const { return m_locked; }

private:
    bool set(short type) const {
        struct flock range = {};
        range.l_type = type;
        range.l_whence = SEEK_SET;
        range.l_len = 1;
        return ::fcntl(m_descriptor, F_OFD_SETLKW, &range) == 0;
    }

    int m_descriptor;
    bool m_locked = false;
};

void readBootId(char (&id)[40]) {
    std::memset(id, 0, sizeof id);
    CFileHandle file(::open("/proc/sys/kernel/random/boot_id", O_RDONLY | O_CLOEXEC));
    // Without this file segments from before a reboot cannot be recognised.
    if (file.isOpen() && ::read(file.get(), id, 36) != 36) std::memset(id, 0, sizeof id);
}

// The segments mapped by this process.
struct SRegistry {
    std::mutex mutex;
    std::map<std::string, std::weak_ptr<CMutexSegment>> segments;
};

SRegistry& getRegistry() {
    // Never destroyed: the last singletons may still create or release a mutex.
    alignas(SRegistry) static char memory[sizeof(SRegistry)];
    static SRegistry* registry = ::new (memory) SRegistry;
    return *registry;
}

} // namespace

bool CMutexSegment::prepare(SLayout& layout) {
    SLayout::SStamp stamp;
    std::memset(&stamp, 0, sizeof stamp);
    stamp.version = kVersion;
    stamp.mutexSize = sizeof(pthread_mutex_t);
    readBootId(stamp.bootId);
    if (std::memcmp(&layout.stamp, &stamp, sizeof stamp) == 0) return true;
    bool current = std::memcmp(layout.stamp.bootId, stamp.bootId, sizeof stamp.bootId) == 0;
    if (layout.stamp.version != 0 && current) return false; // written by another build and possibly in use

    std::memset(&layout, 0, sizeof layout);
    pthread_mutexattr_t attributes;
    pthread_mutexattr_init(&attributes);
    pthread_mutexattr_settype(&attributes, PTHREAD_MUTEX_RECURSIVE);
    pthread_mutexattr_setpshared(&attributes, PTHREAD_PROCESS_SHARED);
    pthread_mutexattr_setrobust(&attributes, PTHREAD_MUTEX_ROBUST);
    int result = pthread_mutex_init(&layout.mutex, &attributes);
    pthread_mutexattr_destroy(&attributes);
    if (result != 0) return false;
    // Other processes read the stamp under the file lock, so only the order of the writes of this process
    // matters, in case it is killed here.
    std::atomic_signal_fence(std::memory_order_seq_cst);
    layout.stamp = stamp;
    return true;
}

CMutexSegment::SLayout* CMutexSegment::map(const std::string& path) {
    for (;;) {
        const CFileHandle file = openFile(path, O_CREAT);
        if (!file.isOpen()) return nullptr;
        const CFileLock lock(file.get());
        if (!lock.isLocked()) return nullptr;
        if (isRemoved(file.get())) continue; // by its last user, while this process waited for the lock
        struct stat status;
        if (::fstat(file.get(), &status) != 0) return nullptr;
        constexpr auto size = static_cast<off_t>(sizeof(SLayout));
        // Allocated rather than only extended: a full disk is then an error here and not a SIGBUS on first
        // access.
        if (status.st_size < size && ::posix_fallocate(file.get(), 0, size) != 0) return nullptr;
        // Marks the file as in use. The mapping keeps this lock alive after the file is closed, also in
        // children.
        if (::flock(file.get(), LOCK_SH | LOCK_NB) != 0) return nullptr;
        void* memory = ::mmap(nullptr, sizeof(SLayout), PROT_READ | PROT_WRITE, MAP_SHARED, file.get(), 0);
        if (memory == MAP_FAILED) return nullptr;
        auto* layout = static_cast<SLayout*>(memory);
        if (prepare(*layout)) return layout;
        ::munmap(memory, sizeof(SLayout));
        return nullptr;
    }
}

std::shared_ptr<CMutexSegment> CMutexSegment::open(const std::string& name) {
    std::string path = getPath(name);
    SRegistry& registry = getRegistry();
    std::lock_guard lock(registry.mutex);
    std::erase_if(registry.segments, [](const auto& entry) { return entry.second.expired(); });
    std::weak_ptr<CMutexSegment>& entry = registry.segments[path];
    std::shared_ptr<CMutexSegment> segment = entry.lock();
    if (segment) return segment;
    SLayout* layout = map(path);
    if (layout) {
        segment.reset(new CMutexSegment(path, layout));
        entry = segment;
    }
    return segment;
}

CMutexSegment::~CMutexSegment() {
    if (m_locks.load(std::memory_order_relaxed) != 0) return;
    const CFileHandle file = openFile(m_path, 0);
    if (!file.isOpen()) {
        ::munmap(m_layout, sizeof(SLayout));
        return;
    }
    const CFileLock lock(file.get());
    ::munmap(m_layout, sizeof(SLayout));
    // Nobody starts using the file while this process holds the lock.
    const bool isLastUser = ::flock(file.get(), LOCK_EX | LOCK_NB) == 0;
    if (isLastUser && lock.isLocked() && !isRemoved(file.get())) ::unlink(m_path.c_str());
}

pthread_mutex_t* CMutexSegment::getMutex() const {
    return &m_layout->mutex;
}

} // namespace peru::posix
