// What the options of cddb change in the request, in the answer and in what is stored.
#include "host/Network.h"
#include "peru/net/ScriptedServer.h"

using namespace tests;

namespace {

class CddbOptions : public CNetworkTest {
protected:
    // "PORT" in the arguments becomes the server's.
    SProcessResult ask(const std::vector<std::string>& options,
                       const std::string& address = "127.0.0.1:PORT/path") {
        m_request.clear();
        const CScriptedServer server([this](CPeer& peer) {
            m_request = peer.receive();
            peer.send("HTTP/1.1 200 OK\r\n\r\n200 misc 1 \x83\x65\r\n");
        });
        const std::string port = std::to_string(server.getPort());
        std::vector<std::string> arguments =
            with(with({"cddb", "--list", "--toc", "150 13650"}, options), {"--server", address});
        for (std::string& each : arguments)
            if (const size_t at = each.find("PORT"); at != std::string::npos) each.replace(at, 4, port);
        return tonewright(arguments);
    }

    std::string m_request; // of the last call; empty if there was none
};

} // namespace

TEST_F(CddbOptions, ReachTheServerAndItsAnswer) {
    const SProcessResult plain = ask({"--no-cache"});
    EXPECT_TRUE(has(plain.out, "misc        00000001  \u0192e"));
    EXPECT_EQ(m_request.find("POST /path HTTP/1.1\r\n"), 0u) << m_request;
    EXPECT_TRUE(has(m_request, "&hello=anon+anon+tonewright+"));
    EXPECT_EQ(list().count("cache/tonewright/"), 0u) << "nothing is stored";
    EXPECT_TRUE(has(ask({"--code-page", "SHIFT_JIS", "--user", "a@me@there"}).out, "テ"));
    EXPECT_TRUE(has(m_request, "&hello=a%40me+there+tonewright+"));
    EXPECT_EQ(list().count("cache/tonewright/cddb/"), 1u);
    ask({"--proxy", "127.0.0.1:PORT"}, "cddb.example.org/path");
    EXPECT_EQ(m_request.find("POST http://cddb.example.org:80/path HTTP/1.1\r\n"), 0u) << m_request;
}

TEST_F(CddbOptions, AreRefusedIfTheyMakeNoSense) {
    const std::vector<std::string> cases[] = {
        {"--user", "me"}, {"--user", "@there"}, {"--user", "me@"},           {"--timeout", "0"},
        {"--pick", "0"},  {"--pick", "10001"},  {"--no-cache", "--refresh"},
    };
    for (const std::vector<std::string>& each : cases) {
        EXPECT_EQ(ask(each).exitCode, 2) << testing::PrintToString(each);
        EXPECT_EQ(m_request, "");
    }
    for (const char* address :
         {"", ":PORT", "http://", "http:///path", "me@127.0.0.1:PORT", "127.0.0.1 :PORT", "127.0.0.1#:PORT",
          "host:0", "host:65536", "host:80x", "[::1]:0", "[::1]?"}) {
        const SProcessResult result = ask({}, address);
        EXPECT_EQ(result.exitCode, 2) << address;
        EXPECT_TRUE(has(result.err, "is not HOST[:PORT][/PATH]"));
        EXPECT_EQ(m_request, "");
    }
}
