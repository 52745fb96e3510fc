#include "peru/GlobalObjFactory.h"
#include "peru/Errors.h"
#include "peru/Pinned.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <fstream>
#include <functional>
#include <iterator>
#include <string>
#include <thread>
#include <unistd.h>
#include <vector>

namespace peru {

namespace {

std::string g_deaths;

class CSingle : public CObject {
public:
    explicit CSingle(char name) : m_name(name) {}
    ~CSingle() override {
        if (m_atEnd) m_atEnd();
        g_deaths += m_name;
    }
    std::function<void()> m_atEnd;

private:
    char m_name;
};

// Singletons named by a letter, with accessors like those of the subsystems.
std::atomic<int> g_made{0};

template <char name> P<CSingle> createSingle() {
    ++g_made;
    return make<CSingle>(name);
}

template <char name, P<CSingle> (*create)() = createSingle<name>> P<CSingle> getSingle() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<CSingle>(key, create);
}

// shutdown() also destroys the other singletons of the process; they are created again on demand.
class GlobalObjFactory : public testing::Test {
protected:
    void SetUp() override {
        CGlobalObjFactory::shutdown();
        g_deaths.clear();
        g_made = 0;
    }
    void TearDown() override { CGlobalObjFactory::shutdown(); }
};

P<CSingle> createDemanding() {
    getSingle<'a'>();
    getSingle<'b'>();
    return createSingle<'d'>();
}

bool g_fail = false;

P<CSingle> createFailing() {
    getSingle<'a'>();
    if (g_fail) throw CError("no such device");
    return createSingle<'f'>();
}

} // namespace

TEST_F(GlobalObjFactory, DestroysInReverseOrderOfCompletion) {
    getSingle<'c'>();
    getSingle<'d', createDemanding>();
    getSingle<'c'>();
    getSingle<'e'>();
    CGlobalObjFactory::shutdown();
    EXPECT_EQ(g_deaths, "edbac");
}

TEST_F(GlobalObjFactory, StartsAgainAfterShutdown) {
    getSingle<'a'>();
    P<CSingle> kept = getSingle<'b'>();
    CGlobalObjFactory::shutdown();
    EXPECT_EQ(g_deaths, "a");
    EXPECT_NE(getSingle<'b'>(), kept);
    CGlobalObjFactory::shutdown();
    EXPECT_EQ(g_deaths, "ab");
}

TEST_F(GlobalObjFactory, EntersNothingWhenCreationThrows) {
    g_fail = true;
    for (int i = 0; i < 2; ++i) EXPECT_THROW((getSingle<'f', createFailing>()), CError);
    // The mutex was released.
    std::thread([] { getSingle<'b'>(); }).join();
    g_fail = false;
    P<CSingle> made = getSingle<'f', createFailing>();
    EXPECT_EQ(made, (getSingle<'f', createFailing>()));
    made.reset();
    CGlobalObjFactory::shutdown();
    EXPECT_EQ(g_deaths, "fba");
}

TEST_F(GlobalObjFactory, GivesADyingSingletonItself) {
    CSingle* self = getSingle<'s'>().get();
    self->m_atEnd = [=] { EXPECT_EQ(getSingle<'s'>().get(), self); };
    CGlobalObjFactory::shutdown();
    EXPECT_EQ(g_deaths, "s");
    EXPECT_EQ(g_made, 1);
}

TEST_F(GlobalObjFactory, LetsADyingSingletonWaitForAThreadThatNeedsOthers) {
    getSingle<'a'>();
    getSingle<'w'>()->m_atEnd = [] {
        std::thread([] {
            getSingle<'a'>();
            getSingle<'n'>();
        }).join();
    };
    CGlobalObjFactory::shutdown();
    EXPECT_EQ(g_deaths, "wna");
}

// A pinned singleton.
const P<CSingle>& getPinned() {
    static const CGlobalObjFactory::SKey key;
    static constinit TPinned<CSingle> pinned;
    return pinned.get(key, createSingle<'p'>);
}

// True if the thread of this process is blocked.
bool isBlocked(pid_t thread) {
    std::ifstream file("/proc/self/task/" + std::to_string(thread) + "/stat");
    const std::string text((std::istreambuf_iterator<char>(file)), {});
    return text.size() > text.rfind(')') + 2 && text[text.rfind(')') + 2] == 'S';
}

std::thread g_rival;

// Requests the pinned singleton while a second thread, which requested it first, waits for the factory.
P<CSingle> createWithRival() {
    std::atomic<pid_t> id{0};
    g_rival = std::thread([&id] {
        id = ::gettid();
        getPinned();
    });
    while (id == 0 || !isBlocked(id)) std::this_thread::yield();
    getPinned();
    return createSingle<'r'>();
}

TEST_F(GlobalObjFactory, PinsForSeveralThreadsAtOnce) {
    getSingle<'r', createWithRival>();
    g_rival.join();
    EXPECT_EQ(g_made, 2);
    CGlobalObjFactory::shutdown();
    EXPECT_EQ(g_deaths, "r") << "what is pinned stays";
    EXPECT_EQ(getPinned(), getPinned());
}

// In a process of its own, so that the threads also race for the factory.
TEST_F(GlobalObjFactory, MakesOneObjectForAllThreads) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    auto race = [] {
        std::atomic<int> waiting{8};
        std::vector<P<CSingle>> found(8);
        std::vector<std::thread> threads;
        for (P<CSingle>& place : found)
            threads.emplace_back([&] {
                for (--waiting; waiting > 0;) std::this_thread::yield();
                place = getSingle<'a'>();
            });
        for (std::thread& thread : threads) thread.join();
        bool same = g_made == 1;
        for (const P<CSingle>& each : found) same = same && each == found[0];
        std::exit(same ? 0 : 1);
    };
    EXPECT_EXIT(race(), testing::ExitedWithCode(0), "");
}

TEST_F(GlobalObjFactory, DestroysAtProcessEndAndThenStopsTheProgram) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_DEATH(
        {
            // Exit handlers run in reverse order; the factory registers its own on the first access.
            std::atexit([] { getSingle<'b'>(); });
            std::atexit([] { std::fprintf(stderr, "dead: %s\n", g_deaths.c_str()); });
            getSingle<'a'>();
            std::exit(0);
        },
        "dead: a\nperu: a global object was asked for after the end");
}

} // namespace peru
