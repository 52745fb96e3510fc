// A server on the loopback whose connections follow a script.
#pragma once

#include <algorithm>
#include <arpa/inet.h>
#include <atomic>
#include <cstring>
#include <functional>
#include <netinet/in.h>
#include <poll.h>
#include <string>
#include <string_view>
#include <sys/socket.h>
#include <thread>
#include <unistd.h>

namespace tests {

// The server's end of a connection. Every operation ends when the client closes or the server is stopped.
class CPeer {
public:
    CPeer(int socket, const std::atomic<bool>& stop) : m_socket(socket), m_stop(stop) {}
    ~CPeer() { close(); }

    // Reads a request up to `end`, and its body if it has a length.
    std::string receive(std::string_view end = "\r\n\r\n") {
        std::string request;
        const auto take = [&](size_t size) {
            std::string part(size, '\0');
            const ssize_t count = waitFor(POLLIN) ? ::recv(m_socket, part.data(), size, 0) : 0;
            request.append(part, 0, static_cast<size_t>(std::max<ssize_t>(count, 0)));
            return count > 0;
        };
        while (!request.ends_with(end))
            if (!take(1)) return request;
        const size_t length = request.find("Content-Length: ");
        const size_t whole =
            request.size() + (length == std::string::npos ? 0 : std::stoul(request.substr(length + 16)));
        while (request.size() < whole && take(whole - request.size())) {
        }
        return request;
    }
    // False if the client has gone.
    bool send(std::string_view bytes) {
        while (!bytes.empty()) {
            if (!waitFor(POLLOUT)) return false;
            const ssize_t count = ::send(m_socket, bytes.data(), bytes.size(), MSG_NOSIGNAL | MSG_DONTWAIT);
            if (count < 0 && errno != EAGAIN) return false;
            if (count > 0) bytes.remove_prefix(static_cast<size_t>(count));
        }
        return true;
    }
    bool sendByteWise(std::string_view bytes) {
        for (const char& c : bytes)
            if (!send({&c, 1})) return false;
        return true;
    }
    void rest(int milliseconds) { ::poll(nullptr, 0, milliseconds); }
    void waitForClose() {
        char dropped[4096];
        while (waitFor(POLLIN) && ::recv(m_socket, dropped, sizeof dropped, 0) > 0) {
        }
    }
    void waitForStop() {
        while (!m_stop) rest(5);
    }
    void close() {
        if (m_socket >= 0) ::close(std::exchange(m_socket, -1));
    }
    void reset() {
        const linger now{1, 0};
        ::setsockopt(m_socket, SOL_SOCKET, SO_LINGER, &now, sizeof now);
        close();
    }

private:
    bool waitFor(short events) {
        pollfd state{m_socket, events, 0};
        while (!m_stop)
            if (::poll(&state, 1, 20) > 0) return true;
        return false;
    }

    int m_socket;
    const std::atomic<bool>& m_stop;
};

// Listens on a free port. Connections are served one after the other.
class CScriptedServer {
public:
    using Script = std::function<void(CPeer&)>;

    explicit CScriptedServer(Script script, int family = AF_INET)
        : m_script(std::move(script)), m_family(family) {
        m_socket = ::socket(family, SOCK_STREAM | SOCK_CLOEXEC, 0);
        sockaddr_in6 address = {};
        socklen_t size = sizeof address;
        if (family == AF_INET6) {
            address.sin6_family = AF_INET6;
            address.sin6_addr = in6addr_loopback;
            const int on = 1;
            ::setsockopt(m_socket, IPPROTO_IPV6, IPV6_V6ONLY, &on, sizeof on);
        } else {
            sockaddr_in four = {};
            four.sin_family = AF_INET;
            four.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
            std::memcpy(&address, &four, sizeof four);
            size = sizeof four;
        }
        if (m_socket < 0 || ::bind(m_socket, reinterpret_cast<sockaddr*>(&address), size) != 0) return;
        ::getsockname(m_socket, reinterpret_cast<sockaddr*>(&address), &size);
        m_port = ntohs(address.sin6_port); // at the same place in both families
        // Without a script nobody accepts: connections beyond the first are left without an answer.
        ::listen(m_socket, m_script ? 1024 : 0);
        if (m_script) m_thread = std::thread([this] { serve(); });
    }
    ~CScriptedServer() {
        m_stop = true;
        ::shutdown(m_socket, SHUT_RDWR);
        if (m_thread.joinable()) m_thread.join();
        ::close(m_socket);
    }
    CScriptedServer(const CScriptedServer&) = delete;
    CScriptedServer& operator=(const CScriptedServer&) = delete;

    int getPort() const { return m_port; } // 0 if the family is not available
    std::string getBase() const {
        return (m_family == AF_INET6 ? "http://[::1]:" : "http://127.0.0.1:") + std::to_string(m_port);
    }

private:
    void serve() {
        while (!m_stop) {
            const int socket = ::accept4(m_socket, nullptr, nullptr, SOCK_CLOEXEC);
            if (socket < 0) continue;
            CPeer peer(socket, m_stop);
            m_script(peer);
        }
    }

    Script m_script;
    int m_family;
    int m_socket = -1;
    int m_port = 0;
    std::atomic<bool> m_stop = false;
    std::thread m_thread;
};

} // namespace tests
