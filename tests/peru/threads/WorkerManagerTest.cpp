#include "peru/threads/WorkerManager.h"
#include "peru/system/ITimeManager.h"

#include <gtest/gtest.h>

#include <functional>
#include <string>

using namespace peru;

namespace {

using Journal = std::string;

struct CWorker : CObject, IWorker {
    CWorker(char n, Journal& j) : name(n), journal(j) {}
    void work() override {
        journal += name;
        if (onWork) onWork();
    }
    void attached(IWorkerManager*) override { journal += std::string("+") + name; }
    void detached(IWorkerManager* manager) override {
        journal += std::string("-") + name;
        if (onDetached) onDetached(manager);
    }
    const char name;
    Journal& journal;
    std::function<void()> onWork;
    std::function<void(IWorkerManager*)> onDetached;
};

struct CListener : CObject, IWorkLoopListener {
    CListener(char n, Journal& j) : name(n), journal(j) {}
    void workersChanged(IWorkerManager* manager) override {
        journal += name;
        if (leaves) manager->removeListener(this);
    }
    const char name;
    Journal& journal;
    bool leaves = false;
};

class WorkerManager : public testing::Test {
protected:
    WorkerManager() {
        for (const P<CWorker>& worker : {a, b, c}) manager->addWorker(worker.get());
        journal.clear();
    }
    Journal work() {
        journal.clear();
        manager->work();
        return journal;
    }
    Journal journal;
    P<CWorker> a = make<CWorker>('a', journal), b = make<CWorker>('b', journal),
               c = make<CWorker>('c', journal);
    P<CWorkerManager> manager = make<CWorkerManager>();
};

TEST_F(WorkerManager, Work_GoesFromLastToFirstAndStampsTheSlice) {
    int64_t before = getTimeManager()->getTime();
    EXPECT_EQ(work(), "cba");
    EXPECT_GE(manager->getSliceTime(), before);
}

TEST_F(WorkerManager, RemovalDuringWork_SkipsNobodyWhoIsStillThere) {
    c->onWork = [&] { manager->removeWorker(c.get()); };
    EXPECT_EQ(work(), "c-cba") << "itself, the last";
    EXPECT_EQ(work(), "ba");
    manager->addWorker(c.get());
    b->onWork = [&] { manager->removeWorker(a.get()); };
    c->onWork = nullptr;
    EXPECT_EQ(work(), "cb-ab") << "one that would have come later; the walk goes by index";
    c->onWork = [&] {
        for (const P<CWorker>& worker : {b, c}) manager->removeWorker(worker.get());
    };
    EXPECT_EQ(work(), "c-b-c") << "all at once";
}

TEST_F(WorkerManager, AddedDuringWork_RunsFromTheNextSlice) {
    auto d = make<CWorker>('d', journal);
    b->onWork = [&] {
        manager->addWorker(d.get());
        b->onWork = nullptr;
    };
    EXPECT_EQ(work(), "cb+da");
    EXPECT_EQ(work(), "dcba");
    manager->removeWorker(d.get());
}

TEST_F(WorkerManager, Listeners_AreToldBetweenEntryAndAttached) {
    auto first = make<CListener>('1', journal), second = make<CListener>('2', journal);
    auto d = make<CWorker>('d', journal);
    manager->addListener(first.get());
    manager->addListener(second.get());
    manager->addWorker(d.get());
    EXPECT_EQ(journal, "21+d");
    journal.clear();
    second->leaves = true;
    EXPECT_TRUE(manager->removeWorker(d.get()));
    EXPECT_EQ(journal, "-d21");
    journal.clear();
    EXPECT_FALSE(manager->removeWorker(d.get()));
    EXPECT_EQ(journal, "") << "nothing changed";
    EXPECT_FALSE(manager->removeListener(second.get()));
    EXPECT_TRUE(manager->removeListener(first.get()));
}

TEST_F(WorkerManager, Destruction_DetachesLastFirst) {
    // A worker that removes itself in detached() is not called twice.
    b->onDetached = [&](IWorkerManager* dying) { EXPECT_FALSE(dying->removeWorker(b.get())); };
    manager.reset();
    EXPECT_EQ(journal, "-c-b-a");
}

} // namespace
