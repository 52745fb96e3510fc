// One end of a pipe connection over a socket.
#pragma once

#include "peru/pipes/IPipeClient.h"
#include "peru/pipes/posix/PipeSocket.h"

namespace peru::posix {

class CPipeClient : public CObject, public IPipeClient {
public:
    explicit CPipeClient(const P<IString>& name);
    // The server's view of a client that has connected.
    CPipeClient(const P<IString>& name, const P<CPipeSocket>& socket);
    ~CPipeClient() override;

    P<IString> getName() const override { return m_name; }
    bool connect() override;
    bool isAlive() const override { return !m_socket->isAtEnd(); }
    void close() override { m_socket->close(); }
    P<IPipeInStream> getInStream() const override { return m_in; }
    P<IPipeOutStream> getOutStream() const override { return m_out; }

private:
    class CInStream;
    class COutStream;

    P<IString> m_name;
    P<CPipeSocket> m_socket;
    P<IPipeInStream> m_in;
    P<IPipeOutStream> m_out;
};

} // namespace peru::posix
