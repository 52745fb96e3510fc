// HTTP exchanges with a server in this process compared with libcurl's program in the same run.
#include "peru/net/HTTPOperation.h"
#include "peru/uri/URI.h"

#include <benchmark/benchmark.h>

#include <arpa/inet.h>
#include <cstdlib>
#include <netinet/in.h>
#include <sys/socket.h>
#include <thread>
#include <unistd.h>

using namespace peru;
using namespace peru::net;

namespace {

constexpr size_t kLarge = 1'000'000'000;
constexpr int kSmallCount = 1000;

// Answers "/large" with kLarge bytes and everything else with five.
class CServer {
public:
    CServer() {
        m_socket = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
        sockaddr_in address = {};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        socklen_t size = sizeof address;
        if (::bind(m_socket, reinterpret_cast<sockaddr*>(&address), size) != 0) std::abort();
        ::getsockname(m_socket, reinterpret_cast<sockaddr*>(&address), &size);
        ::listen(m_socket, 100);
        base = "http://127.0.0.1:" + std::to_string(ntohs(address.sin_port));
        std::thread([this] { serve(); }).detach();
    }

    std::string base;

private:
    void serve() const {
        const std::string block(256 * 1024, 'x');
        for (;;) {
            const int peer = ::accept4(m_socket, nullptr, nullptr, SOCK_CLOEXEC);
            std::string request(4096, '\0');
            const ssize_t count = ::recv(peer, request.data(), request.size(), 0);
            request.resize(static_cast<size_t>(std::max<ssize_t>(count, 0)));
            const bool large = request.starts_with("GET /large");
            std::string reply =
                "HTTP/1.1 200 OK\r\nContent-Length: " + std::to_string(large ? kLarge : 5) + "\r\n\r\n";
            if (!large) reply += "hello";
            bool open = ::send(peer, reply.data(), reply.size(), MSG_NOSIGNAL) > 0;
            for (size_t sent = 0; open && large && sent < kLarge;) {
                const ssize_t n =
                    ::send(peer, block.data(), std::min(block.size(), kLarge - sent), MSG_NOSIGNAL);
                open = n > 0;
                sent += static_cast<size_t>(std::max<ssize_t>(n, 0));
            }
            ::close(peer);
        }
    }

    int m_socket = -1;
};

const CServer& getServer() {
    static const CServer server;
    return server;
}

int64_t fetch(const std::string& path, std::string& buffer) {
    const P<IURI> uri = make<CURI>((getServer().base + path).c_str());
    const P<CHTTPOperation> operation = make<CHTTPOperation>(make<CHTTPRequest>("GET", uri));
    int64_t total = 0;
    while (const int64_t count =
               operation->getInStream()->readSome(buffer.data(), static_cast<int64_t>(buffer.size())))
        total += count;
    return total;
}

void runProgram(const std::string& command) {
    if (std::system(command.c_str()) != 0) std::abort();
}

void BM_HttpLarge_peru(benchmark::State& state) {
    std::string buffer(64 * 1024, '\0');
    for (auto _ : state)
        if (fetch("/large", buffer) != static_cast<int64_t>(kLarge)) std::abort();
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(kLarge));
}

void BM_HttpLarge_curl(benchmark::State& state) {
    for (auto _ : state) runProgram("curl -s -o /dev/null " + getServer().base + "/large");
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(kLarge));
}

void BM_HttpSmall_peru(benchmark::State& state) {
    std::string buffer(64 * 1024, '\0');
    for (auto _ : state)
        for (int i = 0; i < kSmallCount; ++i)
            if (fetch("/", buffer) != 5) std::abort();
}

// One process for all exchanges, each on a connection of its own.
void BM_HttpSmall_curl(benchmark::State& state) {
    const std::string range = "/[1-" + std::to_string(kSmallCount) + "]";
    for (auto _ : state)
        runProgram("curl -s -o /dev/null -H 'Connection: close' '" + getServer().base + range + "'");
}

BENCHMARK(BM_HttpLarge_peru)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(BM_HttpLarge_curl)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(BM_HttpSmall_peru)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(BM_HttpSmall_curl)->Unit(benchmark::kMillisecond)->UseRealTime();

} // namespace
