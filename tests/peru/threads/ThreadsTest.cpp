#include "peru/Errors.h"
#include "peru/files/SystemCalls.h"
#include "peru/log/ILog.h"
#include "peru/log/LogBase.h"
#include "peru/system/ITimeManager.h"
#include "peru/threads/IMutex.h"
#include "peru/threads/ISignal.h"
#include "peru/threads/IThreadManager.h"
#include "peru/threads/ThreadLocalStorage.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cerrno>
#include <cstring>
#include <functional>
#include <sched.h>
#include <stdexcept>
#include <sys/resource.h>
#include <thread>
#include <unistd.h>

using namespace peru;
using tests::errorOf;
using namespace peru::literals;

namespace {

class CFunctionAction : public CObject, public IAction {
public:
    explicit CFunctionAction(std::function<void()> function) : m_function(std::move(function)) {}
    void run() override { m_function(); }

private:
    std::function<void()> m_function;
};

P<IThread> runThread(std::function<void()> function) {
    return getThreadManager()->createThread(P<IAction>(make<CFunctionAction>(std::move(function))));
}

// Counts its live instances.
class CWitness : public CObject {
public:
    explicit CWitness(std::atomic<int>& living) : m_living(living) { ++m_living; }
    ~CWitness() override { --m_living; }

private:
    std::atomic<int>& m_living;
};

TEST(Mutex, LockedTwice_NeedsTwoUnlocks) {
    P<IMutex> mutex = getMutexFactory()->createMutex();
    auto isFree = [&] {
        bool result = false;
        runThread([&] {
            result = mutex->tryLock();
            if (result) mutex->unlock();
        })->wait();
        return result;
    };
    mutex->lock();
    EXPECT_TRUE(mutex->tryLock());
    mutex->unlock();
    EXPECT_FALSE(isFree());
    mutex->unlock();
    EXPECT_TRUE(isFree());
}

TEST(Signal, IsManualReset) {
    P<ISignal> signal = getSignalFactory()->createSignal();
    EXPECT_FALSE(signal->wait(0));
    signal->set();
    signal->wait();
    EXPECT_TRUE(signal->wait(0)) << "a wait must not reset it";
    EXPECT_TRUE(signal->wait(1000));
    signal->reset();
    int64_t start = getTimeManager()->getMonotonicTime();
    EXPECT_FALSE(signal->wait(30));
    EXPECT_GE(getTimeManager()->getMonotonicTime() - start, 30 * 1000000);
}

// A reset must not take the signal back from threads that were waiting when it was set.
TEST(Signal, SetAndResetAtOnce_ReleasesEveryWaiter) {
    P<ISignal> signal = getSignalFactory()->createSignal();
    std::atomic<int> released{0};
    std::vector<pid_t> ids(2);
    std::atomic<size_t> started{0};
    const auto wait = [&](size_t index) {
        ids[index] = gettid();
        ++started;
        index == 0 ? signal->wait() : static_cast<void>(released += signal->wait(60000) ? 0 : 100);
        ++released;
    };
    std::vector<P<IThread>> waiters{runThread([&] { wait(0); }), runThread([&] { wait(1); })};
    while (started < 2) getThreadManager()->yield(true);
    const auto sleeps = [](pid_t id) {
        const std::string stat = tests::readFile("/proc/self/task/" + std::to_string(id) + "/stat");
        return stat.find(") S ") != std::string::npos;
    };
    while (!sleeps(ids[0]) || !sleeps(ids[1])) getThreadManager()->yield(true);
    signal->set();
    signal->reset();
    for (int i = 0; i < 20000 && released < 2; ++i) getThreadManager()->yield(true);
    EXPECT_EQ(released, 2);
    signal->set(); // lets a thread go that was missed
    for (const P<IThread>& waiter : waiters) waiter->wait();
}

TEST(Thread, Wait_ServesSeveralWaitersAndTheLateOne) {
    P<ISignal> go = getSignalFactory()->createSignal();
    std::atomic<bool> done{false};
    P<IThread> thread = runThread([&] {
        go->wait();
        done = true;
    });
    const auto waitToo = [&] {
        thread->wait();
        EXPECT_TRUE(done);
    };
    P<IThread> one = runThread(waitToo), two = runThread(waitToo);
    go->set();
    one->wait();
    two->wait();
    thread->wait();
}

TEST(Thread, DroppedHandle_DoesNotStopItAndActionLives) {
    P<ISignal> go = getSignalFactory()->createSignal(), done = getSignalFactory()->createSignal();
    std::atomic<int> living{0};
    {
        auto witness = make<CWitness>(living);
        runThread([witness, go, done] {
            go->wait();
            done->set();
        });
    }
    EXPECT_EQ(living, 1);
    go->set();
    EXPECT_TRUE(done->wait(20000));
    while (living != 0) getThreadManager()->yield(true); // the last reference is released after `done` is set
    runThread([witness = make<CWitness>(living)] {})->wait();
    EXPECT_EQ(living, 0) << "an ended thread holds nothing";
}

// The owner is released last by its own thread, and its destructor waits for that thread.
TEST(Thread, WaitingForItself_ReturnsAfterTheBodyAndThrowsWithin) {
    struct COwner : CObject {
        explicit COwner(P<ISignal> signal) : gone(std::move(signal)) {}
        ~COwner() override {
            thread->wait();
            gone->set();
        }
        P<IThread> thread;
        const P<ISignal> gone;
    };
    P<ISignal> go = getSignalFactory()->createSignal(), gone = getSignalFactory()->createSignal();
    auto owner = make<COwner>(gone);
    SThreadBody body;
    body.owner = PFrail<IBase>(owner.get(), true);
    body.argument = go.get();
    body.function = [](IBase*, void* argument) {
        static_cast<ISignal*>(argument)->wait();
        EXPECT_THROW(getThreadManager()->getCurrentThread()->wait(), CInvalidObjectStateError);
    };
    owner->thread = getThreadManager()->createThread(body);
    owner.reset();
    body.owner = {};
    go->set();
    EXPECT_TRUE(gone->wait(20000));
}

TEST(Thread, ForeignThread_HasAnObjectThatEndsWithIt) {
    P<IThread> foreign;
    std::thread([&] {
        foreign = getThreadManager()->getCurrentThread();
        EXPECT_TRUE(foreign == getThreadManager()->getCurrentThread());
    }).join();
    foreign->wait();
    EXPECT_NO_THROW(foreign->setPriority(1)) << "its id may belong to another thread by now";
    EXPECT_THROW(foreign->setPriority(7), CError);
    EXPECT_THROW(getThreadManager()->createThread(SThreadBody()), CInvalidArgError);
}

TEST(Thread, Priority_LowersThisThreadOnly) {
    const int before = getpriority(PRIO_PROCESS, 0);
    runThread([] {
        P<IThread> self = getThreadManager()->getCurrentThread();
        auto id = static_cast<id_t>(gettid());
        self->setPriority(3);
        self->setPriority(2);
        self->setPriority(2); // setting the same step twice is harmless
        EXPECT_GE(getpriority(PRIO_PROCESS, id), 5);
        self->setPriority(1);
        EXPECT_EQ(sched_getscheduler(gettid()), SCHED_BATCH);
        self->setPriority(0);
        EXPECT_EQ(sched_getscheduler(gettid()), SCHED_IDLE);
        // Whether raising is permitted depends on the user; it is not an error either way.
        for (int step : {6, 3}) EXPECT_NO_THROW(self->setPriority(step)) << step;
        for (int step : {-1, 7}) EXPECT_THROW(self->setPriority(step), CError) << step;
    })->wait();
    EXPECT_EQ(getpriority(PRIO_PROCESS, 0), before);
}

TEST(Thread, PriorityRightAfterStart_ReachesTheThread) {
    P<ISignal> go = getSignalFactory()->createSignal();
    P<IThread> inside;
    P<IThread> thread = runThread([&] {
        go->wait();
        EXPECT_EQ(sched_getscheduler(0), SCHED_BATCH);
        inside = getThreadManager()->getCurrentThread();
    });
    thread->setPriority(1);
    go->set();
    thread->wait();
    EXPECT_TRUE(inside == thread);
}

TEST(Thread, EscapedException_IsLoggedAndEndsTheThreadOnly) {
    class CMessages : public CLogBase {
    public:
        void enterArea(const P<IString>&) override {}
        void leaveArea(const P<IString>&) override {}
        void write(const SLogMessage& message) override {
            texts.push_back(CString::toStdString(message.text));
        }
        std::vector<std::string> texts;
    };
    auto log = make<CMessages>();
    getLogManager()->addLog(log, nullptr);
    runThread([] { throw CError("no decoder", "Trouble"); })->wait();
    runThread([] { throw std::runtime_error("plain"); })->wait();
    runThread([] { throw 1; })->wait();
    getLogManager()->removeLog(log, nullptr);
    EXPECT_EQ(log->texts,
              (std::vector<std::string>{"Type: Trouble\nText: no decoder", "Type: Error\nText: plain",
                                        "Type: Error\nText: Unspecified error"}));
}

#ifndef TONEWRIGHT_SANITIZED // the sanitizers create the threads
TEST(Thread, FailedStart_ThrowsAndLeaksNothing) {
    std::atomic<int> living{0};
    for (const int error : {EAGAIN, EPERM}) {
        const tests::CSystemCalls watch(
            [error](const std::string& call, int) { return call == "pthread_create" ? error : 0; });
        auto witness = make<CWitness>(living);
        EXPECT_EQ(errorOf<CError>([&] { runThread([witness] { FAIL(); }); }),
                  "Error creating thread (" + std::string(std::strerror(error)) + ").");
    }
    EXPECT_EQ(living, 0);
}

TEST(Thread, DroppedHandles_LeaveNoStacks) {
    const auto countPages = [] { return std::stoll(tests::readFile("/proc/self/statm")); };
    const long long before = countPages();
    constexpr int kThreads = 1000;
    for (int i = 0; i < kThreads; ++i) {
        P<ISignal> done = getSignalFactory()->createSignal();
        runThread([done] { done->set(); });
        done->wait();
    }
    EXPECT_LT(countPages() - before, kThreads * 256) << "half of the smallest default size";
}
#endif

TEST(ThreadLocalStorage, EachThread_HasAValueThatDiesWithIt) {
    std::atomic<int> living{0};
    auto slot = make<CThreadLocalStorage>();
    slot->set(make<CWitness>(living));
    auto use = [&] {
        EXPECT_FALSE(slot->get());
        slot->set(make<CWitness>(living));
        slot->set(make<CWitness>(living)); // releases the first
        EXPECT_EQ(living, 2);
        EXPECT_TRUE(slot->get());
    };
    runThread(use)->wait();
    EXPECT_EQ(living, 1);
    std::thread(use).join(); // a thread that this library did not create
    EXPECT_EQ(living, 1);
    slot->set(nullptr);
    EXPECT_EQ(living, 0);
}

TEST(ThreadLocalStorage, SimpleSlot_HoldsAPointerForEachThread) {
    const P<ISimpleThreadLocalStorage> slot = getSimpleThreadLocalStorageFactory()->createStorage();
    int here = 0;
    slot->set(&here);
    runThread([&] { EXPECT_EQ(slot->get(), nullptr); })->wait();
    EXPECT_EQ(slot->get(), &here);
}

TEST(ThreadLocalStorage, DyingSlot_ReleasesTheValuesOfAllThreads) {
    std::atomic<int> living{0};
    auto slot = make<CThreadLocalStorage>(), other = make<CThreadLocalStorage>();
    P<ISignal> ready = getSignalFactory()->createSignal(), end = getSignalFactory()->createSignal();
    P<IThread> thread = runThread([&, raw = slot.get()] {
        raw->set(make<CWitness>(living));
        other->set(make<CWitness>(living));
        ready->set();
        end->wait();
        EXPECT_TRUE(other->get());
    });
    ready->wait();
    slot.reset();
    EXPECT_EQ(living, 1);
    end->set();
    thread->wait();
    EXPECT_EQ(living, 0);
}

// A value whose destructor sets a slot while its thread ends.
TEST(ThreadLocalStorage, ValueThatSetsSlotsWhileDying_LeavesNothing) {
    static std::atomic<int> living{0};
    struct CLastWord : CObject {
        explicit CLastWord(P<CThreadLocalStorage> storage) : slot(std::move(storage)) {}
        ~CLastWord() override { slot->set(make<CWitness>(living)); }
        const P<CThreadLocalStorage> slot;
    };
    auto first = make<CThreadLocalStorage>(), second = make<CThreadLocalStorage>();
    auto use = [&] { first->set(make<CLastWord>(second)); };
    runThread(use)->wait();
    EXPECT_EQ(living, 0);
    std::thread(use).join();
    EXPECT_EQ(living, 0);
}

} // namespace
