// Distributes the program's messages to the sinks.
#pragma once

#include "peru/collections/SimpleHashTable.h"
#include "peru/log/LogBase.h"
#include "peru/threads/IMutex.h"

#include <vector>

namespace peru {

// Holds its mutex while it calls a sink (see ILog): the lock order is manager, then sink. An exception from a
// sink ends the call, but areas stay balanced: if entering one fails, the sinks that have entered it leave it
// again, and leaving one reaches every sink. A sink may itself be a manager; sinks are compared by identity.
class PERU_API CLogManager : public CLogBase, public ILogManager {
public:
    CLogManager();
    ~CLogManager() override;

    // Areas have no source, so they go to the sinks that receive every message.
    void enterArea(const P<IString>& name) override;
    void leaveArea(const P<IString>& name) override;
    // Calls the sinks of the message's source first, then those that receive every message.
    void write(const SLogMessage& message) override;

    // Throws CInvalidArgError for an empty handle and for the manager itself.
    void addLog(const P<ILog>& log, const P<IString>& source) override;
    bool removeLog(const P<ILog>& log, const P<IString>& source) override;

    // Number of sources that have sinks of their own.
    size_t getSourceCount() const;

private:
    class CLogList;

    // Removes the innermost area of that name; returns whether there was one.
    bool takeArea(const P<IString>& name);

    P<IMutex> m_mutex; // guards all below
    P<CLogList> m_logs;
    TSimpleHashTable<P<IString>, P<CLogList>> m_logsBySource;
    // Areas whose entry went to the sinks. Leaving them is passed on even if the level was raised in between,
    // otherwise the depth of the sinks would never return to zero.
    std::vector<P<IString>> m_areas;
};

} // namespace peru
