// The slave of a source or a format.
#pragma once

#include "peru/system/IPathes.h"
#include "peru/threads/IMutex.h"
#include "sonora2/boxed/PluginClient.h"
#include "sonora2/boxed/RemoteLog.h"
#include "sonora2/boxed/RemoteMediaState.h"
#include "sonora2/boxed/SlaveHandler.h"
#include "sonora2/context/SonoraError.h"

#include <chrono>
#include <utility>

namespace sonora2::common {

// What CEncapsulatedSource and CEncapsulatedFormat have in common. One lock serialises all calls into the
// slave; it is recursive.
template <class Client> class TBoxedMedia {
protected:
    TBoxedMedia(const P<ISonoraContext>& context, const P<peru::IString>& pluginName,
                const P<peru::IURI>& uri);
    ~TBoxedMedia();

    // Forwards an operation. A slave that has failed is noticed before the lock is taken, since a call that
    // hangs may hold it. Without a slave the result is zero, false or empty.
    template <class Call> auto forward(const char* operation, Call call);
    // Forwards an operation whose error and effects are fetched afterwards.
    template <class Call> void change(const char* operation, Call call);

    void checkSlave(); // throws if the slave has failed; called without the lock

    // The following are called with the lock held.
    // Creates the object in a slave; `create` asks the plug-in's client for it. Returns false if the plug-in
    // declines.
    template <class Create> bool createIn(const char* operation, Create create);
    template <class Call> void changeLocked(const char* operation, Call call);
    void takeState(const P<CRemoteMediaState>& state); // throws the failure in it
    void replay(const P<peru::IString>& log);
    bool hasFailed() const { return m_slave && m_slave->hasFailed(); }
    void drop(); // ends the slave

    P<ISonoraContext> m_context;
    P<peru::IString> m_pluginName;
    P<peru::IURI> m_uri;
    P<peru::IMutex> m_guard; // guards all members that follow, except where noted
    P<Client> m_client;
    P<CSlaveHandler> m_slave;
    P<CRemoteMediaState> m_state; // never empty
    std::chrono::steady_clock::time_point m_lastLogPoll;

private:
    void pollLog();

    P<peru::IMutex> m_slaveMutex; // guards changes of m_slave
};

namespace detail {
constexpr std::chrono::milliseconds kLogPollInterval{5000};
} // namespace detail

template <class Client>
TBoxedMedia<Client>::TBoxedMedia(const P<ISonoraContext>& context, const P<peru::IString>& pluginName,
                                 const P<peru::IURI>& uri)
    : m_context(context), m_pluginName(pluginName), m_uri(uri),
      m_guard(peru::getMutexFactory()->createMutex()), m_state(peru::make<CRemoteMediaState>()),
      m_lastLogPoll(std::chrono::steady_clock::now()), m_slaveMutex(peru::getMutexFactory()->createMutex()) {}

template <class Client> TBoxedMedia<Client>::~TBoxedMedia() {
    drop();
}

template <class Client> void TBoxedMedia<Client>::checkSlave() {
    P<CSlaveHandler> slave;
    {
        const peru::CMutexLock lock(m_slaveMutex);
        slave = m_slave;
    }
    if (slave) slave->checkForSlaveError();
}

template <class Client> void TBoxedMedia<Client>::drop() {
    m_client = nullptr;
    P<CSlaveHandler> slave;
    const peru::CMutexLock lock(m_slaveMutex);
    slave.swap(m_slave);
}

template <class Client> void TBoxedMedia<Client>::replay(const P<peru::IString>& log) {
    m_lastLogPoll = std::chrono::steady_clock::now();
    if (log->isEmpty()) return;
    if (const P<ILogManager> manager = m_context->getLogManager()) replayLog(log, *manager);
}

template <class Client> void TBoxedMedia<Client>::pollLog() {
    const auto now = std::chrono::steady_clock::now();
    if (now - m_lastLogPoll < detail::kLogPollInterval) return;
    m_lastLogPoll = now;
    m_slave->fetchLog();
}

template <class Client> void TBoxedMedia<Client>::takeState(const P<CRemoteMediaState>& state) {
    m_state = state;
    replay(state->log);
    if (!state->failure->isEmpty()) throw CSonoraError(state->failure);
}

template <class Client> template <class Create>
bool TBoxedMedia<Client>::createIn(const char* operation, Create create) {
    if (hasFailed()) drop();
    if (m_client) return true;
    const P<CSlaveHandler> slave = peru::make<CSlaveHandler>(m_context, m_pluginName, kSlaveNiceValue);
    slave->setMedium(peru::getShownName(m_uri));
    const P<CSonoraPluginClient> plugin = slave->getClient();
    P<CRemoteMediaState> state;
    const P<Client> client = slave->call(operation, [&] {
        P<Client> made(create(*plugin));
        if (made) state = made->getState();
        return made;
    });
    if (!client) return false;
    {
        const peru::CMutexLock lock(m_slaveMutex);
        m_slave = slave;
    }
    m_client = client;
    takeState(state);
    return true;
}

template <class Client> template <class Call>
auto TBoxedMedia<Client>::forward(const char* operation, Call call) {
    using Result = decltype(call(std::declval<Client&>()));
    checkSlave();
    const peru::CMutexLock lock(m_guard);
    if (!m_client) return Result();
    pollLog();
    return m_slave->call(operation, [&] { return call(*m_client); });
}

template <class Client> template <class Call>
void TBoxedMedia<Client>::changeLocked(const char* operation, Call call) {
    P<CRemoteMediaState> state;
    m_slave->call(operation, [&] {
        call(*m_client);
        state = m_client->getState();
    });
    takeState(state);
}

template <class Client> template <class Call>
void TBoxedMedia<Client>::change(const char* operation, Call call) {
    checkSlave();
    const peru::CMutexLock lock(m_guard);
    if (m_client) changeLocked(operation, call);
}

} // namespace sonora2::common
