#include "peru/GlobalObjFactory.h"
#include "peru/Errors.h"
#include "peru/Pinned.h"
#include "peru/Rival.h"

#include <gtest/gtest.h>

#include <optional>

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

TEST_F(GlobalObjFactory, DestroysInReverseOrderOfCompletionAndStartsAgain) {
    getSingle<'c'>();
    getSingle<'d', createDemanding>();
    getSingle<'c'>();
    P<CSingle> kept = getSingle<'e'>();
    CGlobalObjFactory::shutdown();
    EXPECT_EQ(g_deaths, "dbac");
    EXPECT_NE(getSingle<'e'>(), kept);
    CGlobalObjFactory::shutdown();
    EXPECT_EQ(g_deaths, "dbace");
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

// While it is destroyed, a singleton may use itself and wait for threads that need others.
TEST_F(GlobalObjFactory, ServesADyingSingleton) {
    getSingle<'a'>();
    CSingle* self = getSingle<'w'>().get();
    self->m_atEnd = [=] {
        EXPECT_EQ(getSingle<'w'>().get(), self);
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

std::optional<tests::CRivals> g_rivals;

// Requests the pinned singleton while a second thread, which requested it first, waits for the factory.
P<CSingle> createWithRival() {
    g_rivals.emplace().expectBlocked({[] { getPinned(); }});
    getPinned();
    return createSingle<'r'>();
}

TEST_F(GlobalObjFactory, PinsForSeveralThreadsAtOnce) {
    getSingle<'r', createWithRival>();
    g_rivals.reset();
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
        "dead: a\nperu: a global object was requested after the end");
}

} // namespace peru
