// Runs the program with servers on the loopback.
#pragma once

#include "host/Program.h"
#include "support/Environment.h"

namespace tests {

class CNetworkTest : public CProgramTest {
protected:
    void SetUp() override {
        std::filesystem::create_directory(folder / "cache");
        std::filesystem::create_directory(folder / "tmp");
    }
    // Whatever happens, no temporary file remains.
    void TearDown() override { EXPECT_TRUE(std::filesystem::is_empty(folder / "tmp")); }

private:
    CEnvironment m_cache{"XDG_CACHE_HOME", folder / "cache"};
    CEnvironment m_temporary{"TMPDIR", folder / "tmp"};
    CEnvironment m_direct{"http_proxy", ""};
};

// A server that accepts one connection and reads a request, answers it with `answer`, and then sends nothing
// more, or another byte every so many seconds.
class CSilentServer {
public:
    explicit CSilentServer(const std::string& answer = {}, double interval = 0)
        : m_process({"python3", "-u", "-c",
                     "import socket, sys, time\ns = socket.create_server(('127.0.0.1', 0))\n"
                     "print(s.getsockname()[1])\nc, _ = s.accept()\nc.recv(9999)\n"
                     "c.sendall(sys.argv[1].encode())\nprint('sent')\nwait = float(sys.argv[2])\n"
                     "while wait: time.sleep(wait); c.sendall(b'x')\nc.recv(9999)\nc.recv(1)",
                     answer, std::to_string(interval)}) {
        EXPECT_TRUE(waitForLines(m_process, 1));
    }
    std::string getAddress() const {
        return "127.0.0.1:" + std::to_string(std::atoi(m_process.readOut().c_str()));
    }
    void waitForRequest() const { EXPECT_TRUE(waitForLines(m_process, 2)); }

private:
    CProcess m_process;
};

// A web server for the folder "served".
class CWebServer {
public:
    explicit CWebServer(const std::filesystem::path& folder)
        : m_process(
              {"python3", "-u", "-c",
               "import http.server as h, functools, sys\n"
               "s = h.ThreadingHTTPServer(('127.0.0.1', 0), functools.partial(h.SimpleHTTPRequestHandler, "
               "directory=sys.argv[1]))\nprint(s.server_port)\ns.serve_forever()",
               folder}) {
        EXPECT_TRUE(waitForLines(m_process, 1));
    }
    std::string getBase() const {
        return "http://127.0.0.1:" + std::to_string(std::atoi(m_process.readOut().c_str())) + "/";
    }

private:
    CProcess m_process;
};

} // namespace tests
