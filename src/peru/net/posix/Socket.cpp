#include "peru/net/posix/Socket.h"

#include "peru/net/SocketError.h"
#include "peru/net/posix/NetEvent.h"
#include "peru/streams/StreamTools.h"

#include <cerrno>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>

namespace peru::net::posix {

using peru::posix::CFileHandle;

namespace {

socklen_t fillAddress(const ITCPAddress& address, sockaddr_storage& out) {
    const P<IIPAddress> ip = address.getIPAddress();
    const std::span<const uint8_t> bytes = ip->getBytes();
    out = {};
    if (!ip->isIPv6()) {
        sockaddr_in data = {};
        data.sin_family = AF_INET;
        data.sin_port = htons(address.getPort());
        std::memcpy(&data.sin_addr, bytes.data(), bytes.size());
        std::memcpy(&out, &data, sizeof data);
        return sizeof data;
    }
    sockaddr_in6 data = {};
    data.sin6_family = AF_INET6;
    data.sin6_port = htons(address.getPort());
    data.sin6_scope_id = ip->getScope();
    std::memcpy(&data.sin6_addr, bytes.data(), bytes.size());
    std::memcpy(&out, &data, sizeof data);
    return sizeof data;
}

bool wouldBlock(int error) {
    return error == EAGAIN || error == EWOULDBLOCK;
}

} // namespace

CSocket::CSocket(CFileHandle handle) : m_handle(std::move(handle)) {}
CSocket::~CSocket() = default;

CFileHandle CSocket::startConnecting(const ITCPAddress& address, int& error) {
    sockaddr_storage target;
    const socklen_t size = fillAddress(address, target);
    error = 0;
    CFileHandle handle(::socket(target.ss_family, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, IPPROTO_TCP));
    if (!handle.isOpen()) {
        error = errno;
        return handle;
    }
    // A request's head and body are written one after the other; the body must not wait for an
    // acknowledgement.
    const int on = 1;
    ::setsockopt(handle.get(), IPPROTO_TCP, TCP_NODELAY, &on, sizeof on);
    // An interrupted call goes on in the background like one in progress.
    if (::connect(handle.get(), reinterpret_cast<const sockaddr*>(&target), size) != 0 &&
        errno != EINPROGRESS && errno != EINTR) {
        error = errno;
        return CFileHandle();
    }
    return handle;
}

int CSocket::getConnectError(int descriptor) {
    int error = 0;
    socklen_t size = sizeof error;
    return ::getsockopt(descriptor, SOL_SOCKET, SO_ERROR, &error, &size) == 0 ? error : errno;
}

int CSocket::getDescriptor() const {
    if (!m_handle.isOpen()) throw CStreamClosedError();
    return m_handle.get();
}

std::optional<int64_t> CSocket::receive(void* buffer, int64_t size) {
    const int descriptor = getDescriptor();
    for (;;) {
        const ssize_t count = ::recv(descriptor, buffer, static_cast<size_t>(size), 0);
        if (count >= 0) return count;
        if (wouldBlock(errno)) return std::nullopt;
        if (errno != EINTR) throw CSocketError(errno);
    }
}

int64_t CSocket::send(const void* buffer, int64_t size) {
    const int descriptor = getDescriptor();
    for (;;) {
        const ssize_t count = ::send(descriptor, buffer, static_cast<size_t>(size), MSG_NOSIGNAL);
        if (count >= 0) return count;
        if (wouldBlock(errno)) return 0;
        if (errno != EINTR) throw CSocketError(errno);
    }
}

bool CSocket::wait(short events, const SNetWait& wait) {
    std::vector<pollfd> descriptors{{getDescriptor(), events, 0}};
    return waitForAny(descriptors, getEnd(wait), wait.cancel);
}

void CSocket::close() {
    m_handle.close();
}

CSocketInStream::CSocketInStream(const P<CSocket>& socket) : m_socket(socket) {}
CSocketInStream::~CSocketInStream() = default;

void CSocketInStream::close() {
    m_socket->close();
}

P<IURI> CSocketInStream::getURI() const {
    return nullptr;
}

bool CSocketInStream::isAtEnd() {
    uint8_t next = 0;
    if (m_peeked) return false;
    if (readSome(&next, 1) == 0) return true;
    m_peeked = next;
    return false;
}

void CSocketInStream::read(void* buffer, int64_t size) {
    readFully(*this, buffer, size);
}

int64_t CSocketInStream::readSome(void* buffer, int64_t size) {
    for (;;) {
        if (const std::optional<int64_t> count = tryRead(buffer, size)) return *count;
        isReadable({SNetWait::kForever, nullptr});
    }
}

void CSocketInStream::skip(int64_t size) {
    skipByReading(*this, size);
}

std::optional<int64_t> CSocketInStream::tryRead(void* buffer, int64_t size) {
    checkStreamSize(size, "INetInStream::tryRead");
    if (size > 0 && m_peeked) {
        *static_cast<uint8_t*>(buffer) = *m_peeked;
        m_peeked.reset();
        return 1;
    }
    return m_socket->receive(buffer, size);
}

bool CSocketInStream::isReadable(const SNetWait& wait) {
    return m_peeked || m_socket->wait(POLLIN, wait);
}

CSocketOutStream::CSocketOutStream(const P<CSocket>& socket) : m_socket(socket) {}
CSocketOutStream::~CSocketOutStream() = default;

void CSocketOutStream::close() {
    m_socket->close();
}

P<IURI> CSocketOutStream::getURI() const {
    return nullptr;
}

bool CSocketOutStream::isAtEnd() {
    return true;
}

void CSocketOutStream::write(const void* buffer, int64_t size) {
    checkStreamSize(size, "IOutStream::write");
    const uint8_t* source = static_cast<const uint8_t*>(buffer);
    while (size > 0) {
        const int64_t count = tryWrite(source, size);
        if (count == 0) isWritable({SNetWait::kForever, nullptr});
        source += count;
        size -= count;
    }
}

void CSocketOutStream::flush() {}

int64_t CSocketOutStream::tryWrite(const void* buffer, int64_t size) {
    checkStreamSize(size, "INetOutStream::tryWrite");
    return m_socket->send(buffer, size);
}

bool CSocketOutStream::isWritable(const SNetWait& wait) {
    return m_socket->wait(POLLOUT, wait);
}

} // namespace peru::net::posix
