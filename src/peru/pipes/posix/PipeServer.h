// The server end of a pipe over sockets.
#pragma once

#include "peru/collections/FrailArray.h"
#include "peru/pipes/IPipeServer.h"
#include "peru/pipes/posix/PipeClient.h"
#include "peru/threads/IMutex.h"
#include "peru/threads/ISignal.h"
#include "peru/threads/IThreadManager.h"

#include <atomic>
#include <mutex>
#include <vector>

namespace peru::posix {

class CListeningPipe;

class CPipeServer : public CObject, public IPipeServer {
public:
    explicit CPipeServer(const P<IString>& name);
    ~CPipeServer() override; // stops

    P<IString> getName() const override { return m_name; }
    void start() override;
    void stop() override;
    P<IPipeClient> acceptOne(IPipeCreatedListener* listener) override;
    size_t getClientCount() const override;
    P<IPipeClient> getClient(size_t index) const override;
    bool waitForClient(uint32_t milliseconds) override;
    P<IOutStream> getOutStream() const override;
    void addListener(IPipeServerListener* listener) override;
    bool removeListener(IPipeServerListener* listener) override;
    void setAccessRules(const CPipeAccessRules& rules) override;
    void setDeadline(int64_t milliseconds) override;

private:
    class CConnection;
    class COutStream;
    class CStopEvent;
    class CEventSet;
    using CListeners = TFrailArray<IPipeServerListener>;

    // What is left to do after a look at all clients.
    enum class ECheck {
        done,
        again,  // a listener was called, so another round may find more
        linger, // a client has gone, but its bytes are not read yet
    };

    void acceptClients();
    void runAcceptThread(bool& started);
    ECheck checkClients(CEventSet& events);
    P<CPipeSocket> acceptSocket(const CListeningPipe& pipe, const CPipeAccessList& access) const;
    P<CConnection> addConnection(const P<CPipeSocket>& socket);
    std::vector<P<CConnection>> getConnections() const;
    template <class Call> void callListeners(Call&& call);
    void publishListeners(std::unique_lock<std::mutex>& lock);
    void endThread();

    P<IString> m_name;

    P<IMutex> m_startMutex; // held by start and stop; guards m_thread
    P<IThread> m_thread;
    P<ISignal> m_started; // by the accept thread: it runs or has failed
    std::atomic<bool> m_startFailed{false};
    std::atomic<bool> m_stopRequested{false};
    std::atomic<bool> m_running{false}; // the accept thread has not ended

    mutable std::mutex m_settingsMutex; // guards the three members below
    CPipeAccessRules m_rules;
    int64_t m_deadline = 0;
    std::vector<CStopEvent*> m_stopEvents; // of the waits that stop() ends

    // Held while listeners are called, so they are not removed during a call. Guards the three members below.
    P<IMutex> m_connectionMutex;
    std::vector<P<CConnection>> m_connections;
    uint32_t m_pipesMade = 0;
    P<CListeners> m_called; // a copy of the listeners
    uint64_t m_calledVersion = 0;

    // Never held together with m_connectionMutex. Guards the two members below.
    std::mutex m_listenerMutex;
    P<CListeners> m_listeners;
    uint64_t m_listenersVersion = 0;

    CWakeEvent m_listenersChanged; // wakes the accept thread
    P<ISignal> m_clientThere;      // set while there are clients and once no more are accepted
};

} // namespace peru::posix
