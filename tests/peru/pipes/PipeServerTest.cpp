#include "peru/pipes/PipeSupport.h"

#include <atomic>
#include <csignal>
#include <memory>
#include <mutex>
#include <sys/stat.h>
#include <sys/wait.h>

namespace {

using namespace peru;
using tests::CCreatedListener;
using tests::CEnvironment;
using tests::CRawSocket;
using tests::errorOf;
using tests::text;
using tests::titleOf;

constexpr uint32_t kHang = 30000; // milliseconds after which something hangs

class PipeServer : public tests::CPipeTest {};

// Notes the calls; reads up to `m_step` bytes of each client at a time.
class CRecorder : public CObject, public IPipeServerListener, public IPipeServer::IPipeCreatedListener {
public:
    explicit CRecorder(int64_t step = 1 << 20) : m_step(step) {}

    void onPipeCreated(IPipeServer*) override { add("created"); }
    void onClientConnected(IPipeServer*, const P<IPipeClient>&) override { add("connected"); }
    void onClientDisconnected(IPipeServer* server, const P<IPipeClient>&) override {
        add("disconnected " + std::to_string(server->getClientCount()));
    }
    void onData(IPipeServer*, const P<IPipeClient>& client) override {
        std::string bytes(static_cast<size_t>(std::min(m_step, client->getInStream()->getAvailable())), 0);
        client->getInStream()->read(bytes.data(), static_cast<int64_t>(bytes.size()));
        add("data " + bytes);
    }

    // Waits until the last call is the given one and returns all of them.
    std::string waitFor(const std::string& last) {
        for (uint32_t i = 0; i < kHang; ++i) {
            {
                const std::lock_guard lock(m_mutex);
                if (m_calls.ends_with(last + "\n")) return m_calls;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
        return "no call '" + last + "' but " + m_calls;
    }

private:
    void add(const std::string& call) {
        const std::lock_guard lock(m_mutex);
        m_calls += call + "\n";
    }

    const int64_t m_step;
    std::mutex m_mutex;
    std::string m_calls;
};

TEST_F(PipeServer, OnlyTheUserReachesItsPipes) {
    const P<IPipeServer> pipe = server();
    pipe->start();
    struct stat status;
    ASSERT_EQ(::lstat(path("").c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0700u);
    ASSERT_EQ(::lstat(path().c_str(), &status), 0);
    EXPECT_EQ(status.st_mode, mode_t(S_IFSOCK | 0600));
    pipe->stop();
    EXPECT_EQ(tests::countEntries(path("")), 0u);

    // Names of the longest kind fit even into a folder that is too long for the path of a socket.
    const auto deep = m_folder / std::string(120, 'd');
    std::filesystem::create_directory(deep);
    const CEnvironment environment("XDG_RUNTIME_DIR", deep.string());
    const std::string longest(80, 'n');
    const P<IPipeServer> far = server(longest.c_str());
    far->start();
    EXPECT_TRUE(client(longest.c_str())->connect());
}

TEST_F(PipeServer, RefusesAFolderThatOthersCouldControl) {
    const auto refused = [&] {
        EXPECT_THROW(client()->connect(), CError);
        EXPECT_EQ(titleOf([] { server()->start(); }), "Error starting Pipe Server");
        EXPECT_FALSE(server()->acceptOne(nullptr));
    };
    std::filesystem::create_directory(m_folder / "elsewhere");
    std::filesystem::permissions(m_folder / "elsewhere", std::filesystem::perms::owner_all);
    std::filesystem::create_directory_symlink(m_folder / "elsewhere", path("").parent_path());
    refused();
    std::filesystem::remove(path("").parent_path());
    std::filesystem::create_directory(path(""));
    ::chmod(path("").c_str(), 0755);
    refused();
    EXPECT_NE(errorOf<CError>([] { client()->connect(); }).find(path("").parent_path().string()),
              std::string::npos);
}

TEST_F(PipeServer, UsesTheTemporaryFolderWithoutARuntimeFolder) {
    const CEnvironment temporary("TMPDIR", m_folder.path().string());
    const auto own = m_folder / ("tonewright-pipes-" + std::to_string(::geteuid())) / "pipe";
    for (const char* runtime : {static_cast<const char*>(nullptr), "", "relative", "/nonexistent/folder"}) {
        const CEnvironment environment("XDG_RUNTIME_DIR", runtime);
        const P<IPipeServer> pipe = server();
        pipe->start();
        EXPECT_TRUE(std::filesystem::is_socket(own));
        EXPECT_TRUE(client()->connect());
    }
}

TEST_F(PipeServer, NameBelongsToOneLivingServer) {
    const P<IPipeServer> first = server();
    first->start();
    EXPECT_EQ(titleOf([] { server()->start(); }), "Error starting Pipe Server");
    EXPECT_FALSE(server()->acceptOne(nullptr));
    EXPECT_EQ(first->getClientCount(), 0u) << "the other servers must not look like clients";
    const P<IPipeClient> peer = client();
    EXPECT_TRUE(peer->connect());
    EXPECT_TRUE(first->waitForClient(kHang));
    EXPECT_THROW(first->start(), CInvalidObjectStateError);
    first->stop();
    EXPECT_EQ(first->getClientCount(), 0u);
    EXPECT_TRUE(peer->getInStream()->isAtEnd());

    // A server that was killed leaves its file behind.
    const pid_t child = ::fork();
    if (child == 0) {
        const CRawSocket dead(path(), true);
        ::raise(SIGKILL);
    }
    ::waitpid(child, nullptr, 0);
    ASSERT_TRUE(std::filesystem::is_socket(path()));
    EXPECT_FALSE(client()->connect());
    first->start();
    EXPECT_TRUE(client()->connect());

    // Somebody else's file is not removed.
    std::filesystem::remove(path());
    std::ofstream(path()) << "file";
    first->stop();
    EXPECT_TRUE(std::filesystem::is_regular_file(path()));
    EXPECT_EQ(titleOf([] { server()->start(); }), "Error starting Pipe Server");
}

TEST_F(PipeServer, AcceptOneWaitsForOneClient) {
    EXPECT_FALSE(client()->connect());
    const SPair pair = connect();
    ASSERT_TRUE(pair.accepted);
    EXPECT_EQ(pair.server->getClientCount(), 1u);
    EXPECT_EQ(pair.server->getClient(0), pair.accepted);
    EXPECT_FALSE(pair.server->getClient(1));
    EXPECT_FALSE(client()->connect()) << "there is only one instance";
    EXPECT_THROW(pair.client->connect(), CInvalidObjectStateError);

    const P<IPipeServer> late = server("late");
    late->setDeadline(20);
    EXPECT_FALSE(late->acceptOne(nullptr));
    EXPECT_EQ(late->getClientCount(), 0u);
    late->start();
    EXPECT_FALSE(late->waitForClient(kHang));
    EXPECT_FALSE(client("late")->connect());
    late->stop();

    late->setDeadline(0);
    std::thread stopper;
    const auto created = make<CCreatedListener>([&] { stopper = std::thread([&] { late->stop(); }); });
    EXPECT_FALSE(late->acceptOne(created.get()));
    stopper.join();
}

TEST_F(PipeServer, AdmitsByItsRules) {
    const EPipeTrustee mine = ::geteuid() == 0 ? kPipeAdministrators : kPipeAuthenticatedUsers;
    const P<IPipeServer> pipe = server();
    pipe->setAccessRules({{{false, kPipeWrite, mine}, {true, kPipeAll, mine}}});
    pipe->start();
    const CRawSocket refused(path());
    EXPECT_EQ(refused.receive(), "");
    EXPECT_EQ(pipe->getClientCount(), 0u);
    pipe->stop();
    pipe->setAccessRules({{{true, kPipeRead | kPipeWrite, mine}, {false, kPipeAll, kPipeAnonymous}}});
    pipe->setDeadline(kHang);
    pipe->start();
    const P<IPipeClient> admitted = client();
    EXPECT_TRUE(admitted->connect());
    EXPECT_TRUE(pipe->waitForClient(kHang));
    pipe->stop();
    pipe->setAccessRules({{{true, 0, mine}, {true, kPipeAll, mine}}});
    EXPECT_EQ(titleOf([&] { pipe->start(); }), "Could not create DACL for Pipe Server");
    EXPECT_EQ(titleOf([&] { pipe->acceptOne(nullptr); }), "Could not create DACL for Pipe Server");
}

TEST_F(PipeServer, ListenersFollowTheClients) {
    const P<CRecorder> recorder = make<CRecorder>(3);
    const P<IPipeServer> pipe = server();
    const P<IOutStream> all = pipe->getOutStream();
    EXPECT_EQ(titleOf([&] { all->write("x", 1); }), "Error write to server clients. No clients connected.");
    pipe->addListener(recorder.get());
    pipe->start();
    {
        const CRawSocket first(path());
        recorder->waitFor("connected");
        const CRawSocket second(path());
        recorder->waitFor("connected\nconnected");
        all->write("hello", 5);
        EXPECT_EQ(first.receive(), "hello");
        EXPECT_EQ(second.receive(), "hello");
        second.send("abcdefg"); // read in three steps
        recorder->waitFor("data g");
        first.send("1");
    }
    const std::string calls = recorder->waitFor("disconnected 0");
    EXPECT_EQ(calls.find("created\nconnected\nconnected\ndata abc\ndata def\ndata g\n"), 0u) << calls;
    EXPECT_NE(calls.find("data 1\n"), std::string::npos) << "the last bytes of a client that has gone";
    EXPECT_TRUE(pipe->removeListener(recorder.get()));
    EXPECT_FALSE(pipe->removeListener(recorder.get()));
    pipe->stop();
    pipe->start();
    EXPECT_EQ(recorder->waitFor("disconnected 0"), calls);
    const CRawSocket early(path());
    std::this_thread::sleep_for(std::chrono::milliseconds(20)); // until nobody waits for its data
    pipe->addListener(recorder.get());
    std::this_thread::sleep_for(std::chrono::milliseconds(20)); // until somebody does
    early.send("early");
    EXPECT_TRUE(recorder->waitFor("data ear\ndata ly").ends_with("data ly\n"));
    pipe->stop();
    all->close();
    EXPECT_THROW(all->write("x", 1), CStreamClosedError);
    pipe->removeListener(recorder.get());
}

TEST_F(PipeServer, DataThatNobodyReadsIsReportedOncePerArrival) {
    class CCounter : public CRecorder {
    public:
        void onData(IPipeServer*, const P<IPipeClient>&) override { ++m_calls; }
        std::atomic<int> m_calls{0};
    };
    const P<CCounter> counter = make<CCounter>();
    const P<IPipeServer> pipe = server();
    pipe->addListener(counter.get());
    pipe->start();
    auto peer = std::make_unique<CRawSocket>(path());
    counter->waitFor("connected");
    for (int i = 1; i <= 3; ++i) {
        peer->send("x");
        while (counter->m_calls < i) std::this_thread::yield();
    }
    const clock_t before = ::clock();
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    EXPECT_EQ(counter->m_calls, 3);
    EXPECT_LT(::clock() - before, CLOCKS_PER_SEC / 20) << "the accept thread is busy";
    // A client that has gone is reported when somebody has read the rest.
    peer = nullptr;
    std::this_thread::sleep_for(std::chrono::milliseconds(20)); // otherwise the thread sees both at once
    pipe->getClient(0)->getInStream()->skip(3);
    EXPECT_EQ(counter->waitFor("disconnected 0"), "created\nconnected\ndisconnected 0\n");
    pipe->removeListener(counter.get());
}

TEST_F(PipeServer, StartsAndStopsWhileClientsComeAndGo) {
    const P<IPipeServer> pipe = server();
    std::atomic<bool> done{false};
    std::vector<std::thread> threads;
    for (int i = 0; i < 3; ++i)
        threads.emplace_back([&] {
            while (!done) {
                const P<IPipeClient> peer = client();
                if (peer->connect()) peer->getOutStream()->writeByte(1);
                const P<CRecorder> recorder = make<CRecorder>();
                pipe->addListener(recorder.get());
                pipe->removeListener(recorder.get());
            }
        });
    threads.emplace_back([&] {
        while (!done) pipe->stop();
    });
    for (int i = 0; i < 50; ++i) {
        try {
            pipe->start();
        } catch (const CInvalidObjectStateError&) {
        }
        pipe->stop();
    }
    done = true;
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(tests::countEntries(path("")), 0u);
}

} // namespace
