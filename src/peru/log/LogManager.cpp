#include "peru/log/LogManager.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"

#include <algorithm>

namespace peru {

// Reference-counted, so that a sink may change the lists while it is called.
class CLogManager::CLogList : public CObject {
public:
    void add(const P<ILog>& log) { m_logs.push_back(log); }
    bool remove(const P<ILog>& log) {
        auto found = std::find(m_logs.begin(), m_logs.end(), log);
        if (found == m_logs.end()) return false;
        m_logs.erase(found);
        return true;
    }
    bool isEmpty() const { return m_logs.empty(); }

    template <class F> void forEach(F function) const {
        for (size_t i = 0; i < m_logs.size(); ++i) {
            P<ILog> log = m_logs[i];
            function(*log);
        }
    }

private:
    std::vector<P<ILog>> m_logs;
};

CLogManager::CLogManager() : m_mutex(getMutexFactory()->createMutex()), m_logs(make<CLogList>()) {}

CLogManager::~CLogManager() = default;

void CLogManager::enterArea(const P<IString>& name) {
    if (!isWanted(kLogTrace)) return;
    CMutexLock lock(m_mutex);
    m_areas.push_back(name ? name : CString::empty());
    m_logs->forEach([&](ILog& log) { log.enterArea(name); });
}

void CLogManager::leaveArea(const P<IString>& name) {
    CMutexLock lock(m_mutex);
    auto found = std::find_if(m_areas.rbegin(), m_areas.rend(),
                              [&](const P<IString>& area) { return area->equals(name); });
    if (found == m_areas.rend()) return;
    m_areas.erase(std::next(found).base());
    m_logs->forEach([&](ILog& log) { log.leaveArea(name); });
}

void CLogManager::write(const SLogMessage& message) {
    if (!isWanted(message.level)) return;
    CMutexLock lock(m_mutex);
    auto call = [&](ILog& log) { log.write(message); };
    if (message.source && !message.source->isEmpty()) {
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
    if (!source || source->isEmpty()) {
        m_logs->add(log);
        return;
    }
    P<CLogList>* known = m_logsBySource.find(*source);
    const P<CLogList> logs = known ? *known : m_logsBySource.set(source, make<CLogList>());
    logs->add(log);
}

bool CLogManager::removeLog(const P<ILog>& log, const P<IString>& source) {
    CMutexLock lock(m_mutex);
    if (!source || source->isEmpty()) return m_logs->remove(log);
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
