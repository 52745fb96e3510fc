#include "peru/GlobalObjFactory.h"

#include "peru/threads/posix/MutexFactory.h"
#include "peru/threads/posix/ThreadManager.h"

#include <algorithm>
#include <atomic>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <new>

namespace peru {

// Holds the factory. It needs no dynamic initialisation and is never destroyed, so that its marks are valid
// even for code that runs before or after the static objects of this library exist.
struct SGlobalObjFactoryCell {
    static constexpr uint32_t kConstructed[2] = {0x3D92A405, 0x73DF5089};
    static constexpr uint32_t kDestroyed[2] = {0x4EA3B516, 0x84E0619A};

    CGlobalObjFactory* factory;
    std::atomic<uint32_t> constructed[2];
    std::atomic<uint32_t> destroyed[2];
    std::atomic<bool> claimed;

    static bool hasMark(const std::atomic<uint32_t> (&words)[2], const uint32_t (&mark)[2]) {
        return words[1].load(std::memory_order_acquire) == mark[1] &&
               words[0].load(std::memory_order_acquire) == mark[0];
    }
    static void setMark(std::atomic<uint32_t> (&words)[2], const uint32_t (&mark)[2]) {
        words[0].store(mark[0], std::memory_order_release);
        words[1].store(mark[1], std::memory_order_release);
    }
    bool isConstructed() const { return hasMark(constructed, kConstructed); }
    bool isDestroyed() const { return hasMark(destroyed, kDestroyed); }

    CGlobalObjFactory& access();
    void construct();
    static void destroyAtExit();
};

namespace {

constinit SGlobalObjFactoryCell g_cell{};

} // namespace

CGlobalObjFactory& SGlobalObjFactoryCell::access() {
    while (!isConstructed()) {
        if (isDestroyed()) {
            std::fputs("peru: a global object was requested after the end of the process\n", stderr);
            std::abort();
        }
        if (!claimed.exchange(true, std::memory_order_acq_rel)) {
            construct();
            break;
        }
        // A local manager: the shared one is itself a singleton of this factory.
        make<posix::CThreadManager>()->sleep(1);
    }
    return *factory;
}

void SGlobalObjFactoryCell::construct() {
    try {
        P<CGlobalObjFactory> made(new CGlobalObjFactory);
        if (std::atexit(destroyAtExit) != 0) throw std::bad_alloc();
        factory = made.detach();
    } catch (...) {
        // The next thread tries again.
        claimed.store(false, std::memory_order_release);
        throw;
    }
    setMark(constructed, kConstructed);
}

void SGlobalObjFactoryCell::destroyAtExit() {
    // The singletons are destroyed while the cell is still valid, since their destructors may use earlier
    // ones.
    g_cell.factory->clear();
    setMark(g_cell.destroyed, kDestroyed);
    setMark(g_cell.constructed, {0, 0});
    g_cell.factory->release();
}

CGlobalObjFactory::CGlobalObjFactory() : m_mutex(posix::createPlainMutex()) {}

CGlobalObjFactory::~CGlobalObjFactory() {
    clear();
}

P<CGlobalObjFactory> CGlobalObjFactory::instance() {
    return P<CGlobalObjFactory>::share(&g_cell.access());
}

void CGlobalObjFactory::shutdown() {
    // Without a factory there is nothing to destroy; this includes the time after the exit handler has run.
    if (g_cell.isConstructed()) instance()->clear();
}

CGlobalObjFactory::IPtrHolder* CGlobalObjFactory::find(const SKey& key) const {
    auto found = m_holders.find(&key);
    if (found != m_holders.end()) return found->second;
    auto dying = std::find_if(m_dying.begin(), m_dying.end(), [&](const SDying& each) {
        return each.entry.key == &key && each.thread == std::this_thread::get_id();
    });
    return dying == m_dying.end() ? nullptr : dying->entry.holder;
}

void CGlobalObjFactory::enter(const SKey& key, std::unique_ptr<IPtrHolder> holder) {
    m_creationOrder.push_back({&key, holder.get()});
    try {
        m_holders.emplace(&key, holder.get());
    } catch (...) {
        m_creationOrder.pop_back();
        throw;
    }
    static_cast<void>(holder.release());
}

void CGlobalObjFactory::clear() {
    for (;;) {
        SEntry last;
        {
            CMutexLock lock(m_mutex);
            if (m_creationOrder.empty()) break;
            last = m_creationOrder.back();
            m_dying.push_back({last, std::this_thread::get_id()});
            m_creationOrder.pop_back();
            m_holders.erase(last.key);
        }
        last.holder->destroy();
        CMutexLock lock(m_mutex);
        std::erase_if(m_dying, [&](const SDying& each) { return each.entry.holder == last.holder; });
    }
}

} // namespace peru
