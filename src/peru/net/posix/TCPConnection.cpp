#include "peru/net/posix/TCPConnection.h"

#include "peru/net/SocketError.h"

#include <algorithm>
#include <cerrno>

namespace peru::net::posix {

namespace {
constexpr std::chrono::milliseconds kHeadStart(250);
}

CTCPConnection::CTCPConnection(std::vector<P<ITCPAddress>> addresses) : m_addresses(std::move(addresses)) {
    startNext(std::chrono::steady_clock::now());
}

CTCPConnection::~CTCPConnection() = default;

// Starts the next attempt, or more if they fail at once.
void CTCPConnection::startNext(TimePoint now) {
    while (m_next < m_addresses.size()) {
        int error = 0;
        peru::posix::CFileHandle handle = CSocket::startConnecting(*m_addresses[m_next++], error);
        if (error != 0) {
            noteError(error);
            continue;
        }
        m_attempts.push_back(std::move(handle));
        m_nextStart = now + kHeadStart;
        return;
    }
}

// A family that this machine does not have says less than the answer of a remote host.
void CTCPConnection::noteError(int error) {
    const auto isLocal = [](int e) {
        return e == 0 || e == ENETUNREACH || e == EAFNOSUPPORT || e == EADDRNOTAVAIL;
    };
    if (isLocal(m_error) || !isLocal(error)) m_error = error;
}

bool CTCPConnection::checkAttempts(const std::vector<pollfd>& states) {
    bool failed = false;
    for (size_t i = states.size(); i-- > 0;) {
        if (states[i].revents == 0) continue;
        const int error = CSocket::getConnectError(states[i].fd);
        if (error == 0) {
            m_socket = make<CSocket>(std::move(m_attempts[i]));
            m_attempts.clear();
            return true;
        }
        noteError(error);
        m_attempts.erase(m_attempts.begin() + static_cast<ptrdiff_t>(i));
        failed = true;
    }
    if (failed) startNext(std::chrono::steady_clock::now());
    return false;
}

bool CTCPConnection::isConnected(const SNetWait& wait) {
    if (m_closed) throw CStreamClosedError();
    const TimePoint end = getEnd(wait);
    while (!m_socket) {
        TimePoint now = std::chrono::steady_clock::now();
        if (m_next < m_addresses.size() && (m_attempts.empty() || now >= m_nextStart)) startNext(now);
        if (m_attempts.empty()) throw CSocketError(m_error);
        std::vector<pollfd> states;
        for (const peru::posix::CFileHandle& attempt : m_attempts)
            states.push_back({attempt.get(), POLLOUT, 0});
        const TimePoint until = m_next < m_addresses.size() ? std::min(end, m_nextStart) : end;
        const bool ready = waitForAny(states, until, wait.cancel);
        if (ready && checkAttempts(states)) break;
        if (wait.cancel && wait.cancel->isSet()) return false;
        if (!ready && std::chrono::steady_clock::now() >= end) return false;
    }
    return true;
}

const P<CSocket>& CTCPConnection::getSocket() const {
    if (m_closed || !m_socket) throw CStreamClosedError();
    return m_socket;
}

P<INetInStream> CTCPConnection::getInStream() {
    return make<CSocketInStream>(getSocket());
}

P<INetOutStream> CTCPConnection::getOutStream() {
    return make<CSocketOutStream>(getSocket());
}

void CTCPConnection::close() {
    m_closed = true;
    m_attempts.clear();
    if (m_socket) m_socket->close();
}

CTCPConnectionFactory::CTCPConnectionFactory() = default;
CTCPConnectionFactory::~CTCPConnectionFactory() = default;

P<IConnection> CTCPConnectionFactory::tryStart(const Addresses& addresses) {
    std::vector<P<ITCPAddress>> supported;
    for (const P<INetAddress>& address : addresses)
        if (P<ITCPAddress> tcp = tryCast<ITCPAddress>(address)) supported.push_back(tcp);
    if (supported.empty()) return nullptr;
    return make<CTCPConnection>(std::move(supported));
}

} // namespace peru::net::posix
