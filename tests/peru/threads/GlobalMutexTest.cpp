#include "peru/threads/IMutex.h"
#include "peru/threads/IThreadManager.h"
#include "support/Environment.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <functional>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

using namespace peru;
using tests::errorOf;

namespace {

class GlobalMutex : public testing::Test {
protected:
    ~GlobalMutex() override {
        umask(m_mask);
        EXPECT_EQ(files().size(), m_left) << "the last user removes the file";
        for (const auto& file : files()) std::filesystem::remove(file);
    }

    // Every test has names of its own.
    static std::string unique(const std::string& name) {
        return testing::UnitTest::GetInstance()->current_test_info()->name() + std::to_string(s_id) + name;
    }
    static P<IMutex> open(const std::string& name) {
        return getMutexFactory()->createGlobalMutex(CString::fromUTF8(unique(name)));
    }
    std::vector<std::filesystem::path> files() const {
        std::vector<std::filesystem::path> result;
        for (const auto& entry : std::filesystem::directory_iterator("/dev/shm"))
            if (entry.path().string().find(m_prefix) != std::string::npos) result.push_back(entry.path());
        return result;
    }
    // Runs `function` in a child process that ends without clean-up; returns the wait status.
    template <class F> static int runChild(F function) {
        pid_t id = startChild(function);
        int status = 0;
        waitpid(id, &status, 0);
        return status;
    }
    template <class F> static pid_t startChild(F function) {
        pid_t id = fork();
        if (id == 0) {
            function();
            _exit(0);
        }
        return id;
    }

    static bool isFreeElsewhere(const char* name) {
        return runChild([name] { _exit(open(name)->tryLock() ? 0 : 1); }) == 0;
    }

    static inline const pid_t s_id = getpid(); // of the parent
    const std::string m_prefix = unique("");
    const mode_t m_mask = umask(0077);
    tests::CTempFolder m_folder;
    size_t m_left = 0;
};

TEST_F(GlobalMutex, ExcludesProcessesWithAnotherEnvironment) {
    P<IMutex> mutex = open("environment");
    mutex->lock();
    for (const char* folder : {"/", m_folder.path().c_str(), ""}) {
        const tests::CEnvironment environment("XDG_RUNTIME_DIR", *folder ? folder : nullptr);
        EXPECT_FALSE(isFreeElsewhere("environment")) << folder;
    }
    mutex->unlock();
}

TEST_F(GlobalMutex, AbandonedByDeadProcessOrThread_NextOwnerGetsItWithoutError) {
    P<IMutex> mutex = open("abandoned");
    for (int round = 0; round < 3; ++round) {
        int status = runChild([] {
            P<IMutex> theirs = open("abandoned");
            theirs->lock();
            theirs->lock();
            raise(SIGKILL);
        });
        ASSERT_TRUE(WIFSIGNALED(status));
        if (round == 2)
            ASSERT_TRUE(mutex->tryLock());
        else
            mutex->lock();
        // One unlock releases it: the dead owner's lock count is not inherited.
        mutex->unlock();
        EXPECT_TRUE(isFreeElsewhere("abandoned"));
    }
    std::thread([&] { mutex->lock(); }).join();
    EXPECT_TRUE(mutex->tryLock());
    mutex->unlock();
}

TEST_F(GlobalMutex, SeveralProcesses_LoseNoIncrement) {
    constexpr int kRounds = 3000, kProcesses = 3;
    void* memory = mmap(nullptr, sizeof(int), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    ASSERT_NE(memory, MAP_FAILED);
    auto* counter = static_cast<volatile int*>(memory);
    // The children create the segment themselves, all at the same time.
    std::vector<pid_t> children;
    for (int i = 0; i < kProcesses; ++i)
        children.push_back(startChild([&] {
            for (int k = 0; k < kRounds; ++k) {
                CMutexLock lock(open("counter"));
                *counter = *counter + 1;
            }
        }));
    for (pid_t child : children) {
        int status = -1;
        waitpid(child, &status, 0);
        EXPECT_EQ(status, 0);
    }
    EXPECT_EQ(*counter, kRounds * kProcesses);
    munmap(memory, sizeof(int));
}

TEST_F(GlobalMutex, IsReentrantAlsoThroughASecondHandle) {
    P<IMutex> one = open("twice"), two = open("twice");
    one->lock();
    two->lock();
    one->unlock();
    one.reset();
    EXPECT_FALSE(isFreeElsewhere("twice"));
    two->unlock();
    EXPECT_TRUE(isFreeElsewhere("twice"));
}

TEST_F(GlobalMutex, LastHandleDroppedWhileLocked_StaysLockedUntilTheThreadEnds) {
    m_left = 1; // it is still mapped
    std::thread([] {
        open("dropped")->lock();
        EXPECT_FALSE(isFreeElsewhere("dropped"));
    }).join();
    EXPECT_TRUE(isFreeElsewhere("dropped"));
}

TEST_F(GlobalMutex, AnyText_IsANameOfItsOwn) {
    std::string longName(5000, 'x');
    const std::string names[] = {
        "",    ".",        "..",   "../../etc/passwd", "a/b",          "a%2fb",  "a b",
        "A b", "\xc3\xa4", "a\nb", longName + "1",     longName + "2", longName, longName + "12",
    };
    std::vector<P<IMutex>> held;
    for (const std::string& name : names) {
        held.push_back(open(name));
        held.back()->lock();
    }
    EXPECT_EQ(files().size(), std::size(names));
    for (const P<IMutex>& mutex : held) mutex->unlock();
}

TEST_F(GlobalMutex, Segment_IsPrivateAndStaysForTheOtherUsers) {
    umask(0);
    P<IMutex> mutex = open("private");
    ASSERT_TRUE(isFreeElsewhere("private")); // this user ends first and leaves the file
    ASSERT_EQ(files().size(), 1u);
    struct stat status;
    ASSERT_EQ(stat(files()[0].c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0600u);
    EXPECT_EQ(status.st_uid, geteuid());
}

// Left behind by a process that died during initialisation, or from before a reboot.
TEST_F(GlobalMutex, HalfMadeSegment_IsMadeAnew) {
    P<IMutex> made = open("half");
    std::filesystem::path file = files().at(0);
    const std::string ready = tests::readFile(file);
    made.reset();
    std::string noStamp = ready, otherRun = ready;
    noStamp.replace(0, 4, 4, '\0');
    otherRun[10] ^= 1;                                                  // within the boot id
    otherRun.replace(48, ready.size() - 48, ready.size() - 48, '\x7f'); // an owner that no longer exists
    for (const std::string& bytes : {std::string(), ready.substr(0, 20), noStamp, otherRun}) {
        std::ofstream(file, std::ios::binary | std::ios::trunc) << bytes;
        P<IMutex> mutex = open("half");
        EXPECT_TRUE(mutex->tryLock());
        mutex->unlock();
    }
}

TEST_F(GlobalMutex, WhatIsNotTheUsersOwnFile_IsRefused) {
    P<IMutex> made = open("refused");
    std::filesystem::path file = files().at(0);
    made.reset();
    const std::string message = "Error createing global mutex " + unique("refused");
    const std::function<void()> obstacles[] = {
        [&] { ::close(::creat(file.c_str(), 0666)), ::chmod(file.c_str(), 0666); },
        [&] { std::filesystem::create_symlink(m_folder.write("elsewhere", ""), file); },
        [&] { std::filesystem::create_directory(file); },
        [&] { ASSERT_EQ(mkfifo(file.c_str(), 0600), 0); },
    };
    for (const auto& put : obstacles) {
        put();
        EXPECT_EQ(errorOf([] { open("refused"); }), message);
        std::filesystem::remove(file);
    }
    EXPECT_NO_THROW(open("refused"));
}

} // namespace
