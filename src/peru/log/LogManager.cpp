#include "peru/log/LogManager.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"

#include <algorithm>
#include <exception>

namespace peru {

// Reference-counted, so that a sink may remove the list of its source while it is called. A sink that leaves
// during a walk leaves an empty handle in its place, so that no other one moves and is skipped.
class CLogManager::CLogList : public CObject {
public:
    void add(const P<ILog>& log) { m_logs.push_back(log); }
    bool remove(const P<ILog>& log) {
        auto found = std::find(m_logs.begin(), m_logs.end(), log);
        if (found == m_logs.end()) return false;
        found->reset();
        if (m_walks == 0) compact();
        return true;
    }
    bool isEmpty() const {
        return std::all_of(m_logs.begin(), m_logs.end(), [](const P<ILog>& log) { return !log; });
    }

    // Calls the sinks that are registered now, until one throws.
    template <class F> void forEach(F function) {
        const CWalk walk(*this);
        const size_t count = m_logs.size();
        for (size_t i = 0; i < count; ++i)
            if (const P<ILog> log = m_logs[i]) function(*log);
    }

private:
    class CWalk {
    public:
        explicit CWalk(CLogList& list) : m_list(list) { ++m_list.m_walks; }
        ~CWalk() {
            if (--m_list.m_walks == 0) m_list.compact();
        }
        CWalk(const CWalk&) = delete;
        CWalk& operator=(const CWalk&) = delete;

    private:
        CLogList& m_list;
    };

    void compact() { std::erase(m_logs, nullptr); }

    std::vector<P<ILog>> m_logs;
    int32_t m_walks = 0; // nested when a sink logs
};

namespace {

// By bytes: a name that cannot be decoded is a name.
bool isEverySource(const P<IString>& source) {
    return !source || source->getDataSize() == 0;
}

} // namespace

CLogManager::CLogManager() : m_mutex(getMutexFactory()->createMutex()), m_logs(make<CLogList>()) {}

CLogManager::~CLogManager() = default;

void CLogManager::enterArea(const P<IString>& name) {
    if (!isWanted(kLogTrace)) return;
    CMutexLock lock(m_mutex);
    m_areas.push_back(name ? name : CString::empty());
    std::vector<P<ILog>> entered;
    try {
        m_logs->forEach([&](ILog& log) {
            log.enterArea(name);
            entered.push_back(P<ILog>::share(&log));
        });
    } catch (...) {
        // The caller does not leave an area whose entry threw, so the sinks that have entered it leave now.
        takeArea(name);
        for (const P<ILog>& log : entered) {
            try {
                log->leaveArea(name);
            } catch (...) {
                zvrTrace(__FILE__, __LINE__, "a log failed to leave an area");
            }
        }
        throw;
    }
}

void CLogManager::leaveArea(const P<IString>& name) {
    CMutexLock lock(m_mutex);
    if (!takeArea(name)) return;
    // All sinks have entered, so all of them leave before an error ends the call.
    std::exception_ptr failure;
    m_logs->forEach([&](ILog& log) {
        try {
            log.leaveArea(name);
        } catch (...) {
            if (!failure) failure = std::current_exception();
        }
    });
    if (failure) std::rethrow_exception(failure);
}

bool CLogManager::takeArea(const P<IString>& name) {
    auto found = std::find_if(m_areas.rbegin(), m_areas.rend(),
                              [&](const P<IString>& area) { return area->equals(name); });
    if (found == m_areas.rend()) return false;
    m_areas.erase(std::next(found).base());
    return true;
}

void CLogManager::write(const SLogMessage& message) {
    if (!isWanted(message.level)) return;
    CMutexLock lock(m_mutex);
    auto call = [&](ILog& log) { log.write(message); };
    if (!isEverySource(message.source)) {
        if (const P<CLogList>* found = m_logsBySource.find(*message.source)) {
            const P<CLogList> logs = *found;
            logs->forEach(call);
        }
    }
    m_logs->forEach(call);
}

void CLogManager::addLog(const P<ILog>& log, const P<IString>& source) {
    if (!log || log == P<ILog>::share(this)) throw CInvalidArgError("log", "addLog", P<IBase>::share(this));
    CMutexLock lock(m_mutex);
    if (isEverySource(source)) {
        m_logs->add(log);
        return;
    }
    P<CLogList>* known = m_logsBySource.find(*source);
    const P<CLogList> logs = known ? *known : m_logsBySource.set(source, make<CLogList>());
    logs->add(log);
}

bool CLogManager::removeLog(const P<ILog>& log, const P<IString>& source) {
    CMutexLock lock(m_mutex);
    if (isEverySource(source)) return m_logs->remove(log);
    const P<CLogList>* found = m_logsBySource.find(*source);
    if (!found || !(*found)->remove(log)) return false;
    if ((*found)->isEmpty()) m_logsBySource.remove(*source);
    return true;
}

size_t CLogManager::getSourceCount() const {
    CMutexLock lock(m_mutex);
    return m_logsBySource.getCount();
}

P<ILogManager> getLogManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<ILogManager>(key, [] { return P<ILogManager>(make<CLogManager>()); });
}

} // namespace peru
