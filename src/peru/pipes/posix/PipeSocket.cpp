#include "peru/pipes/posix/PipeSocket.h"

#include "peru/pipes/PipeErrors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"

#include <array>
#include <cerrno>
#include <ctime>
#include <poll.h>
#include <sys/eventfd.h>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <sys/uio.h>
#include <unistd.h>

namespace peru::posix {

namespace {

int64_t getNow() {
    timespec now;
    clock_gettime(CLOCK_MONOTONIC, &now);
    return now.tv_sec * 1'000'000'000 + now.tv_nsec;
}

// The texts are titles and have no description.
[[noreturn]] void throwTitle(const P<IString>& title) {
    throw CException(nullptr, title);
}

[[noreturn]] void throwInvalidHandle() {
    throwTitle(newString("Invalid pipe handle"));
}

[[noreturn]] void throwReadError(int error) {
    throwTitle(format("Error read data from pipe: %s", getSystemText(error)));
}

[[noreturn]] void throwWriteError() {
    throwTitle(newString("Error write data to pipe"));
}

[[noreturn]] void throwReadLate() {
    throwTitle(
        localize("peru.CPipeSocket.readDeadline", "The deadline for reading from the pipe has passed"));
}

[[noreturn]] void throwWriteLate() {
    throwTitle(localize("peru.CPipeSocket.writeDeadline", "The deadline for writing to the pipe has passed"));
}

} // namespace

CWakeEvent::CWakeEvent() : m_event(::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)) {
    if (!m_event.isOpen())
        throw CError(localize("peru.CSignalImpl.createError", "Error creating event (%ERRORDESC%).",
                              {{"%ERRORDESC%", getSystemText(errno)}}));
}

void CWakeEvent::set() noexcept {
    // Fails only if the counter is at its limit, when the event is set anyway.
    ::eventfd_write(m_event.get(), 1);
}

void CWakeEvent::reset() noexcept {
    eventfd_t value;
    ::eventfd_read(m_event.get(), &value);
}

void CPipeSocket::CWait::setDeadline(uint32_t milliseconds) {
    m_milliseconds = milliseconds;
    m_deadline = milliseconds == IPipeStream::kNoDeadline ? 0 : getNow() + int64_t{milliseconds} * 1'000'000;
}

bool CPipeSocket::CWait::extend() {
    if (!m_extension || !m_extension()) return false;
    setDeadline(m_milliseconds);
    return true;
}

bool CPipeSocket::CWait::hasPassed() {
    const int64_t deadline = m_deadline;
    return deadline != 0 && getNow() >= deadline && !extend();
}

void CPipeSocket::CWait::abort() noexcept {
    m_aborted = true;
    m_wake.set();
}

void CPipeSocket::CWait::resume() noexcept {
    m_aborted = false;
    m_wake.reset();
}

CPipeSocket::CPipeSocket() = default;

CPipeSocket::~CPipeSocket() = default;

void CPipeSocket::attach(CFileHandle socket) {
    m_buffer = std::make_unique<uint8_t[]>(kBufferSize);
    m_socket = std::move(socket);
    m_descriptor.store(m_socket.get(), std::memory_order_release);
}

void CPipeSocket::close() noexcept {
    m_closed.store(true, std::memory_order_release);
    if (isAttached()) ::shutdown(getDescriptor(), SHUT_RDWR);
}

void CPipeSocket::requireOpen() const {
    if (!isOpen()) throwInvalidHandle();
}

bool CPipeSocket::isPeerGone() const {
    if (!isOpen()) return true;
    pollfd socket = {getDescriptor(), POLLRDHUP, 0};
    return ::poll(&socket, 1, 0) > 0;
}

bool CPipeSocket::isAtEnd() const {
    if (!isOpen()) return true;
    if (m_buffered.load(std::memory_order_relaxed) > 0) return false;
    char byte;
    ssize_t count;
    do count = ::recv(getDescriptor(), &byte, 1, MSG_PEEK | MSG_DONTWAIT);
    while (count < 0 && errno == EINTR);
    return count == 0 || (count < 0 && errno != EAGAIN);
}

int64_t CPipeSocket::getAvailable() const {
    int waiting = 0;
    if (!isOpen() || ::ioctl(getDescriptor(), FIONREAD, &waiting) != 0) return 0;
    return m_buffered.load(std::memory_order_relaxed) + waiting;
}

CPipeSocket::EWait CPipeSocket::wait(const CWait& wait, short events,
                                     std::optional<uint32_t> milliseconds) const {
    const int64_t deadline = wait.m_deadline;
    const int64_t limit = milliseconds ? getNow() + int64_t{*milliseconds} * 1'000'000 : 0;
    for (;;) {
        timespec rest = {};
        const timespec* timeout = nullptr;
        if (deadline != 0 || milliseconds) {
            const int64_t end = deadline == 0 ? limit : !milliseconds ? deadline : std::min(deadline, limit);
            const int64_t left = std::max<int64_t>(end - getNow(), 0);
            rest = {static_cast<time_t>(left / 1'000'000'000), static_cast<long>(left % 1'000'000'000)};
            timeout = &rest;
        }
        pollfd descriptors[] = {{getDescriptor(), events, 0}, {wait.m_wake.get(), POLLIN, 0}};
        const int count = ::ppoll(descriptors, std::size(descriptors), timeout, nullptr);
        if (count == 0) return EWait::late;
        if (count > 0 && descriptors[0].revents != 0) return EWait::ready;
        if (wait.m_aborted) return EWait::aborted;
        // Interrupted by a signal, or woken by an abort that was taken back in the meantime.
    }
}

void CPipeSocket::waitToRead() {
    for (;;) {
        switch (wait(m_readWait, POLLIN, std::nullopt)) {
        case EWait::ready:
            return;
        case EWait::late:
            if (!m_readWait.extend()) throwReadLate();
            continue;
        case EWait::aborted:
            throw CPipeAbortedError();
        }
    }
}

// Returns at least one byte, or 0 once the peer has closed the pipe. `waitsFirst` saves a system call where
// the bytes are likely not there yet.
int64_t CPipeSocket::receive(uint8_t* buffer, int64_t size, bool waitsFirst) {
    requireOpen();
    if (waitsFirst) waitToRead();
    for (;;) {
        requireOpen();
        // A peer that sends without a pause must not get past the deadline either.
        if (m_readWait.hasPassed()) throwReadLate();
        const ssize_t count = ::recv(getDescriptor(), buffer, static_cast<size_t>(size), MSG_DONTWAIT);
        if (count > 0) return count;
        // A peer that closes with unread bytes of ours at its end resets the connection.
        if (count == 0 || errno == ECONNRESET) {
            requireOpen();
            return 0;
        }
        if (errno == EINTR) continue;
        if (errno != EAGAIN) throwReadError(errno);
        waitToRead();
    }
}

IPipeInStream::EArrival CPipeSocket::fetch() {
    using EArrival = IPipeInStream::EArrival;
    if (!isOpen()) return EArrival::end;
    if (m_buffered.load(std::memory_order_relaxed) > 0) return EArrival::bytes;
    ssize_t count;
    do count = ::recv(getDescriptor(), m_buffer.get(), kBufferSize, MSG_DONTWAIT);
    while (count < 0 && errno == EINTR);
    if (count <= 0) return count < 0 && errno == EAGAIN ? EArrival::nothing : EArrival::end;
    m_bufferStart = 0;
    m_buffered.store(count, std::memory_order_relaxed);
    return EArrival::bytes;
}

int64_t CPipeSocket::readSome(uint8_t* buffer, int64_t size) {
    requireOpen();
    if (size == 0) return 0;
    int64_t buffered = m_buffered.load(std::memory_order_relaxed);
    if (buffered == 0) {
        if (size >= kBufferSize) {
            const int64_t count = receive(buffer, size, false);
            m_taken.fetch_add(count, std::memory_order_relaxed);
            return count;
        }
        buffered = receive(m_buffer.get(), kBufferSize, true);
        if (buffered == 0) return 0;
        m_bufferStart = 0;
    }
    const int64_t count = std::min(size, buffered);
    std::memcpy(buffer, m_buffer.get() + m_bufferStart, static_cast<size_t>(count));
    m_bufferStart += count;
    m_buffered.store(buffered - count, std::memory_order_relaxed);
    m_taken.fetch_add(count, std::memory_order_relaxed);
    return count;
}

void CPipeSocket::read(uint8_t* buffer, int64_t size) {
    requireOpen();
    while (size > 0) {
        const int64_t count = readSome(buffer, size);
        if (count == 0) throw CPipeClosedError();
        buffer += count;
        size -= count;
    }
}

bool CPipeSocket::waitForData(uint32_t milliseconds) {
    if (!isOpen()) return false;
    if (m_buffered.load(std::memory_order_relaxed) > 0) return true;
    return wait(m_readWait, POLLIN, milliseconds) == EWait::ready && isOpen();
}

// A write that the socket's buffer cannot hold makes the two processes wait for each other several times. The
// buffer stays small until such a write, since bytes in it hide from the writer how far behind the reader is.
void CPipeSocket::makeRoom(const SPipePart* parts, size_t count) {
    constexpr int64_t kLargeWrite = 1 << 20;
    constexpr int64_t kMostRoom = 4 << 20;
    int64_t bytes = 0;
    for (size_t i = 0; i < count; ++i) bytes += parts[i].size;
    bytes = std::min(bytes, kMostRoom);
    if (bytes < kLargeWrite || bytes <= m_room) return;
    m_room = bytes;
    const int size = static_cast<int>(bytes);
    // The system may grant less, and writing then takes more steps.
    static_cast<void>(::setsockopt(getDescriptor(), SOL_SOCKET, SO_SNDBUF, &size, sizeof size));
}

void CPipeSocket::write(const SPipePart* parts, size_t count) {
    requireOpen();
    makeRoom(parts, count);
    constexpr size_t kBatch = 16;
    std::array<iovec, kBatch> blocks;
    size_t part = 0;
    int64_t offset = 0; // of the bytes of the part that are sent
    for (;;) {
        while (part < count && offset == parts[part].size) {
            ++part;
            offset = 0;
        }
        if (part == count) return;
        if (m_writeWait.hasPassed()) throwWriteLate();
        msghdr message = {};
        message.msg_iov = blocks.data();
        message.msg_iovlen = std::min(count - part, kBatch);
        for (size_t i = 0; i < message.msg_iovlen; ++i) {
            const int64_t start = i == 0 ? offset : 0;
            const SPipePart& each = parts[part + i];
            blocks[i].iov_base = const_cast<uint8_t*>(static_cast<const uint8_t*>(each.data) + start);
            blocks[i].iov_len = static_cast<size_t>(each.size - start);
        }
        ssize_t sent = ::sendmsg(getDescriptor(), &message, MSG_NOSIGNAL | MSG_DONTWAIT);
        if (sent < 0) {
            if (errno == EINTR) continue;
            requireOpen();
            if (errno != EAGAIN) throwWriteError();
            switch (wait(m_writeWait, POLLOUT, std::nullopt)) {
            case EWait::ready:
                continue;
            case EWait::late:
                if (!m_writeWait.extend()) throwWriteLate();
                continue;
            case EWait::aborted:
                throwWriteError();
            }
        }
        for (int64_t left = sent; left > 0;) {
            const int64_t step = std::min(left, parts[part].size - offset);
            left -= step;
            offset += step;
            if (offset < parts[part].size) break;
            ++part;
            offset = 0;
        }
    }
}

} // namespace peru::posix
