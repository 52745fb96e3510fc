// The two streams of a pipe connection.
#pragma once

#include "peru/streams/IStreams.h"

#include <cstddef>
#include <functional>

namespace peru {

// Bounds and interrupts the waits of one direction of a pipe. Both operations may be called from any thread.
class PERU_API IPipeStream : public virtual IStreamBase {
public:
    static constexpr uint32_t kNoDeadline = 0;

    // From now on, operations that have not completed within `milliseconds` throw CException with the title
    // "The deadline for reading from the pipe has passed" (or "writing to"). The time counts from this call,
    // not from the start of each operation, so that one deadline can cover a whole message.
    virtual void setDeadline(uint32_t milliseconds) = 0;
    // Asked by the thread that waits each time the deadline has passed: true starts its time once more. Set
    // while no operation runs; empty removes it.
    virtual void setExtension(const std::function<bool()>& extension) = 0;
    // Ends an operation that waits, and every later one that would have to wait, until resume() is called. A
    // read throws CAbortedError with "Read was aborted", a write CException with "Error write data to pipe".
    // What arrived in part is lost, so the two ends may no longer agree on where a message starts.
    virtual void abort() = 0;
    virtual void resume() = 0;
};

// A byte stream: a read may span several writes of the peer and the other way round. Reads throw CException
// with "Invalid pipe handle" while the pipe is not connected or after it was closed here, CFinishedError with
// "Pipe was closed" once the peer has closed it and all bytes are read, and CException with "Error read data
// from pipe: " and the system's text otherwise. readSome returns 0 instead of throwing CFinishedError.
class PERU_API IPipeInStream : public virtual IInStream, public virtual IPipeStream {
public:
    // Bytes that can be read without waiting; 0 if the pipe is not usable. Any thread may ask; bytes that
    // another thread is just taking over may be missing or count twice.
    virtual int64_t getAvailable() const = 0;
    // True as soon as a read would not wait: bytes have arrived or the peer has closed the pipe. False when
    // the time is over, after abort(), and on a pipe that is not usable.
    virtual bool waitForData(uint32_t milliseconds) = 0;

    enum class EArrival { nothing, bytes, end };
    // Takes over what has arrived, without waiting; a read that follows gets it without a system call. Only
    // for the thread that reads. A pipe that is not usable is at its end.
    virtual EArrival fetch() = 0;
};

struct SPipePart {
    const void* data;
    int64_t size;
};

// Unbuffered: a write has left the process when it returns. Throws CException with "Invalid pipe handle" or
// "Error write data to pipe". A peer that has gone is an error of the write and raises no signal.
class PERU_API IPipeOutStream : public virtual IOutStream, public virtual IPipeStream {
public:
    // Writes one byte and returns whether it was sent.
    virtual bool writeByte(uint8_t value) = 0;
    // Writes all parts in order in as few system calls as possible, without copying them together.
    virtual void writeParts(const SPipePart* parts, size_t count) = 0;
};

} // namespace peru
