#include "peru/net/posix/NetEvent.h"

#include "peru/net/SocketError.h"

#include <algorithm>
#include <cerrno>
#include <sys/eventfd.h>
#include <unistd.h>

namespace peru::net::posix {

namespace {

void notify(int descriptor) {
    const uint64_t one = 1;
    // Fails only if the counter is at its maximum, when the descriptor is readable anyway.
    [[maybe_unused]] const ssize_t written = ::write(descriptor, &one, sizeof one);
}

} // namespace

CNetEvent::CNetEvent() = default;
CNetEvent::~CNetEvent() = default;

void CNetEvent::set() {
    std::lock_guard lock(m_mutex);
    if (std::exchange(m_isSet, true)) return;
    if (m_handle.isOpen()) notify(m_handle.get());
}

bool CNetEvent::isSet() const {
    std::lock_guard lock(m_mutex);
    return m_isSet;
}

int CNetEvent::getDescriptor() {
    std::lock_guard lock(m_mutex);
    if (!m_handle.isOpen()) {
        m_handle = peru::posix::CFileHandle(::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK));
        if (!m_handle.isOpen()) throw CSocketError(errno);
        if (m_isSet) notify(m_handle.get());
    }
    return m_handle.get();
}

TimePoint getEnd(const SNetWait& wait) {
    constexpr int64_t kLongest = int64_t{1000} * 60 * 60 * 24 * 365; // stays within the clock's range
    if (wait.milliseconds < 0) return TimePoint::max();
    return std::chrono::steady_clock::now() +
           std::chrono::milliseconds(std::min(wait.milliseconds, kLongest));
}

bool waitForAny(std::vector<pollfd>& descriptors, TimePoint end, const P<INetEvent>& cancel) {
    const P<CNetEvent> event = tryCast<CNetEvent>(cancel);
    const size_t count = descriptors.size();
    bool wait = end > std::chrono::steady_clock::now();
    if (wait && event) descriptors.push_back({event->getDescriptor(), POLLIN, 0});
    int ready = 0;
    do {
        timespec time{0, 0};
        if (wait && end != TimePoint::max()) {
            const auto rest = std::max(std::chrono::nanoseconds(0),
                                       std::chrono::nanoseconds(end - std::chrono::steady_clock::now()));
            time.tv_sec = static_cast<time_t>(rest.count() / 1'000'000'000);
            time.tv_nsec = static_cast<long>(rest.count() % 1'000'000'000);
        }
        ready = ::ppoll(descriptors.data(), descriptors.size(),
                        wait && end == TimePoint::max() ? nullptr : &time, nullptr);
    } while (ready < 0 && errno == EINTR);
    const int error = errno;
    descriptors.resize(count);
    if (ready < 0) throw CSocketError(error);
    return std::any_of(descriptors.begin(), descriptors.end(),
                       [](const pollfd& d) { return d.revents != 0; });
}

bool waitForEvent(CNetEvent& event, const SNetWait& wait) {
    if (wait.milliseconds != 0 && !event.isSet()) {
        std::vector<pollfd> descriptors{{event.getDescriptor(), POLLIN, 0}};
        waitForAny(descriptors, getEnd(wait), wait.cancel);
    }
    return event.isSet();
}

} // namespace peru::net::posix

namespace peru::net {

P<INetEvent> createNetEvent() {
    return make<posix::CNetEvent>();
}

} // namespace peru::net
