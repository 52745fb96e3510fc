// Non-blocking TCP sockets and their streams.
#pragma once

#include "peru/Object.h"
#include "peru/net/IConnection.h"
#include "peru/posix/PlatformFile.h"

namespace peru::net::posix {

// Failures throw CSocketError, a closed socket CStreamClosedError.
class CSocket : public CObject {
public:
    // Takes over a non-blocking stream socket.
    explicit CSocket(peru::posix::CFileHandle handle);
    ~CSocket() override;

    // Starts connecting to the address. `error` is the errno value of a failure at once, otherwise 0.
    static peru::posix::CFileHandle startConnecting(const ITCPAddress& address, int& error);
    // The outcome of a connection attempt whose socket has become writable, as an errno value.
    static int getConnectError(int descriptor);

    std::optional<int64_t> receive(void* buffer, int64_t size);
    int64_t send(const void* buffer, int64_t size);
    bool wait(short events, const SNetWait& wait);
    void close();

private:
    int getDescriptor() const;

    peru::posix::CFileHandle m_handle;
};

class CSocketInStream : public CObject, public INetInStream {
public:
    explicit CSocketInStream(const P<CSocket>& socket);
    ~CSocketInStream() override;

    void close() override;
    P<IURI> getURI() const override;
    bool isAtEnd() override;
    void read(void* buffer, int64_t size) override;
    int64_t readSome(void* buffer, int64_t size) override;
    void skip(int64_t size) override;
    std::optional<int64_t> tryRead(void* buffer, int64_t size) override;
    bool isReadable(const SNetWait& wait) override;

private:
    P<CSocket> m_socket;
    std::optional<uint8_t> m_peeked; // read ahead by isAtEnd()
};

class CSocketOutStream : public CObject, public INetOutStream {
public:
    explicit CSocketOutStream(const P<CSocket>& socket);
    ~CSocketOutStream() override;

    void close() override;
    P<IURI> getURI() const override;
    bool isAtEnd() override;
    void write(const void* buffer, int64_t size) override;
    void flush() override;
    int64_t tryWrite(const void* buffer, int64_t size) override;
    bool isWritable(const SNetWait& wait) override;

private:
    P<CSocket> m_socket;
};

} // namespace peru::net::posix
