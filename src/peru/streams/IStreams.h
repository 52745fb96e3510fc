// The stream interfaces: readable, writable, resetable, seekable and their combinations.
#pragma once

#include "peru/P.h"

#include <cstdint>

namespace peru {

class IURI;

// A stream is used by one thread at a time. After close every operation but close throws CStreamClosedError.
class PERU_API IStreamBase : public virtual IBase {
public:
    virtual void close() = 0;
    virtual P<IURI> getURI() const = 0; // may be empty
    virtual bool isAtEnd() = 0;
};

class PERU_API IInStream : public virtual IStreamBase {
public:
    // Reads exactly `size` bytes or throws CEndOfStreamError.
    virtual void read(void* buffer, int64_t size) = 0;
    // Reads up to `size` bytes and returns how many; 0 means the end of the stream.
    virtual int64_t readSome(void* buffer, int64_t size) = 0;
    // Skips exactly `size` bytes or throws CEndOfStreamError.
    virtual void skip(int64_t size) = 0;
};

class PERU_API IOutStream : public virtual IStreamBase {
public:
    virtual void write(const void* buffer, int64_t size) = 0;
    virtual void flush() = 0;
};

class PERU_API IIOStream : public virtual IInStream, public virtual IOutStream {};

// A saved position.
class PERU_API IStreamMarker : public virtual IBase {
public:
    virtual void restore() = 0; // seeks back to the position at which the marker was created
};

class PERU_API IResetableStream : public virtual IStreamBase {
public:
    virtual void reset() = 0;
    virtual int64_t getPosition() const = 0; // since the start or the last reset
};

class PERU_API IResetableInStream : public virtual IResetableStream, public virtual IInStream {};
class PERU_API IResetableOutStream : public virtual IResetableStream, public virtual IOutStream {};
class PERU_API IResetableIOStream : public virtual IResetableInStream,
                                    public virtual IResetableOutStream,
                                    public virtual IIOStream {};

class PERU_API ISeekableStream : public virtual IResetableStream {
public:
    virtual void seek(int64_t position) = 0; // from the start, in bytes
    virtual int64_t getSize() const = 0;
    virtual P<IStreamMarker> createMarker() = 0;
};

class PERU_API ISeekableInStream : public virtual ISeekableStream, public virtual IResetableInStream {};
class PERU_API ISeekableOutStream : public virtual ISeekableStream, public virtual IResetableOutStream {
public:
    virtual void setSize(int64_t size) = 0; // truncates, or extends with zeros
};
class PERU_API ISeekableIOStream : public virtual ISeekableInStream,
                                   public virtual ISeekableOutStream,
                                   public virtual IResetableIOStream {};

// An encrypting output stream; adds no operations.
class PERU_API ICryptedOutStream : public virtual IOutStream {};

} // namespace peru
