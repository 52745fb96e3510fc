// Fans the program's messages out.
#pragma once

#include "peru/collections/SimpleHashTable.h"
#include "peru/log/LogBase.h"
#include "peru/threads/IMutex.h"

#include <vector>

namespace peru {

// Holds its mutex while it calls a sink: the order of locks is manager, then sink. A sink that throws ends
// the call. A sink may itself be a manager; it is known by its identity.
class PERU_API CLogManager : public CLogBase, public ILogManager {
public:
    CLogManager();
    ~CLogManager() override;

    // Areas have no source: the sinks that take everything are told.
    void enterArea(const P<IString>& name) override;
    void leaveArea(const P<IString>& name) override;
    // The sinks of the message's source first, then those that take everything.
    void write(const SLogMessage& message) override;

    // Throws CInvalidArgError for an empty log and for the manager itself.
    void addLog(const P<ILog>& log, const P<IString>& source) override;
    bool removeLog(const P<ILog>& log, const P<IString>& source) override;

    // Sources with a sink of their own.
    size_t getSourceCount() const;

private:
    class CLogList;

    P<IMutex> m_mutex; // guards all below
    P<CLogList> m_logs;
    TSimpleHashTable<P<IString>, P<CLogList>> m_logsBySource;
    // Areas that the sinks were told of. Who heard of an entry hears of the leaving, also when the level
    // was raised in between, since the depth would never come back.
    std::vector<P<IString>> m_areas;
};

} // namespace peru
