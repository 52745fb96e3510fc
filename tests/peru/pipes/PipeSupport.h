// Connected pipes in a folder of their own, and peers that speak to them through plain sockets.
#pragma once

#include "peru/pipes/IPipeManager.h"
#include "support/Environment.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <cstring>
#include <functional>
#include <sys/socket.h>
#include <sys/time.h>
#include <sys/un.h>
#include <thread>
#include <unistd.h>

namespace tests {

// Returns the title of the error, which is the text of the errors without a description.
template <class Error = peru::CException, class Operation> std::string titleOf(Operation operation) {
    try {
        operation();
    } catch (const Error& error) {
        return text(error.getTitle());
    }
    ADD_FAILURE() << "no error was thrown";
    return {};
}

class CCreatedListener : public peru::CObject, public peru::IPipeServer::IPipeCreatedListener {
public:
    explicit CCreatedListener(std::function<void()> action) : m_action(std::move(action)) {}
    void onPipeCreated(peru::IPipeServer*) override { m_action(); }

private:
    std::function<void()> m_action;
};

// A socket that knows nothing of the classes under test.
class CRawSocket {
public:
    explicit CRawSocket(const std::filesystem::path& path, bool listens = false)
        : m_socket(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        sockaddr_un address = {};
        address.sun_family = AF_UNIX;
        std::strncpy(address.sun_path, path.c_str(), sizeof address.sun_path - 1);
        const auto* generic = reinterpret_cast<sockaddr*>(&address);
        const int result = listens ? ::bind(m_socket, generic, sizeof address) | ::listen(m_socket, 0)
                                   : ::connect(m_socket, generic, sizeof address);
        EXPECT_EQ(result, 0) << path;
        const timeval patience = {30, 0};
        ::setsockopt(m_socket, SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof patience);
    }
    ~CRawSocket() { ::close(m_socket); }
    CRawSocket(const CRawSocket&) = delete;
    CRawSocket& operator=(const CRawSocket&) = delete;

    void send(const std::string& bytes) const {
        EXPECT_EQ(::send(m_socket, bytes.data(), bytes.size(), MSG_NOSIGNAL), ssize_t(bytes.size()));
    }
    // Up to `size` bytes from a single call; empty at the end, or if nothing arrives for half a minute.
    std::string receive(size_t size = 65536) const {
        std::string bytes(size, '\0');
        bytes.resize(static_cast<size_t>(std::max<ssize_t>(::recv(m_socket, bytes.data(), size, 0), 0)));
        return bytes;
    }

private:
    int m_socket;
};

class CPipeTest : public testing::Test {
protected:
    static peru::P<peru::IString> name(const char* text = "pipe") { return peru::newString(text); }
    std::filesystem::path path(const char* file = "pipe") const {
        return m_folder / "tonewright-pipes" / file;
    }
    static peru::P<peru::IPipeServer> server(const char* text = "pipe") {
        return peru::getPipeManager()->createServer(name(text));
    }
    static peru::P<peru::IPipeClient> client(const char* text = "pipe") {
        return peru::getPipeManager()->createClient(name(text));
    }

    // The server's and the client's end of a new connection.
    struct SPair {
        peru::P<peru::IPipeServer> server;
        peru::P<peru::IPipeClient> accepted;
        peru::P<peru::IPipeClient> client;
    };
    static SPair connect() {
        SPair pair{server(), nullptr, client()};
        const auto created = peru::make<CCreatedListener>([&] { EXPECT_TRUE(pair.client->connect()); });
        pair.accepted = pair.server->acceptOne(created.get());
        return pair;
    }

    CTempFolder m_folder;
    CEnvironment m_environment{"XDG_RUNTIME_DIR", m_folder.path().string()};
};

} // namespace tests
