// A connected socket and how its streams wait for it.
#pragma once

#include "peru/Object.h"
#include "peru/pipes/IPipeStreams.h"
#include "peru/posix/PlatformFile.h"

#include <atomic>
#include <functional>
#include <memory>
#include <optional>

namespace peru::posix {

// Wakes a thread that waits for descriptors. Set until it is reset.
class CWakeEvent {
public:
    CWakeEvent(); // throws CError
    void set() noexcept;
    void reset() noexcept;
    int get() const { return m_event.get(); }

private:
    CFileHandle m_event;
};

// One thread may read while another one writes; everything else may be called from any thread.
class CPipeSocket : public CObject {
public:
    CPipeSocket(); // not connected; throws CError
    ~CPipeSocket() override;

    // Called once, with a connected socket.
    void attach(CFileHandle socket);
    bool isAttached() const { return m_descriptor.load(std::memory_order_acquire) >= 0; }
    // Wakes all waiting threads. The descriptor stays open, and its number in use, until this object is
    // destroyed, so that no thread can use a descriptor of something else by mistake.
    void close() noexcept;
    bool isOpen() const { return isAttached() && !m_closed.load(std::memory_order_acquire); }
    int getDescriptor() const { return m_descriptor.load(std::memory_order_acquire); }

    // The peer has closed its end; bytes may still be there.
    bool isPeerGone() const;
    // Nothing can be read any more, now or later.
    bool isAtEnd() const;
    int64_t getAvailable() const;
    // Bytes that were read so far.
    int64_t getTaken() const { return m_taken.load(std::memory_order_relaxed); }

    void read(uint8_t* buffer, int64_t size);
    int64_t readSome(uint8_t* buffer, int64_t size);
    bool waitForData(uint32_t milliseconds);
    IPipeInStream::EArrival fetch();
    void write(const SPipePart* parts, size_t count);

    // One direction's deadline and interruption.
    class CWait {
    public:
        void setDeadline(uint32_t milliseconds);
        void setExtension(const std::function<bool()>& extension) { m_extension = extension; }
        void abort() noexcept;
        void resume() noexcept;

    private:
        friend class CPipeSocket;
        bool hasPassed();
        bool extend();

        CWakeEvent m_wake;
        std::atomic<bool> m_aborted{false};
        std::atomic<int64_t> m_deadline{0};      // nanoseconds of the monotonic clock, 0 if there is none
        std::atomic<uint32_t> m_milliseconds{0}; // from which it was computed
        std::function<bool()> m_extension;
    };
    CWait& getReadWait() { return m_readWait; }
    CWait& getWriteWait() { return m_writeWait; }

private:
    enum class EWait { ready, late, aborted };

    int64_t receive(uint8_t* buffer, int64_t size, bool waitsFirst);
    void waitToRead();
    EWait wait(const CWait& wait, short events, std::optional<uint32_t> milliseconds) const;
    void requireOpen() const;
    void makeRoom(const SPipePart* parts, size_t count);

    // Small reads take their bytes from here, so that a message costs one system call. Only the reading
    // thread uses the buffer; others only see how many bytes are in it.
    static constexpr int64_t kBufferSize = 0x4000;
    std::unique_ptr<uint8_t[]> m_buffer;
    int64_t m_bufferStart = 0;
    std::atomic<int64_t> m_buffered{0};
    std::atomic<int64_t> m_taken{0};

    int64_t m_room = 0; // that was asked for; used by the writing thread only

    CFileHandle m_socket;
    std::atomic<int> m_descriptor{-1}; // of m_socket, for threads that do not attach it
    std::atomic<bool> m_closed{false};
    CWait m_readWait;
    CWait m_writeWait;
};

} // namespace peru::posix
