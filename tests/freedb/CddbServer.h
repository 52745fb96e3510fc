// The CDDB server of the tests.
#pragma once

#include "support/Process.h"

#include <gtest/gtest.h>

#include <chrono>
#include <string>
#include <thread>

namespace tests {

class CCddbServer {
public:
    CCddbServer() : m_process({"python3", "-B", TONEWRIGHT_TEST_DATA "/../freedb/cddb_server.py"}) {
        const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(30);
        while (m_process.readOut().find('\n') == std::string::npos && m_process.isRunning() &&
               std::chrono::steady_clock::now() < end)
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
        m_port = std::atoi(m_process.readOut().c_str());
        EXPECT_GT(m_port, 0);
    }

    int getPort() const { return m_port; }
    std::string getAddress() const { return "127.0.0.1:" + std::to_string(m_port); }
    // What the server was asked, one command a line.
    std::string getCommands() const {
        const std::string out = m_process.readOut();
        return out.substr(std::min(out.find('\n') + 1, out.size()));
    }

private:
    CProcess m_process;
    int m_port = 0;
};

} // namespace tests
