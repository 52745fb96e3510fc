// Runs the program with servers on the loopback.
#pragma once

#include "host/Program.h"

#include <chrono>
#include <thread>

namespace tests {

class CNetworkTest : public CProgramTest {
protected:
    void SetUp() override {
        std::filesystem::create_directory(folder / "cache");
        std::filesystem::create_directory(folder / "tmp");
    }
    // Whatever happens, no temporary file remains.
    void TearDown() override { EXPECT_TRUE(std::filesystem::is_empty(folder / "tmp")); }

    std::vector<std::pair<std::string, std::string>> environment() {
        auto all = programEnvironment();
        all.emplace_back("XDG_CACHE_HOME", folder / "cache");
        all.emplace_back("TMPDIR", folder / "tmp");
        all.emplace_back("http_proxy", "");
        return all;
    }
    SProcessResult call(std::vector<std::string> arguments) {
        arguments.insert(arguments.begin(), {"timeout", "-s", "KILL", "60", kProgram});
        return run(arguments, folder.path(), environment());
    }
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
        const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(30);
        while (m_process.readOut().find('\n') == std::string::npos && m_process.isRunning() &&
               std::chrono::steady_clock::now() < end)
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    std::string getBase() const {
        return "http://127.0.0.1:" + std::to_string(std::atoi(m_process.readOut().c_str())) + "/";
    }

private:
    CProcess m_process;
};

} // namespace tests
