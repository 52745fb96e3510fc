#include "isolation/BoxedFixture.h"
#include "support/Process.h"

#include <atomic>
#include <csignal>
#include <fcntl.h>
#include <random>
#include <sys/file.h>
#include <unistd.h>

namespace {

using namespace tests;

// scripts/isolation.sh sets more.
int getRounds() {
    const char* rounds = std::getenv("TONEWRIGHT_TEST_KILLS");
    return rounds ? std::atoi(rounds) : 15;
}

// Kills each child of this process some time after it has started, until the end of the scope.
class CKiller {
public:
    explicit CKiller(unsigned seed) : m_thread([this, seed] { work(seed); }) {}
    ~CKiller() {
        m_stop = true;
        m_thread.join();
    }
    CKiller(const CKiller&) = delete;
    CKiller& operator=(const CKiller&) = delete;

private:
    void work(unsigned seed) {
        std::mt19937 random(seed);
        while (!m_stop) {
            const std::vector<pid_t> children = listChildren(::getpid());
            if (children.empty()) {
                std::this_thread::sleep_for(std::chrono::milliseconds(1));
                continue;
            }
            std::this_thread::sleep_for(std::chrono::microseconds(random() % 40'000));
            for (const pid_t child : children) ::kill(child, SIGKILL);
            while (!m_stop && listChildren(::getpid()) == children) std::this_thread::yield();
        }
    }

    std::atomic<bool> m_stop{false};
    std::thread m_thread;
};

} // namespace

TEST_F(Boxed, SlavesMayBeKilledAtAnyMoment) {
    const auto target = m_out / "out.faulty";
    expectHealthy();
    const size_t before = countDescriptors();
    int failures = 0;
    for (int i = 0; i < getRounds(); ++i) {
        SCOPED_TRACE(i);
        {
            const CKiller killer(static_cast<unsigned>(i));
            std::string samples;
            const std::string message = decode("healthy.faulty", &samples);
            failures += !message.empty();
            EXPECT_TRUE(!message.empty() || samples == m_expected);
        }
        {
            const CKiller killer(static_cast<unsigned>(i));
            const std::string message = encode(target);
            failures += !message.empty();
            EXPECT_EQ(std::filesystem::exists(target), message.empty()) << message;
        }
        std::filesystem::remove(target);
        EXPECT_EQ(countEntries(m_out.path()), 0u);
    }
    RecordProperty("failures", failures);
    expectHealthy();
    EXPECT_TRUE(waitUntil([&] { return countDescriptors() <= before; }));
}

// A process of its own that hosts a slave: this program, with the test below.
TEST_F(Boxed, DISABLED_HostThatNeverEnds) {
    decode("hang@getNextAudioChunk.faulty");
}

TEST_F(Boxed, SlavesEndWithTheirHost) {
    CProcess host({"/proc/self/exe", "--gtest_also_run_disabled_tests",
                   "--gtest_filter=Boxed.DISABLED_HostThatNeverEnds"});
    std::vector<pid_t> slaves;
    ASSERT_TRUE(waitUntil([&] { return !(slaves = listChildren(host.getId())).empty(); }));
    host.signal(SIGKILL);
    host.wait();
    EXPECT_TRUE(waitUntil([&] {
        const std::string name = readFile("/proc/" + std::to_string(slaves[0]) + "/comm");
        return name.find("sonora2_slave") == std::string::npos;
    }));
}

TEST_F(Boxed, CrashLogsOfKilledHostsAreRemovedByTheNext) {
    namespace fs = std::filesystem;
    const auto old = fs::file_time_type::clock::now() - std::chrono::hours(1);
    const auto stale = m_temporary.write("sonora2_slave_aaaaaa_log", "");
    const auto locked = m_temporary.write("sonora2_slave_bbbbbb_log", "");
    const auto report = m_temporary.write("sonora2_slave_cccccc_log", "a crash");
    const auto fresh = m_temporary.write("sonora2_slave_dddddd_log", "");
    for (const auto& file : {stale, locked, report}) fs::last_write_time(file, old);
    const int lock = ::open(locked.c_str(), O_WRONLY | O_CLOEXEC);
    ASSERT_EQ(::flock(lock, LOCK_EX | LOCK_NB), 0);
    EXPECT_EQ(decode("healthy.faulty"), "");
    EXPECT_FALSE(fs::exists(stale));
    EXPECT_TRUE(fs::exists(locked) && fs::exists(report) && fs::exists(fresh));
    ::close(lock);
}
