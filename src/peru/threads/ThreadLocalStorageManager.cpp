#include "peru/threads/ThreadLocalStorageManager.h"

#include "peru/GlobalObjFactory.h"

#include <atomic>
#include <mutex>
#include <unordered_map>
#include <vector>

namespace peru {

namespace {

struct SThreadTable {
    std::unordered_map<uint64_t, P<IBase>> values;
    SThreadTable* previous = nullptr;
    SThreadTable* next = nullptr;
};

// These outlive the manager, since threads may end after it: nothing here is ever destroyed, and each
// thread's table is in that thread's own storage.
std::mutex g_mutex; // guards the list and the contents of all tables
SThreadTable* g_first = nullptr;
std::atomic<uint64_t> g_lastSlot{0};

void link(SThreadTable& table) {
    std::lock_guard lock(g_mutex);
    table.next = g_first;
    if (g_first) g_first->previous = &table;
    g_first = &table;
}

void unlink(SThreadTable& table) {
    std::lock_guard lock(g_mutex);
    (table.previous ? table.previous->next : g_first) = table.next;
    if (table.next) table.next->previous = table.previous;
}

void clear(SThreadTable& table) {
    // Destructors may set slots again; the rounds are limited so that this ends.
    for (int round = 0; round < 4; ++round) {
        std::unordered_map<uint64_t, P<IBase>> dying;
        std::lock_guard lock(g_mutex);
        if (table.values.empty()) return;
        dying.swap(table.values);
    }
}

// The thread's storage has been destroyed; the main thread's last destructors can still get here.
thread_local bool t_over = false;

struct SCurrentTable {
    SThreadTable table;
    SCurrentTable() { link(table); }
    ~SCurrentTable() {
        clear(table);
        t_over = true;
        unlink(table);
    }
};

SThreadTable* getTable() {
    if (t_over) return nullptr;
    thread_local SCurrentTable current;
    return &current.table;
}

} // namespace

CThreadLocalStorageManager::CThreadLocalStorageManager() = default;

CThreadLocalStorageManager::~CThreadLocalStorageManager() {
    std::vector<std::unordered_map<uint64_t, P<IBase>>> dying;
    std::lock_guard lock(g_mutex);
    for (SThreadTable* table = g_first; table; table = table->next) dying.emplace_back().swap(table->values);
}

uint64_t CThreadLocalStorageManager::createSlot() {
    return ++g_lastSlot;
}

void CThreadLocalStorageManager::removeSlot(uint64_t slot) {
    std::vector<P<IBase>> dying;
    std::lock_guard lock(g_mutex);
    for (SThreadTable* table = g_first; table; table = table->next) {
        auto found = table->values.find(slot);
        if (found == table->values.end()) continue;
        dying.push_back(std::move(found->second));
        table->values.erase(found);
    }
}

P<IBase> CThreadLocalStorageManager::get(uint64_t slot) const {
    SThreadTable* table = getTable();
    if (!table) return {};
    std::lock_guard lock(g_mutex);
    auto found = table->values.find(slot);
    return found != table->values.end() ? found->second : nullptr;
}

void CThreadLocalStorageManager::set(uint64_t slot, const P<IBase>& value) {
    SThreadTable* table = getTable();
    if (!table) return;
    P<IBase> previous;
    std::lock_guard lock(g_mutex);
    if (value) {
        P<IBase>& entry = table->values[slot];
        previous.swap(entry);
        entry = value;
    } else if (auto found = table->values.find(slot); found != table->values.end()) {
        previous.swap(found->second);
        table->values.erase(found);
    }
}

void CThreadLocalStorageManager::clearCurrentThread() noexcept {
    if (SThreadTable* table = getTable()) clear(*table);
}

P<CThreadLocalStorageManager> getThreadLocalStorageManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<CThreadLocalStorageManager>(
        key, [] { return make<CThreadLocalStorageManager>(); });
}

} // namespace peru
