#include "isolation/BoxedFixture.h"
#include "support/Process.h"

#include <atomic>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <fcntl.h>
#include <random>
#include <sys/file.h>
#include <unistd.h>

namespace {

using namespace tests;

#ifdef TONEWRIGHT_SANITIZED
constexpr int64_t kMostGrowth = 1 << 17; // pages; sanitizers keep freed memory
#else
constexpr int64_t kMostGrowth = 1 << 10;
#endif

// Set by scripts/isolation.sh, which runs on a machine with nothing else to do.
int getNumber(const char* variable, int otherwise) {
    const char* number = std::getenv(variable);
    return number ? std::atoi(number) : otherwise;
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
            const std::vector<pid_t> children = listChildren();
            if (children.empty()) {
                std::this_thread::sleep_for(std::chrono::microseconds(200));
                continue;
            }
            std::this_thread::sleep_for(std::chrono::microseconds(random() % jobTime));
            for (const pid_t child : children) ::kill(child, SIGKILL);
            while (!m_stop && listChildren() == children) std::this_thread::yield();
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
    const int wanted = getNumber("TONEWRIGHT_TEST_KILLS", 15); // jobs of each kind that a kill has to hit
    const int mostJobs = wanted * 6;                           // of each kind
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
    std::printf("killed while decoding: %d, while encoding: %d\n", reading, writing);
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
    const auto killed = std::chrono::steady_clock::now();
    // Process 1 may take its time to remove the dead.
    EXPECT_TRUE(waitUntil([&] {
        const std::string state = readFile("/proc/" + std::to_string(slaves[0]) + "/stat");
        return state.find("(sonora2_slave) ") == std::string::npos ||
               state.find("(sonora2_slave) Z") != std::string::npos;
    }));
    const std::chrono::duration<double> time = std::chrono::steady_clock::now() - killed;
    RecordProperty("seconds", std::to_string(time.count()));
    EXPECT_LT(time.count(), getNumber("TONEWRIGHT_TEST_END_SECONDS", 20));
}

TEST_F(Boxed, ManyJobsRunAtOnce) {
    constexpr int kJobs = 16;
    std::vector<std::string> samples(kJobs), errors(kJobs);
    std::vector<std::thread> threads;
    for (size_t i = 0; i < kJobs; ++i)
        threads.emplace_back([&, i] {
            const std::string name = "job" + std::to_string(i) + ".faulty";
            errors[i] = i % 2 ? decode(name, &samples[i]) : encode(m_out / name);
        });
    for (std::thread& thread : threads) thread.join();
    for (size_t i = 0; i < kJobs; ++i) {
        EXPECT_EQ(errors[i], "") << i;
        EXPECT_TRUE(i % 2 == 0 || samples[i] == makeExpected()) << i;
    }
    EXPECT_EQ(countEntries(m_out.path()), size_t{kJobs} / 2);
    expectHealthy();
}

// Memory, descriptors and threads stay level.
TEST_F(Boxed, ManyJobsRunInARow) {
    const auto countPages = [] {
        std::istringstream fields(readFile("/proc/self/statm"));
        int64_t size = 0, resident = 0;
        fields >> size >> resident;
        return resident;
    };
    const int jobs = getNumber("TONEWRIGHT_TEST_JOBS", 25);
    m_frames = 3'000;
    const auto countThreads = [] { return countEntries("/proc/self/task"); };
    size_t descriptors = 0, threads = 0;
    int64_t pages = 0;
    for (int i = -10; i < jobs; ++i) { // caches fill first
        if (i == 0) descriptors = countDescriptors(), threads = countThreads(), pages = countPages();
        ASSERT_EQ(i % 2 ? decode("x.faulty") : encode(m_out / "x.faulty"), "") << i;
    }
    EXPECT_TRUE(waitUntil([&] { return countDescriptors() <= descriptors; }));
    EXPECT_TRUE(waitUntil([&] { return countThreads() <= threads; }));
    EXPECT_LT(countPages() - pages, kMostGrowth) << "memory grows";
    expectHealthy();
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
