#include "isolation/BoxedFixture.h"
#include "support/Process.h"

#include <atomic>
#include <chrono>
#include <csignal>
#include <fcntl.h>
#include <random>
#include <sys/file.h>
#include <unistd.h>

namespace {

using namespace tests;

// Jobs of each kind that a kill has to hit. scripts/isolation.sh sets more.
int getKills() {
    const char* kills = std::getenv("TONEWRIGHT_TEST_KILLS");
    return kills ? std::atoi(kills) : 15;
}

// Kills each child of this process at a random moment of the time that a job takes, until the end of the
// scope.
class CKiller {
public:
    CKiller(unsigned seed, std::chrono::microseconds jobTime)
        : m_thread([this, seed, jobTime] { work(seed, static_cast<unsigned>(jobTime.count())); }) {}
    ~CKiller() {
        m_stop = true;
        m_thread.join();
    }
    CKiller(const CKiller&) = delete;
    CKiller& operator=(const CKiller&) = delete;

private:
    void work(unsigned seed, unsigned jobTime) {
        std::mt19937 random(seed);
        while (!m_stop) {
            const std::vector<pid_t> children = listChildren(::getpid());
            if (children.empty()) {
                std::this_thread::sleep_for(std::chrono::microseconds(200));
                continue;
            }
            std::this_thread::sleep_for(std::chrono::microseconds(random() % jobTime));
            for (const pid_t child : children) ::kill(child, SIGKILL);
            while (!m_stop && listChildren(::getpid()) == children) std::this_thread::yield();
        }
    }

    std::atomic<bool> m_stop{false};
    std::thread m_thread;
};

std::chrono::microseconds timeOf(const std::function<void()>& job) {
    const auto start = std::chrono::steady_clock::now();
    job();
    const auto time = std::chrono::steady_clock::now() - start;
    return std::chrono::duration_cast<std::chrono::microseconds>(time) + std::chrono::microseconds(1);
}

} // namespace

TEST_F(Boxed, SlavesMayBeKilledAtAnyMoment) {
    m_frames = 300'000;
    const std::string expected = makeExpected();
    const auto target = m_out / "out.faulty";
    const auto decodeTime = timeOf([&] { decode("healthy.faulty"); });
    const auto encodeTime = timeOf([&] { encode(target); });
    std::filesystem::remove(target);
    const size_t before = countDescriptors();
    const int wanted = getKills();
    const int mostJobs = wanted * 6; // of each kind
    int reading = 0;
    int writing = 0;
    for (int i = 0; i < mostJobs && (reading < wanted || writing < wanted); ++i) {
        SCOPED_TRACE(i);
        if (reading < wanted) {
            const CKiller killer(static_cast<unsigned>(i), decodeTime);
            std::string samples;
            const bool isKilled = !decode("healthy.faulty", &samples).empty();
            EXPECT_TRUE(isKilled || samples == expected);
            reading += isKilled;
        }
        if (writing < wanted) {
            const CKiller killer(static_cast<unsigned>(i), encodeTime);
            const bool isKilled = !encode(target).empty();
            EXPECT_NE(std::filesystem::exists(target), isKilled);
            writing += isKilled;
        }
        std::filesystem::remove(target);
        EXPECT_EQ(countEntries(m_out.path()), 0u);
    }
    RecordProperty("reading", reading);
    RecordProperty("writing", writing);
    EXPECT_GT(reading + writing, 0);
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
