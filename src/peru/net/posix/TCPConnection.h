// TCP connections.
#pragma once

#include "peru/net/posix/NetEvent.h"
#include "peru/net/posix/Socket.h"

namespace peru::net::posix {

// Tries the addresses in turn: each attempt has a quarter of a second for itself before the next one starts
// beside it. The first to succeed wins, so an address that does not answer costs that quarter and no
// time-out.
class CTCPConnection : public CObject, public IConnection {
public:
    explicit CTCPConnection(std::vector<P<ITCPAddress>> addresses); // at least one
    ~CTCPConnection() override;

    bool isConnected(const SNetWait& wait) override;
    P<INetInStream> getInStream() override;
    P<INetOutStream> getOutStream() override;
    void close() override;

private:
    void startNext(TimePoint now);
    bool checkAttempts(const std::vector<pollfd>& states);
    void noteError(int error);
    const P<CSocket>& getSocket() const;

    std::vector<P<ITCPAddress>> m_addresses;
    size_t m_next = 0;     // the first address that has not been tried
    TimePoint m_nextStart; // when it is due even if the attempts go on
    std::vector<peru::posix::CFileHandle> m_attempts;
    int m_error = 0; // the most telling failure so far
    P<CSocket> m_socket;
    bool m_closed = false;
};

class CTCPConnectionFactory : public CObject, public IConnectionFactory {
public:
    CTCPConnectionFactory();
    ~CTCPConnectionFactory() override;
    P<IConnection> tryStart(const Addresses& addresses) override;
};

} // namespace peru::net::posix
