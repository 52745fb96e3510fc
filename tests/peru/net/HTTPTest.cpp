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

size_t countDescriptors() {
    const std::filesystem::directory_iterator folder("/proc/self/fd");
    return static_cast<size_t>(std::distance(begin(folder), end(folder)));
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
    {"trailers",
     kOK + "Transfer-Encoding: chunked\r\n\r\nA\r\n0123456789\r\n0;end\r\nX: 1\r\nY: 2\r\n\r\nrest",
     "200 0123456789"},
    {"chunks cut off", kOK + "Transfer-Encoding: chunked\r\n\r\n5\r\nhello\r\n", kEarlyEnd},
    {"trailers cut off", kOK + "Transfer-Encoding: chunked\r\n\r\n5\r\nhello\r\n0\r\n", kEarlyEnd},
    {"chunk without a size", kOK + "Transfer-Encoding: chunked\r\n\r\n\r\nhello", kIllegal},
    {"chunk longer than its size", kOK + "Transfer-Encoding: chunked\r\n\r\n4\r\nhello\r\n0\r\n\r\n",
     kIllegal},
    {"largest chunk size", kOK + "Transfer-Encoding: chunked\r\n\r\n7fffffffffffffff\r\nhello", kEarlyEnd},
    {"chunk size too large", kOK + "Transfer-Encoding: chunked\r\n\r\n80000000000000000\r\nhello", kIllegal},
    {"endless extension", kOK + "Transfer-Encoding: chunked\r\n\r\n5;" + std::string(70'000, 'x'), kIllegal},
    {"endless trailers", kOK + "Transfer-Encoding: chunked\r\n\r\n0\r\n" + std::string(70'000, 'x'),
     kIllegal},
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
    const size_t before = countDescriptors();
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
                const std::string outcome = run(*make<CHTTPOperation>(request), wait);
                if (example.expected.starts_with("200") || example.expected.starts_with("302"))
                    EXPECT_EQ(outcome, example.expected);
                else
                    EXPECT_EQ(outcome.substr(0, example.expected.size()), example.expected);
            }
    EXPECT_EQ(countDescriptors(), before);
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
    const auto send = [&](const char* method, const std::string& uri, const P<IInStream>& body) {
        const P<CHTTPRequest> request = make<CHTTPRequest>(method, toURI(uri), body);
        request->getHeaders().set("X", "1");
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
    struct SCase {
        const char* status;
        std::string location; // %B stands for the server
        const char* method;
        std::string expected; // what the server received last, or the outcome
    };
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
        SCOPED_TRACE(example.status + (" " + example.location));
        std::string base;
        const auto fill = [&](std::string text) {
            for (const auto& [name, value] : {std::pair("%B", base), std::pair("%H", base.substr(7))})
                if (const size_t at = text.find(name); at != std::string::npos) text.replace(at, 2, value);
            return text;
        };
        const CScriptedServer server([&](CPeer& peer) {
            const std::string request = peer.receive();
            const bool go = request.find("/start/page?q=1") != std::string::npos ||
                            request.find("/start/again") != std::string::npos;
            peer.send("HTTP/1.1 " +
                      (go ? example.status + ("\r\nLocation: " + fill(example.location)) : "200 OK") +
                      "\r\n\r\n");
            if (!request.starts_with("HEAD"))
                peer.send(request.substr(0, request.find(" HTTP/")) + " " +
                          request.substr(request.find("\r\n\r\n") + 4));
        });
        base = server.getBase();
        const bool post = std::string_view(example.method) == "POST";
        const P<IInStream> body = post ? toStream("body") : P<CMemoryIOStream>();
        const auto request = make<CHTTPRequest>(example.method, toURI(base + "/start/page?q=1"), body);
        EXPECT_EQ(run(*make<CHTTPOperation>(request), true), fill(example.expected));
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
    request->getHeaders().set("Authorization", "secret");
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
        peer.send(kOK + "Transfer-Encoding: chunked\r\n\r\n");
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
    for (const char* head :
         {"Content-Length: 11\r\n\r\n", "\r\n", "Transfer-Encoding: chunked\r\n\r\nB\r\n"}) {
        const CScriptedServer server([&](CPeer& peer) {
            peer.receive();
            peer.send(kOK + head + "hello world\r\n0\r\n\r\n");
        });
        SHTTPSettings settings;
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
    const size_t before = countDescriptors();
    {
        const CScriptedServer silent([](CPeer& peer) { peer.waitForClose(); });
        const CScriptedServer notReading([](CPeer& peer) { peer.waitForStop(); });
        const CScriptedServer pausing([](CPeer& peer) {
            peer.receive();
            peer.send(kOK + "\r\nhello");
            peer.waitForClose();
        });
        const CDeafServer deaf;
        const struct {
            EHTTPStep step;
            std::string base;
        } cases[] = {
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
    EXPECT_EQ(countDescriptors(), before);
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

TEST(Http, ManyOperationsOnOnePollingThread) {
    const CScriptedServer server([](CPeer& peer) {
        const std::string request = peer.receive();
        peer.send(kOK + "\r\n" + request.substr(0, request.find(" HTTP/")));
    });
    struct SJob {
        P<CHTTPOperation> operation;
        std::string body;
        bool done = false;
    };
    std::vector<SJob> jobs(200);
    for (size_t i = 0; i < jobs.size(); ++i)
        jobs[i].operation = make<CHTTPOperation>(
            make<CHTTPRequest>("GET", toURI(server.getBase() + "/" + std::to_string(i))));
    for (size_t left = jobs.size(); left > 0;)
        for (SJob& job : jobs) {
            char block[100];
            const std::optional<int64_t> count =
                job.done ? std::nullopt : job.operation->getInStream()->tryRead(block, sizeof block);
            if (!count) continue;
            job.body.append(block, static_cast<size_t>(*count));
            job.done = *count == 0;
            left -= job.done;
        }
    for (size_t i = 0; i < jobs.size(); ++i) EXPECT_EQ(jobs[i].body, "GET /" + std::to_string(i));
}

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
    EXPECT_EQ(get("http://name.invalid/a"), "The adress http://name.invalid/a could'nt be resolved.");
    EXPECT_EQ(get("http://127.0.0.1:99999/"), "The adress http://127.0.0.1:99999/ could'nt be resolved.");
    EXPECT_EQ(errorOf<CURIError>([] { getNetNameResolverManager()->resolve(toURI("http://name.invalid/")); }),
              "Error resolving the network name 'http://name.invalid/'.");
    EXPECT_EQ(errorOf<CURIError>([] { getNetNameResolverManager()->start(toURI("mailto:me")); }),
              "Error resolving the network name 'mailto:me'. The naming scheme is not supported.");
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
    // The name has an IPv4 address, too, where nobody listens.
    if (getNetNameResolverManager()->resolve(toURI("http://localhost/")).size() > 1) {
        EXPECT_EQ(get("http://localhost:" + port), ("200 Host: localhost:" + port).substr(0, 21));
    }
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
