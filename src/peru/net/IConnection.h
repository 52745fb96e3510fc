// Connections.
#pragma once

#include "peru/net/INetAddress.h"
#include "peru/net/INetEvent.h"
#include "peru/streams/IStreams.h"

#include <optional>
#include <vector>

namespace peru::net {

// The operations of IInStream wait as long as the remote side needs.
class PERU_API INetInStream : public virtual IInStream {
public:
    // Reads up to `size` bytes without waiting: empty if nothing has arrived, 0 at the end.
    virtual std::optional<int64_t> tryRead(void* buffer, int64_t size) = 0;
    // True if tryRead has something to report.
    virtual bool isReadable(const SNetWait& wait) = 0;
};

class PERU_API INetOutStream : public virtual IOutStream {
public:
    // Writes up to `size` bytes without waiting and returns how many, 0 if the connection takes none.
    virtual int64_t tryWrite(const void* buffer, int64_t size) = 0;
    virtual bool isWritable(const SNetWait& wait) = 0;
};

// Used by one thread at a time. Failures throw CSocketError. The destructor closes.
class PERU_API IConnection : public virtual IBase {
public:
    // False if the connection is not established by the end of the wait. Throws if it cannot be.
    virtual bool isConnected(const SNetWait& wait) = 0;
    // Only after isConnected() has returned true.
    virtual P<INetInStream> getInStream() = 0;
    virtual P<INetOutStream> getOutStream() = 0;
    // Closes the streams as well.
    virtual void close() = 0;
};

using Addresses = std::vector<P<INetAddress>>; // of one host, the preferred one first

class PERU_API IConnectionFactory : public virtual IBase {
public:
    // Starts a connection to whichever of the supported addresses answers; empty if there is none. Never
    // waits.
    virtual P<IConnection> tryStart(const Addresses& addresses) = 0;
};

// Asks its factories in order of registration. Thread-safe.
class PERU_API IConnectionManager : public virtual IBase {
public:
    virtual void addFactory(const P<IConnectionFactory>& factory) = 0;
    virtual void removeFactory(const P<IConnectionFactory>& factory) = 0;
    // Throws CError if no factory supports the addresses.
    virtual P<IConnection> start(const Addresses& addresses) = 0;
};

// Contains the factory for TCP from the start.
PERU_API P<IConnectionManager> getConnectionManager();

} // namespace peru::net
