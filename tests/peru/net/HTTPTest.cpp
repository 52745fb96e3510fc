#include "peru/files/SystemCalls.h"
#include "peru/net/HTTPError.h"
#include "peru/net/HTTPOperation.h"
#include "peru/net/ScriptedServer.h"
#include "peru/net/SocketError.h"
#include "peru/streams/Base64Streams.h"
#include "peru/streams/IStreamManager.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/uri/URI.h"
#include "support/Environment.h"
#include "support/Files.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <chrono>
#include <fstream>
#include <future>
#include <random>

namespace {

using namespace peru;
using namespace peru::net;
using tests::CEnvironment;
using tests::countEntries;
using tests::CPeer;
using tests::CScriptedServer;
using tests::errorOf;
using tests::text;

P<IURI> toURI(const std::string& text) {
    return make<CURI>(CString::fromUTF8(text));
}

P<CMemoryIOStream> toStream(const std::string& bytes) {
    const P<CMemoryIOStream> stream = make<CMemoryIOStream>();
    stream->write(bytes.data(), static_cast<int64_t>(bytes.size()));
    stream->seek(0);
    return stream;
}

std::string pollBody(CHTTPOperation& operation) {
    std::string body;
    char block[1000];
    for (;;) {
        const std::optional<int64_t> count = operation.getInStream()->tryRead(block, sizeof block);
        if (count == 0) return body;
        if (count)
            body.append(block, static_cast<size_t>(*count));
        else
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
}

// The outcome of an exchange in one text: status and body, or the error.
std::string run(CHTTPOperation& operation, bool wait) {
    try {
        const std::string body = wait ? readAll(*operation.getInStream()) : pollBody(operation);
        return std::to_string(operation.getResponse()->getStatus()) + " " + body;
    } catch (const CAbortedError&) {
        return "cancelled";
    } catch (const CException& error) {
        return text(error.getDescription());
    }
}

std::string get(const std::string& uri, const SHTTPSettings& settings = {}, bool wait = true) {
    CHTTPOperation* operation = new CHTTPOperation(make<CHTTPRequest>("GET", toURI(uri)), settings);
    return run(*P<CHTTPOperation>(operation), wait);
}

constexpr const char* kIllegal =
    "The response received from the HTTP server does not have the expected format.";
constexpr const char* kEarlyEnd = "Unexpected end of data stream (uri: '";
constexpr const char* kTimeOut = "The connection timed out (code=110).";
constexpr const char* kReset = "The connection was closed by the remote host (code=";

// --- Responses ---

struct SResponseCase {
    const char* name;
    std::string response;
    std::string expected; // the beginning of the outcome
    const char* method = "GET";
    bool reset = false; // ends with a reset instead of a close
};

const std::string kOK = "HTTP/1.1 200 OK\r\n";
const std::string kChunked = kOK + "Transfer-Encoding: chunked\r\n\r\n";

std::string repeat(const char* text, int count) {
    std::string result;
    while (count-- > 0) result += text;
    return result;
}

const SResponseCase kResponses[] = {
    {"length", kOK + "Content-Length: 5\r\n\r\nhello", "200 hello"},
    {"bytes after the length", kOK + "content-length:5 \r\n\r\nhello, world", "200 hello"},
    {"repeated length", kOK + "Content-Length: 5\r\nContent-Length: 5, 5\r\n\r\nhello", "200 hello"},
    {"until the end", "HTTP/1.0 200\r\n\r\nhello", "200 hello"},
    {"no body", kOK + "\r\n", "200 "},
    {"length 0", kOK + "Content-Length: 0\r\n\r\n", "200 "},
    {"length beyond the end", kOK + "Content-Length: 6\r\n\r\nhello", kEarlyEnd},
    {"contradictory lengths", kOK + "Content-Length: 5\r\nContent-Length: 4\r\n\r\nhello", kIllegal},
    {"negative length", kOK + "Content-Length: -5\r\n\r\nhello", kIllegal},
    {"length without digits", kOK + "Content-Length:\r\n\r\nhello", kIllegal},
    {"chunks",
     kOK +
         "transfer-encoding: ChUnKeD\r\nContent-Length: 3\r\n\r\n3;a=\"b\"\r\nhel\r\n02 \r\nlo\r\n0\r\n\r\n",
     "200 hello"},
    {"trailers", kChunked + "A\r\n0123456789\r\n0;end\r\nX: 1\r\nY: 2\r\n\r\nrest", "200 0123456789"},
    {"many chunks", kChunked + repeat("1\r\nx\r\n", 20'000) + "0\r\n\r\n", "200 " + repeat("x", 20'000)},
    {"chunks cut off", kChunked + "5\r\nhello\r\n", kEarlyEnd},
    {"trailers cut off", kChunked + "5\r\nhello\r\n0\r\n", kEarlyEnd},
    {"chunk without a size", kChunked + "\r\nhello", kIllegal},
    {"chunk longer than its size", kChunked + "4\r\nhello\r\n0\r\n\r\n", kIllegal},
    {"largest chunk size", kChunked + "7fffffffffffffff\r\nhello", kEarlyEnd},
    {"chunk size too large", kChunked + "80000000000000000\r\nhello", kIllegal},
    {"carriage return in a size", kChunked + "5\r5\nhello\r\n0\r\n\r\n", kIllegal},
    {"letter after a size", kChunked + "5x\r\nhello\r\n0\r\n\r\n", kIllegal},
    {"extension without a size", kChunked + ";5\r\nhello\r\n0\r\n\r\n", kIllegal},
    {"blanks after a size", kChunked + "5\t\r\nhello\r\n0 \r\n\r\n", "200 hello"},
    {"endless extension", kChunked + "5;" + std::string(70'000, 'x'), kIllegal},
    {"endless trailers", kChunked + "0\r\n" + std::string(70'000, 'x'), kIllegal},
    {"interim responses",
     "HTTP/1.1 100 Continue\r\n\r\nHTTP/1.1 103 Hints\r\nA: b\r\n\r\n" + kOK + "\r\nhello", "200 hello"},
    {"nothing", "", std::string(kReset) + "104"},
    {"no HTTP", "SSH-2.0-server\r\n\r\n", kIllegal},
    {"no status", "HTTP/1.1\r\n\r\n", kIllegal},
    {"status of two digits", "HTTP/1.1 20 OK\r\n\r\n", kIllegal},
    {"negative status", "HTTP/1.1 -20 OK\r\n\r\n", kIllegal},
    {"head cut off", kOK + "Content-Length: 5\r\n", kIllegal},
    {"endless head", kOK + "X: " + std::string(70'000, 'x'), kIllegal},
    {"head only", kOK + "Content-Length: 5\r\n\r\n", "200 ", "HEAD"},
    {"204", "HTTP/1.1 204 No Content\r\n\r\nhello", "204 "},
    {"304", "HTTP/1.1 304 Not Modified\r\nContent-Length: 5\r\n\r\n", "304 "},
    {"failure with a body", "HTTP/1.1 404 Not Found\r\nContent-Length: 5\r\n\r\nhello", "404 hello"},
    {"redirection without a target", "HTTP/1.1 302 Found\r\nLocation:\r\n\r\nhello", "302 hello"},
    {"reset before the head", "", kReset, "GET", true},
    {"reset in the head", kOK, kReset, "GET", true},
    {"reset in a body", kOK + "Content-Length: 9\r\n\r\nhello", kReset, "GET", true},
    {"reset in an open body", kOK + "\r\nhello", kReset, "GET", true},
};

// Every response whole and byte by byte, to a client that waits and to one that polls.
TEST(Http, Responses) {
    const size_t before = countEntries("/proc/self/fd");
    for (const SResponseCase& example : kResponses)
        for (const bool byteWise : {false, true})
            for (const bool wait : {false, true}) {
                if (byteWise && example.response.size() > 1000) continue;
                SCOPED_TRACE(example.name);
                const CScriptedServer server([&](CPeer& peer) {
                    peer.receive();
                    byteWise ? peer.sendByteWise(example.response) : peer.send(example.response);
                    if (example.reset) peer.reset();
                });
                const auto request = make<CHTTPRequest>(example.method, toURI(server.getBase() + "/a"));
                const auto operation = make<CHTTPOperation>(request);
                EXPECT_NO_THROW(operation->checkStatus()) << "before there is one";
                const std::string outcome = run(*operation, wait);
                if (outcome.starts_with("404"))
                    EXPECT_THROW(operation->checkStatus(), CHTTPError);
                else
                    EXPECT_NO_THROW(operation->checkStatus());
                if (example.expected.starts_with("200") || example.expected.starts_with("302"))
                    EXPECT_EQ(outcome, example.expected);
                else
                    EXPECT_EQ(outcome.substr(0, example.expected.size()), example.expected);
            }
    EXPECT_EQ(countEntries("/proc/self/fd"), before);
}

TEST(Http, HeadersAreFoundInAnyCaseAndFolded) {
    CHTTPResponse response(1000);
    ASSERT_TRUE(
        response.parse("HTTP/1.1 200  Very  OK \r\nA: 1\r\nbare line\r\nB :\t2 \r\n\t3\r\na: 4\r\n\r\nrest"));
    EXPECT_EQ(text(response.getReason()), "Very  OK");
    EXPECT_EQ(text(response.getHeaders().getValue("a")), "1");
    EXPECT_EQ(text(response.getHeaders().getValue("b")), "2 3");
    EXPECT_FALSE(response.getHeaders().getValue("bare line"));
    EXPECT_EQ(response.takeRest(), "rest");
}

// --- Requests ---

TEST(Http, RequestsOnTheWire) {
    std::string received;
    std::string end = "\r\n\r\n";
    const CScriptedServer server([&](CPeer& peer) {
        received = peer.receive(end);
        peer.send(kOK + "\r\n");
    });
    const std::string host = server.getBase().substr(7);
    const auto send = [&](const char* method, const std::string& uri, const P<IInStream>& body,
                          const char* header = "X") {
        const P<CHTTPRequest> request = make<CHTTPRequest>(method, toURI(uri), body);
        request->getHeaders().set(header, "1");
        EXPECT_EQ(run(*make<CHTTPOperation>(request), true), "200 ");
        return received;
    };
    const std::string tail = "Host: " + host + "\r\nConnection: close\r\n";
    EXPECT_EQ(send("GET", server.getBase(), nullptr), "GET / HTTP/1.1\r\nX: 1\r\n" + tail + "\r\n");
    EXPECT_EQ(send("GET", "http://me:p%40ss@" + host + "/a b%2Fc?d=\xC3\xA9#f", nullptr),
              "GET /a%20b%2Fc?d=%C3%A9 HTTP/1.1\r\nX: 1\r\n" + tail +
                  "Authorization: Basic bWU6cEBzcw==\r\n\r\n");
    const std::string large(300'000, 'b');
    EXPECT_EQ(send("POST", server.getBase() + "/p", toStream(large)),
              "POST /p HTTP/1.1\r\nX: 1\r\n" + tail + "Content-Length: 300000\r\n\r\n" + large);
    // What the caller announces is sent, and no more: the server would reset the connection.
    EXPECT_EQ(send("POST", server.getBase() + "/p", toStream("hello"), "Content-Length"),
              "POST /p HTTP/1.1\r\nContent-Length: 1\r\n" + tail + "\r\nh");
    const P<CMemoryIOStream> rest = toStream("not hello");
    rest->seek(4);
    EXPECT_EQ(send("POST", server.getBase() + "/p", rest),
              "POST /p HTTP/1.1\r\nX: 1\r\n" + tail + "Content-Length: 5\r\n\r\nhello");
    end = "0\r\n\r\n";
    EXPECT_EQ(send("POST", server.getBase() + "/p", make<CBase64InStream>(toStream("aGVsbG8"))),
              "POST /p HTTP/1.1\r\nX: 1\r\n" + tail +
                  "Transfer-Encoding: chunked\r\n\r\n5\r\nhello\r\n0\r\n\r\n");

    // What could change the rest of the head is refused.
    CHTTPHeaders headers;
    EXPECT_THROW(headers.add("A", "b\r\nC: d"), CInvalidArgError);
    EXPECT_THROW(headers.add("A b", "c"), CInvalidArgError);
    EXPECT_THROW(make<CHTTPRequest>("GET /", toURI("http://a/")), CInvalidArgError);
    EXPECT_THROW(make<CHTTPRequest>("GET", toURI("https://a/")), CURITypeNotSupportedError);
    EXPECT_THROW(make<CHTTPRequest>("GET", toURI("http://a%0D%0AC:d/")), CException);
}

// --- Redirections ---

TEST(Http, Redirections) {
    // Status, location with %B for the server, method, what the server received last or the outcome.
    using SCase = std::array<std::string, 4>;
    const std::string first = "GET /start/page?q=1";
    const SCase cases[] = {
        {"301", "%B/next", "GET", "200 GET /next "},
        {"302", "next?r=2", "GET", "200 GET /start/next?r=2 "},
        {"302", "../up#part", "GET", "200 GET /up "},
        {"302", "?r=2", "GET", "200 GET /start/page?r=2 "},
        {"307", "//%H/next", "GET", "200 GET /next "},
        {"303", "/next", "POST", "200 GET /next "},
        {"303", "/next", "HEAD", "200 "},
        {"307", "/next", "POST", "200 POST /next body"},
        {"301", "HTTP://%H/next", "GET", "200 GET /next "},
        {"302", "https://%H/next", "GET", "302 " + first + " "},
        {"302", "ftp://%H/next", "GET", "302 " + first + " "},
        {"302", "http:next", "GET", "302 " + first + " "},
        {"302", "http://[::1/", "GET", "302 " + first + " "},
        {"308", "/next", "GET", "308 " + first + " "},
        {"302", "/start/again", "GET", "The address '%B/start/again' was redirected too often."},
    };
    for (const SCase& example : cases) {
        const auto& [status, location, method, expected] = example;
        SCOPED_TRACE(status + " " + location);
        std::string base;
        std::atomic<int> requests = 0;
        const auto fill = [&](std::string text) {
            for (const auto& [name, value] : {std::pair("%B", base), std::pair("%H", base.substr(7))})
                if (const size_t at = text.find(name); at != std::string::npos) text.replace(at, 2, value);
            return text;
        };
        const CScriptedServer server([&](CPeer& peer) {
            const std::string request = peer.receive();
            ++requests;
            const bool go = request.find("/start/page?q=1") != std::string::npos ||
                            request.find("/start/again") != std::string::npos;
            peer.send("HTTP/1.1 " + (go ? example[0] + "\r\nLocation: " + fill(example[1]) : "200 OK") +
                      "\r\n\r\n");
            if (!request.starts_with("HEAD"))
                peer.send(request.substr(0, request.find(" HTTP/")) + " " +
                          request.substr(request.find("\r\n\r\n") + 4));
        });
        base = server.getBase();
        const P<IInStream> body = method == "POST" ? toStream("body") : P<CMemoryIOStream>();
        const auto request = make<CHTTPRequest>(method.c_str(), toURI(base + "/start/page?q=1"), body);
        EXPECT_EQ(run(*make<CHTTPOperation>(request), true), fill(expected));
        EXPECT_TRUE(requests <= 2 || requests == 21) << requests;
    }
}

TEST(Http, CredentialsStayWithTheirHost) {
    std::string other;
    const CScriptedServer second([&](CPeer& peer) {
        other = peer.receive();
        peer.send(kOK + "\r\n");
    });
    const CScriptedServer server([&](CPeer& peer) {
        peer.receive();
        peer.send("HTTP/1.1 302 Found\r\nLocation: " + second.getBase() + "/\r\n\r\n");
    });
    const auto request = make<CHTTPRequest>("GET", toURI(server.getBase()));
    for (const char* name : {"Authorization", "Cookie", "Host"}) request->getHeaders().set(name, "secret");
    request->getHeaders().set("Accept", "text/plain");
    EXPECT_EQ(run(*make<CHTTPOperation>(request), true), "200 ");
    EXPECT_NE(other.find("Accept: text/plain"), std::string::npos);
    EXPECT_EQ(other.find("secret"), std::string::npos);
}

// --- Limits ---

TEST(Http, TimeLimits) {
    const CScriptedServer silent([](CPeer& peer) { peer.waitForClose(); });
    const CScriptedServer drippingHead([](CPeer& peer) {
        while (peer.send("H")) peer.rest(10);
    });
    const CScriptedServer pausing([](CPeer& peer) {
        peer.receive();
        peer.send(kOK + "\r\nhello");
        peer.waitForClose();
    });
    const CScriptedServer drippingBody([](CPeer& peer) {
        peer.receive();
        peer.send(kChunked);
        while (peer.send("1\r\nx\r\n")) peer.rest(10);
    });
    SHTTPSettings silence;
    silence.silenceTimeout = 200;
    SHTTPSettings total;
    total.totalTimeout = 300;
    for (const bool wait : {false, true}) {
        EXPECT_EQ(get(silent.getBase(), silence, wait), kTimeOut);
        EXPECT_EQ(get(drippingHead.getBase(), silence, wait), kTimeOut) << "the limit covers the whole head";
        EXPECT_EQ(get(pausing.getBase(), silence, wait), kTimeOut);
        EXPECT_EQ(get(drippingBody.getBase(), total, wait), kTimeOut);
    }
}

TEST(Http, SizeLimits) {
    for (const char* response : {"Content-Length: 11\r\n\r\nhello world", "\r\nhello world",
                                 "Transfer-Encoding: chunked\r\n\r\nB\r\nhello world\r\n0\r\n\r\n"}) {
        const CScriptedServer server([&](CPeer& peer) {
            peer.receive();
            peer.send(kOK + response);
        });
        SHTTPSettings settings;
        settings.maxBodySize = 11;
        EXPECT_EQ(get(server.getBase(), settings), "200 hello world");
        settings.maxBodySize = 10;
        EXPECT_EQ(get(server.getBase(), settings),
                  "The response of '" + server.getBase() + "' is larger than permitted.");
    }
}

// --- Cancelling ---

// A look-up that is never done.
class CEndlessProxies : public CObject, public IProxyManager, public IProxyLookUp {
public:
    P<IProxyLookUp> startLookUp(const P<IURI>&) override { return P<IProxyLookUp>::share(this); }
    P<IURI> getProxy(const P<IURI>&) override { return nullptr; }
    bool isDone(const SNetWait& wait) override {
        while (wait.milliseconds != 0 && !wait.cancel->isSet()) std::this_thread::yield();
        return false;
    }
    P<IURI> getProxy() const override { return nullptr; }
};

// Fills the queue of a server that does not accept: further connections get no answer.
class CDeafServer {
public:
    CDeafServer() {
        for (int i = 0; i < 4; ++i)
            m_fillers.push_back(getConnectionManager()->start(
                getNetNameResolverManager()->resolve(toURI(m_server.getBase()))));
        for (const P<IConnection>& filler : m_fillers) filler->isConnected({50, nullptr});
    }
    std::string getBase() const { return m_server.getBase(); }

private:
    CScriptedServer m_server{nullptr};
    std::vector<P<IConnection>> m_fillers;
};

TEST(Http, CancelInEveryState) {
    const size_t before = countEntries("/proc/self/fd");
    {
        const CScriptedServer silent([](CPeer& peer) { peer.waitForClose(); });
        const CScriptedServer notReading([](CPeer& peer) { peer.waitForStop(); });
        const CScriptedServer pausing([](CPeer& peer) {
            peer.receive();
            peer.send(kOK + "\r\nhello");
            peer.waitForClose();
        });
        const CDeafServer deaf;
        const std::pair<EHTTPStep, std::string> cases[] = {
            {EHTTPStep::chooseTarget, silent.getBase()},    {EHTTPStep::connect, deaf.getBase()},
            {EHTTPStep::sendRequest, notReading.getBase()}, {EHTTPStep::receiveHead, silent.getBase()},
            {EHTTPStep::receiveBody, pausing.getBase()},
        };
        for (const auto& [step, base] : cases)
            for (const bool wait : {false, true}) {
                SHTTPSettings settings;
                settings.connectTimeout = settings.silenceTimeout = 0;
                if (step == EHTTPStep::chooseTarget) settings.proxies = make<CEndlessProxies>();
                P<IInStream> body;
                if (step == EHTTPStep::sendRequest) body = toStream(std::string(20'000'000, 'x'));
                const auto operation =
                    make<CHTTPOperation>(make<CHTTPRequest>("POST", toURI(base), body), settings);
                // A call that must not wait returns without the help of the other thread.
                std::promise<void> returned;
                std::thread rival([&] {
                    returned.get_future().wait_for(std::chrono::seconds(10));
                    std::this_thread::sleep_for(std::chrono::milliseconds(50));
                    operation->cancel();
                });
                const auto poll = [&] {
                    while (operation->getStep() < step) operation->advance(false);
                    operation->advance(false);
                };
                if (!wait) {
                    EXPECT_NO_THROW(poll()) << static_cast<int>(step);
                }
                returned.set_value();
                EXPECT_EQ(run(*operation, wait), "cancelled") << static_cast<int>(step);
                rival.join();
                EXPECT_EQ(operation->getStep(), EHTTPStep::closed);
                EXPECT_THROW(operation->advance(wait), CStreamClosedError);
            }
    }
    EXPECT_EQ(countEntries("/proc/self/fd"), before);
}

// A listener sees the steps in order and may cancel at each of them.
TEST(Http, ListenersSeeEveryStepAndMayCancel) {
    class CListener : public CObject, public IHTTPListener {
    public:
        void progressed(const SHTTPProgress& progress) override {
            steps.push_back(static_cast<int>(progress.step));
            received = progress.received;
            if (progress.step == stopAt) operation->cancel();
        }
        std::vector<int> steps;
        int64_t received = 0;
        EHTTPStep stopAt = EHTTPStep::closed;
        CHTTPOperation* operation = nullptr;
    };
    const CScriptedServer server([](CPeer& peer) {
        peer.receive();
        peer.send(kOK + "Content-Length: 5\r\n\r\nhello");
    });
    const auto operation = make<CHTTPOperation>(make<CHTTPRequest>("GET", toURI(server.getBase())));
    const P<CListener> listener = make<CListener>();
    listener->operation = operation.get();
    operation->addListener(listener.get());
    EXPECT_EQ(run(*operation, true), "200 hello");
    EXPECT_EQ(listener->steps, (std::vector<int>{1, 2, 3, 4, 5, 6, 6, 7}));
    EXPECT_EQ(listener->received, 5);
    for (int step = 1; step <= 6; ++step) {
        operation->reset();
        listener->stopAt = static_cast<EHTTPStep>(step);
        EXPECT_EQ(run(*operation, true), "cancelled") << step;
    }
    listener->stopAt = EHTTPStep::closed;
    operation->reset();
    EXPECT_EQ(run(*operation, false), "200 hello");
    operation->removeListener(listener.get());
}

TEST(Http, ResetNeedsABodyThatCanBeReadAgain) {
    const CScriptedServer server([](CPeer& peer) {
        peer.receive();
        peer.send("HTTP/1.1 307 Again\r\nLocation: /again\r\n\r\n");
    });
    const auto request =
        make<CHTTPRequest>("POST", toURI(server.getBase()), make<CBase64InStream>(toStream("aGVs")));
    const auto operation = make<CHTTPOperation>(request);
    const std::string expected =
        "Cannot reset HTTP operation because the request body stream is not resetable.";
    EXPECT_NE(errorOf<CInvalidObjectStateError>([&] { operation->reset(); }).find(expected),
              std::string::npos);
    EXPECT_NE(run(*operation, true).find(expected), std::string::npos)
        << "a redirection repeats the body, too";
}

// --- Many at once ---

TEST(Http, ManyThreads) {
    const CScriptedServer server([](CPeer& peer) {
        peer.receive();
        peer.send(kOK + "\r\nhello");
    });
    const std::string named = "http://localhost:" + std::to_string(server.getPort());
    std::vector<std::thread> threads;
    std::atomic<int> right = 0;
    for (int i = 0; i < 8; ++i)
        threads.emplace_back([&] {
            for (int k = 0; k < 20; ++k) right += get(k % 2 ? named : server.getBase()) == "200 hello";
        });
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(right, 160);
}

// --- Names, addresses, proxies ---

TEST(Http, HostsThatCannotBeReached) {
    int port = 0;
    {
        const CScriptedServer gone([](CPeer&) {});
        port = gone.getPort();
    }
    const std::string base = "http://localhost:" + std::to_string(port) + "/";
    EXPECT_EQ(get(base), "Connection refused by the remote side (code=111).");
    EXPECT_EQ(get("http://224.0.0.1/"), "No route to remote host (code=101)."); // for many hosts
    EXPECT_EQ(get("http://name.invalid/a"), "The adress http://name.invalid/a could'nt be resolved.");
    EXPECT_EQ(get("http://127.0.0.1:99999/"), "The adress http://127.0.0.1:99999/ could'nt be resolved.");
    EXPECT_EQ(errorOf<CURIError>([] { getNetNameResolverManager()->resolve(toURI("http://name.invalid/")); }),
              "Error resolving the network name 'http://name.invalid/'.");
    EXPECT_EQ(errorOf<CURIError>([] { getNetNameResolverManager()->start(toURI("mailto:me")); }),
              "Error resolving the network name 'mailto:me'. The naming scheme is not supported.");
    // What a host answers says more than that this machine has no network for a group.
    const P<INetAddress>
        group = getNetNameResolverManager()->resolve(toURI("tcp://224.0.0.1:9")).front(),
        gone = getNetNameResolverManager()->resolve(toURI("tcp://127.0.0.1:" + std::to_string(port))).front();
    for (const Addresses& addresses : {Addresses{group, gone}, {gone, group}})
        EXPECT_EQ(errorOf<CSocketError>([&] {
                      getConnectionManager()->start(addresses)->isConnected({30'000, nullptr});
                  }),
                  "Connection refused by the remote side (code=111).");
    EXPECT_EQ(errorOf<CError>([] { getConnectionManager()->start({}); }),
              "Cannot create network connection. The address type is not supported.");

    const CDeafServer deaf;
    SHTTPSettings settings;
    settings.connectTimeout = 300;
    for (const bool wait : {false, true}) EXPECT_EQ(get(deaf.getBase(), settings, wait), kTimeOut);
}

TEST(Http, AnAddressThatDoesNotAnswerCostsNoTimeOut) {
    const CDeafServer deaf;
    const CScriptedServer server([](CPeer& peer) { peer.waitForClose(); });
    Addresses addresses = getNetNameResolverManager()->resolve(toURI(deaf.getBase()));
    addresses.push_back(getNetNameResolverManager()->resolve(toURI(server.getBase())).front());
    const P<IConnection> connection = getConnectionManager()->start(addresses);
    EXPECT_TRUE(connection->isConnected({5000, nullptr}));

    const auto before = std::chrono::steady_clock::now();
    EXPECT_FALSE(connection->getInStream()->isReadable({50, nullptr}));
    EXPECT_GE(std::chrono::steady_clock::now() - before, std::chrono::milliseconds(50));
    connection->close();
    EXPECT_THROW(connection->isConnected({}), CStreamClosedError);
    EXPECT_THROW(connection->getInStream(), CStreamClosedError);

    const P<INetEvent> cancel = createNetEvent();
    cancel->set(); // before the wait
    addresses.pop_back();
    EXPECT_FALSE(getConnectionManager()->start(addresses)->isConnected({SNetWait::kForever, cancel}));
}

TEST(Net, StreamsWaitForTheOtherSide) {
    std::string received;
    const CScriptedServer server([&](CPeer& peer) {
        peer.rest(20);
        received = peer.receive();
        peer.send("abc");
        peer.rest(20);
        peer.send("defg");
    });
    const Addresses addresses = getNetNameResolverManager()->resolve(toURI(server.getBase()));
    const P<IConnection> connection = getConnectionManager()->start(addresses);
    EXPECT_THROW(connection->getInStream(), CStreamClosedError) << "not connected yet";
    ASSERT_TRUE(connection->isConnected({30'000, nullptr}));
    const P<INetInStream> in = connection->getInStream();
    const P<INetOutStream> out = connection->getOutStream();
    EXPECT_FALSE(in->getURI() || out->getURI());
    EXPECT_TRUE(out->isAtEnd() && out->isWritable({}));
    char bytes[8] = {};
    EXPECT_THROW(out->write(bytes, -1), CInvalidArgError);
    EXPECT_THROW(out->tryWrite(bytes, -1), CInvalidArgError);
    EXPECT_THROW(in->tryRead(bytes, -1), CInvalidArgError);
    EXPECT_FALSE(in->tryRead(bytes, 1));

    std::string request = "Content-Length: 20000000\r\n\r\n"; // more than the connection buffers
    for (int i = 0; request.size() < 20'000'028; ++i) request += static_cast<char>(i % 251);
    {
        const tests::CSystemCalls calls(tests::interrupt);
        out->write(request.data(), std::ssize(request));
    }
    for (int i = 0; i < 2; ++i) EXPECT_FALSE(in->isAtEnd());
    EXPECT_TRUE(in->isReadable({}));
    EXPECT_EQ(in->tryRead(bytes, 0), 0);
    in->read(bytes, 2);
    EXPECT_STREQ(bytes, "ab");
    in->skip(1);
    in->read(bytes, 4);
    EXPECT_STREQ(bytes, "defg");
    EXPECT_TRUE(in->isAtEnd());
    EXPECT_TRUE(received == request);
    in->close();
    EXPECT_THROW(out->write(bytes, 1), CStreamClosedError);
    const P<IConnection> second = getConnectionManager()->start(addresses);
    ASSERT_TRUE(second->isConnected({30'000, nullptr}));
    second->getOutStream()->close();
    EXPECT_THROW(second->getInStream()->tryRead(bytes, 1), CStreamClosedError);
}

// Supports nothing, and leaves its manager when it is asked.
class CLeaver : public CObject, public IConnectionFactory, public INetNameResolver {
public:
    P<IConnection> tryStart(const Addresses&) override {
        getConnectionManager()->removeFactory(P<IConnectionFactory>::share(this));
        return ++asked, nullptr;
    }
    P<INetNameResolution> tryStart(const P<IURI>&) override {
        getNetNameResolverManager()->removeResolver(P<INetNameResolver>::share(this));
        return ++asked, nullptr;
    }
    int asked = 0;
};

TEST(Net, ManagersAskWhoeverIsRegistered) {
    const P<CLeaver> leaver = make<CLeaver>();
    EXPECT_THROW(getConnectionManager()->addFactory(nullptr), CInvalidArgError);
    EXPECT_THROW(getNetNameResolverManager()->addResolver(nullptr), CInvalidArgError);
    getConnectionManager()->addFactory(leaver);
    getNetNameResolverManager()->addResolver(leaver);
    for (int i = 0; i < 2; ++i) {
        EXPECT_THROW(getConnectionManager()->start({}), CError);
        EXPECT_THROW(getNetNameResolverManager()->start(toURI("mailto:me")), CURIError);
    }
    EXPECT_EQ(leaver->asked, 2);
    EXPECT_THROW(getNetNameResolverManager()->start(nullptr), CInvalidArgError);
}

TEST(Http, IPv6) {
    const CScriptedServer server(
        [](CPeer& peer) {
            const std::string request = peer.receive();
            peer.send(kOK + "\r\n" + request.substr(request.find("Host: "), 17));
        },
        AF_INET6);
    if (server.getPort() == 0) GTEST_SKIP() << "no IPv6";
    const std::string port = std::to_string(server.getPort());
    EXPECT_EQ(get(server.getBase()), ("200 Host: [::1]:" + port).substr(0, 21));
}

TEST(Http, Proxies) {
    std::string received;
    const CScriptedServer proxy([&](CPeer& peer) {
        received = peer.receive();
        peer.send(kOK + "\r\nhello");
    });
    const CEnvironment setting("http_proxy", "me:word@" + proxy.getBase().substr(7));
    const CEnvironment exceptions("no_proxy", "127.0.0.1, <local>, .example.net");
    EXPECT_EQ(get("http://www.example.org/a?b"), "200 hello");
    EXPECT_EQ(received,
              "GET http://www.example.org/a?b HTTP/1.1\r\nHost: www.example.org\r\nConnection: close\r\n"
              "Proxy-Authorization: Basic bWU6d29yZA==\r\n\r\n");
    EXPECT_EQ(get("http://www.example.org:80/"), "200 hello");
    EXPECT_EQ(received.substr(0, 75),
              "GET http://www.example.org:80/ HTTP/1.1\r\nHost: www.example.org\r\nConnection:");
    const P<IProxyManager> manager = getProxyManager();
    EXPECT_EQ(text(manager->getProxy(toURI("http://example.org"))->getAsString()),
              "http://me:word@" + proxy.getBase().substr(7));
    for (const char* direct : {"http://intranet/", "http://127.0.0.1/", "http://www.example.net:81/"})
        EXPECT_TRUE(manager->isDirect(toURI(direct))) << direct;
    const CEnvironment withoutPort("http_proxy", "http://proxy.example.org/");
    EXPECT_EQ(text(manager->getProxy(toURI("http://example.org"))->getAsString()),
              "http://proxy.example.org:8080");
    EXPECT_EQ(text(createProxyManager(80)->getProxy(toURI("http://example.org"))->getAsString()),
              "http://proxy.example.org:80");
    const CEnvironment socks("http_proxy", "socks5://proxy:1");
    EXPECT_TRUE(manager->isDirect(toURI("http://example.org")));
}

// --- Streams ---

// The stream manager reads a large file from another server.
TEST(Http, StreamFromAnotherServer) {
    const tests::CTempFolder folder;
    std::string bytes(100'000'000, '\0');
    std::mt19937_64 random(1);
    for (size_t i = 0; i < bytes.size(); i += 8) {
        const uint64_t word = random();
        std::memcpy(bytes.data() + i, &word, 8);
    }
    std::ofstream(folder / "large.bin", std::ios::binary) << bytes;
    const tests::CProcess server(
        {"python3", "-u", "-c",
         "import http.server as h, functools, sys\n"
         "s = h.ThreadingHTTPServer(('127.0.0.1', 0), functools.partial(h.SimpleHTTPRequestHandler, "
         "directory=sys.argv[1]))\nprint(s.server_port)\ns.serve_forever()",
         (folder / "").string()});
    while (server.readOut().find('\n') == std::string::npos && server.isRunning())
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    const std::string base = "http://127.0.0.1:" + std::to_string(std::stoi(server.readOut())) + "/";

    EXPECT_TRUE(readAll(*getStreamManager()->getInStream(toURI(base + "large.bin"))) == bytes);
    std::ofstream(folder / "small.bin", std::ios::binary) << bytes.substr(0, 100'000);
    const P<IInStream> stream = getStreamManager()->getInStream(toURI(base + "small.bin"));
    stream->skip(99'999);
    EXPECT_FALSE(stream->isAtEnd());
    char last = 0;
    EXPECT_EQ(stream->readSome(&last, 0), 0);
    stream->read(&last, 1);
    EXPECT_EQ(last, bytes[99'999]);
    EXPECT_TRUE(stream->isAtEnd());
    EXPECT_THROW(stream->read(&last, 1), CEndOfStreamError);
    stream->close();
    EXPECT_EQ(errorOf<CStreamClosedError>([&] { stream->readSome(&last, 1); }),
              "The stream has been closed (uri: '" + base + "small.bin').");
    EXPECT_EQ(errorOf<CHTTPError>([&] { getStreamManager()->getInStream(toURI(base + "none"))->isAtEnd(); }),
              "HTTP error 404 (File not found)");
}

} // namespace
