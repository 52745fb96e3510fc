// What the options of cddb change in the request, in the answer and in what is stored.
#include "host/Program.h"
#include "peru/net/ScriptedServer.h"

using namespace tests;

namespace {

class CddbOptions : public CProgramTest {
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
        std::vector<std::string> arguments{"timeout", "-s",     "KILL",  "60",       kProgram,
                                           "cddb",    "--list", "--toc", "150 13650"};
        arguments.insert(arguments.end(), options.begin(), options.end());
        arguments.insert(arguments.end(), {"--server", address});
        for (std::string& each : arguments)
            if (const size_t at = each.find("PORT"); at != std::string::npos) each.replace(at, 4, port);
        auto environment = programEnvironment();
        environment.insert(environment.end(), {{"XDG_CACHE_HOME", folder / "cache"}, {"http_proxy", ""}});
        return run(arguments, folder.path(), environment);
    }

    std::string m_request; // of the last call; empty if there was none
};

} // namespace

TEST_F(CddbOptions, ReachTheServerAndItsAnswer) {
    const SProcessResult plain = ask({"--no-cache"});
    EXPECT_NE(plain.out.find("misc        00000001  \u0192e"), std::string::npos) << plain.out << plain.err;
    EXPECT_EQ(m_request.find("POST /path HTTP/1.1\r\n"), 0u) << m_request;
    EXPECT_NE(m_request.find("&hello=anon+anon+tonewright+"), std::string::npos) << m_request;
    EXPECT_EQ(list().count("cache/tonewright/"), 0u) << "nothing is stored";
    EXPECT_NE(ask({"--code-page", "SHIFT_JIS", "--user", "a@me@there"}).out.find("テ"), std::string::npos);
    EXPECT_NE(m_request.find("&hello=a%40me+there+tonewright+"), std::string::npos) << m_request;
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
}
