#include "media/WebStream.h"

#include "base/CancelWatch.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"
#include "media/Download.h"

#include <array>
#include <cerrno>
#include <chrono>
#include <cstring>
#include <fcntl.h>
#include <stdexcept>
#include <sys/stat.h>
#include <tonewright/host.h>
#include <unistd.h>

namespace host {

namespace fs = std::filesystem;

namespace {

// The plug-in for this type judges what it reads by its content, and reads pipes.
constexpr const char* kName = "stream.mka";
constexpr auto kDrainPause = std::chrono::milliseconds(2);

[[noreturn]] void failSystem() {
    throw std::runtime_error(
        tr("host.Stream.pipe", "The stream cannot be read: %REASON%", {{"%REASON%", std::strerror(errno)}}));
}

} // namespace

bool isEndless(const fs::path& address) {
    const CHandle job = createDownload(address);
    const CCancelWatch watch([&] { TONEWRIGHT_Host_CancelDownload(job.get()); });
    int64_t length = 0;
    const auto take = [](int64_t, int64_t total, void* user) -> int32_t {
        *static_cast<int64_t*>(user) = total;
        return TONEWRIGHT_STOP;
    };
    clearFailure();
    // Stopped by the function above unless the server sends nothing.
    if (TONEWRIGHT_Host_RunDownload(job.get(), "/dev/null", take, &length) != 1 && length == 0 &&
        !isCancelled())
        throw std::runtime_error(takeFailure(tr("host.Get.failed", "The download failed")));
    clearFailure();
    return length < 0;
}

CWebStream::CWebStream(const fs::path& address)
    : m_path(m_folder.getPath() / kName), m_job(createDownload(address)) {
    if (::mkfifo(m_path.c_str(), 0600) != 0) failSystem();
    m_keeper = ::open(m_path.c_str(), O_RDWR | O_NONBLOCK | O_CLOEXEC);
    if (m_keeper < 0) failSystem();
    try {
        m_thread = std::thread([this] { run(); });
    } catch (...) {
        ::close(m_keeper);
        throw;
    }
}

CWebStream::~CWebStream() {
    stop();
    m_thread.join();
}

void CWebStream::run() {
    clearFailure();
    const bool isWhole = TONEWRIGHT_Host_RunDownload(m_job.get(), m_path.c_str(), nullptr, nullptr) == 1;
    const std::string failure =
        isWhole || m_isStopped ? "" : takeFailure(tr("host.Get.failed", "The download failed"));
    const std::lock_guard lock(m_mutex);
    m_failure = failure;
    ::close(std::exchange(m_keeper, -1));
}

void CWebStream::stop() {
    m_isStopped = true;
    TONEWRIGHT_Host_CancelDownload(m_job.get());
    drain();
}

// The thread may be blocked by a full pipe. Returns once the thread has closed it.
void CWebStream::drain() {
    std::array<char, 65536> dropped;
    for (;; std::this_thread::sleep_for(kDrainPause)) {
        const std::lock_guard lock(m_mutex);
        if (m_keeper < 0) return;
        while (::read(m_keeper, dropped.data(), dropped.size()) > 0) {
        }
    }
}

std::string CWebStream::getFailure() const {
    const std::lock_guard lock(m_mutex);
    return m_failure;
}

} // namespace host
