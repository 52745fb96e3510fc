#include "peru/pipes/posix/PipeServer.h"

#include "peru/Errors.h"
#include "peru/log/ILog.h"
#include "peru/pipes/posix/PipeFolder.h"
#include "peru/streams/StreamTools.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/ITimeManager.h"

#include <cerrno>
#include <climits>
#include <optional>
#include <poll.h>
#include <sys/epoll.h>
#include <sys/socket.h>
#include <unistd.h>

namespace peru::posix {

namespace {

constexpr uint32_t kStartWait = 5000; // milliseconds
constexpr int kLingerInterval = 50;   // milliseconds between looks at a client that has gone
constexpr int kShortageWait = 100;    // milliseconds before the next attempt, without free descriptors
// Clients that connect while a listener runs; further ones wait in connect().
constexpr int kBacklog = 16;
constexpr uid_t kOverflowUser = 65534; // what the kernel reports for users that have no number here

void logFailure(const CException& exception) noexcept {
    try {
        getLogManager()->logException(newString("pipe server"), exception);
    } catch (...) {
        zvrTrace(__FILE__, __LINE__, "an exception of a pipe server could not be logged");
    }
}

// The trustees that apply to a peer, as bits.
uint32_t getTrustees(uid_t user) {
    constexpr auto bit = [](EPipeTrustee trustee) { return 1u << trustee; };
    if (user == 0) return bit(kPipeAdministrators) | bit(kPipeAuthenticatedUsers);
    if (user == kOverflowUser) return bit(kPipeAnonymous) | bit(kPipeGuests);
    if (user == static_cast<uid_t>(-1)) return bit(kPipeAnonymous);
    return bit(kPipeAuthenticatedUsers);
}

// When waiting for a first client ends.
class CDeadline {
public:
    explicit CDeadline(int64_t milliseconds)
        : m_end(milliseconds > 0 ? getTimeManager()->getMonotonicTime() / 1'000'000 + milliseconds : -1) {}

    void cancel() { m_end = -1; }
    // Milliseconds left, rounded up; -1 if there is no deadline.
    int getRest() const {
        if (m_end < 0) return -1;
        const int64_t rest = m_end - getTimeManager()->getMonotonicTime() / 1'000'000;
        return static_cast<int>(std::clamp<int64_t>(rest, 0, INT_MAX));
    }
    bool hasPassed() const { return getRest() == 0; }

private:
    int64_t m_end;
};

} // namespace

// One accepted client.
class CPipeServer::CConnection : public CObject {
public:
    CConnection(const P<CPipeSocket>& socket, uint32_t number, const P<IPipeClient>& client)
        : socket(socket), number(number), client(client) {}

    // Bytes have arrived or were read since the last call, and there are some to read.
    bool hasNews() {
        const int64_t taken = socket->getTaken();
        const int64_t available = socket->getAvailable();
        if (available == 0 || (taken == m_taken && taken + available == m_arrived)) return false;
        m_taken = taken;
        m_arrived = taken + available;
        return true;
    }

    const P<CPipeSocket> socket;
    const uint32_t number;
    const P<IPipeClient> client;
    bool isWatched = false; // by the accept thread

private:
    int64_t m_taken = 0;
    int64_t m_arrived = 0;
};

// Writes to all clients.
class CPipeServer::COutStream : public CObject, public IOutStream {
public:
    explicit COutStream(const P<const CPipeServer>& server) : m_server(server) {}

    void close() override { m_closed = true; }
    P<IURI> getURI() const override { return nullptr; }
    bool isAtEnd() override { return true; }
    void write(const void* buffer, int64_t size) override {
        checkStreamSize(size, "write");
        if (m_closed) throw CStreamClosedError();
        const std::vector<P<CConnection>> connections = m_server->getConnections();
        if (connections.empty())
            throw CException(nullptr, newString("Error write to server clients. No clients connected."));
        P<CException> failure;
        for (const P<CConnection>& connection : connections) try {
                connection->client->getOutStream()->write(buffer, size);
            } catch (const CException& exception) {
                if (!failure) failure = exception.clone();
            }
        if (failure) failure->raise();
    }
    void flush() override {}

private:
    P<const CPipeServer> m_server;
    bool m_closed = false;
};

// Registered with the server while a thread waits, so that stop() ends that wait and no later one.
class CPipeServer::CStopEvent : public CWakeEvent {
public:
    explicit CStopEvent(CPipeServer& server) : m_server(server) {
        const std::lock_guard lock(m_server.m_settingsMutex);
        m_server.m_stopEvents.push_back(this);
    }
    ~CStopEvent() {
        const std::lock_guard lock(m_server.m_settingsMutex);
        std::erase(m_server.m_stopEvents, this);
    }
    CStopEvent(const CStopEvent&) = delete;
    CStopEvent& operator=(const CStopEvent&) = delete;

private:
    CPipeServer& m_server;
};

// The descriptors that the accept thread waits for.
class CPipeServer::CEventSet {
public:
    CEventSet(int listening, int stop, int listenersChanged)
        : m_set(::epoll_create1(EPOLL_CLOEXEC)), m_listening(listening), m_stop(stop),
          m_listenersChanged(listenersChanged) {
        if (!m_set.isOpen() || !control(EPOLL_CTL_ADD, listening, EPOLLIN) ||
            !control(EPOLL_CTL_ADD, stop, EPOLLIN) || !control(EPOLL_CTL_ADD, listenersChanged, EPOLLIN))
            throw CError(getSystemText(errno));
    }

    // Edge triggered: a client whose bytes nobody reads wakes the thread once and not all the time. Data is
    // only of interest if there are listeners. A repeated call reports again what is there already.
    void watch(CConnection& connection, bool data) {
        const uint32_t events = EPOLLRDHUP | EPOLLET | (data ? static_cast<uint32_t>(EPOLLIN) : 0u);
        control(connection.isWatched ? EPOLL_CTL_MOD : EPOLL_CTL_ADD, connection.socket->getDescriptor(),
                events);
        connection.isWatched = true;
    }
    void forget(CConnection& connection) {
        control(EPOLL_CTL_DEL, connection.socket->getDescriptor(), 0);
        connection.isWatched = false;
    }
    void setListening(bool listening) {
        if (listening == m_isListening) return;
        control(EPOLL_CTL_MOD, m_listening, listening ? static_cast<uint32_t>(EPOLLIN) : 0u);
        m_isListening = listening;
    }

    struct SResult {
        bool stop = false;
        bool connecting = false;
        bool listenersChanged = false;
    };
    SResult wait(int milliseconds) {
        epoll_event events[32];
        const int count = ::epoll_wait(m_set.get(), events, std::size(events), milliseconds);
        SResult result;
        for (int i = 0; i < count; ++i) {
            if (events[i].data.fd == m_stop) result.stop = true;
            if (events[i].data.fd == m_listening) result.connecting = true;
            if (events[i].data.fd == m_listenersChanged) result.listenersChanged = true;
        }
        return result;
    }

private:
    bool control(int operation, int descriptor, uint32_t events) {
        epoll_event event = {};
        event.events = events;
        event.data.fd = descriptor;
        return ::epoll_ctl(m_set.get(), operation, descriptor, &event) == 0;
    }

    CFileHandle m_set;
    int m_listening;
    int m_stop;
    int m_listenersChanged;
    bool m_isListening = true;
};

CPipeServer::CPipeServer(const P<IString>& name)
    : m_name(name), m_startMutex(getMutexFactory()->createMutex()),
      m_started(getSignalFactory()->createSignal()),
      m_rules(
          {{{true, kPipeAll, kPipeAdministrators}, {true, kPipeRead | kPipeWrite, kPipeAuthenticatedUsers}}}),
      m_connectionMutex(getMutexFactory()->createMutex()), m_called(make<CListeners>()),
      m_listeners(make<CListeners>()), m_clientThere(getSignalFactory()->createSignal()) {}

CPipeServer::~CPipeServer() {
    try {
        stop();
    } catch (const CException& exception) {
        logFailure(exception);
    }
}

void CPipeServer::start() {
    const CMutexLock lock(m_startMutex);
    if (m_running) throw CInvalidObjectStateError("the pipe server is running", P<IBase>::share(this));
    endThread(); // one that has ended by itself
    {
        const std::lock_guard settings(m_settingsMutex);
        static_cast<void>(formatPipeAccess(m_rules)); // throws if they are invalid
    }
    m_started->reset();
    m_clientThere->reset();
    m_startFailed = false;
    m_stopRequested = false;
    m_running = true;
    SThreadBody body;
    body.owner = PFrail<IBase>(this, false); // stop() waits for the thread
    body.argument = this;
    body.function = [](IBase*, void* server) { static_cast<CPipeServer*>(server)->acceptClients(); };
    try {
        m_thread = getThreadManager()->createThread(body);
    } catch (...) {
        m_running = false;
        throw;
    }
    if (m_started->wait(kStartWait) && !m_startFailed) return;
    endThread();
    throw CException(nullptr, newString("Error starting Pipe Server"));
}

void CPipeServer::stop() {
    const CMutexLock lock(m_startMutex);
    endThread();
    std::vector<P<CConnection>> connections;
    {
        const CMutexLock connectionLock(m_connectionMutex);
        connections.swap(m_connections);
    }
    for (const P<CConnection>& connection : connections) connection->client->close();
}

// Ends all waits and the accept thread.
void CPipeServer::endThread() {
    m_stopRequested = true;
    {
        const std::lock_guard settings(m_settingsMutex);
        for (CStopEvent* event : m_stopEvents) event->set();
    }
    if (!m_thread) return;
    m_thread->wait();
    m_thread = nullptr;
}

void CPipeServer::acceptClients() {
    bool started = false;
    try {
        runAcceptThread(started);
    } catch (const CException& exception) {
        logFailure(exception);
    } catch (const std::exception& exception) {
        logFailure(CError(exception.what()));
    }
    if (!started) m_startFailed = true;
    m_running = false;
    m_started->set();
    m_clientThere->set();
}

void CPipeServer::runAcceptThread(bool& started) {
    CStopEvent stop(*this);
    if (m_stopRequested) return; // before the event could be set
    std::optional<CPipeAccessList> access;
    std::optional<CDeadline> deadline;
    {
        const std::lock_guard settings(m_settingsMutex);
        access.emplace(formatPipeAccess(m_rules));
        deadline.emplace(m_deadline);
    }
    const CListeningPipe pipe(CString::toStdString(m_name), kBacklog);
    CEventSet events(pipe.get(), stop.get(), m_listenersChanged.get());
    started = true;
    m_started->set();
    callListeners([this](IPipeServerListener& listener) {
        if (auto* created = dynamic_cast<IPipeCreatedListener*>(&listener)) created->onPipeCreated(this);
    });

    for (ECheck left = ECheck::again;;) {
        const int timeout = left == ECheck::again    ? 0
                            : left == ECheck::linger ? kLingerInterval
                                                     : deadline->getRest();
        const CEventSet::SResult event = events.wait(timeout);
        if (event.stop || deadline->hasPassed()) return;
        if (event.connecting) {
            if (const P<CPipeSocket> socket = acceptSocket(pipe, *access)) {
                deadline->cancel();
                const P<CConnection> connection = addConnection(socket);
                const CMutexLock lock(m_connectionMutex);
                events.watch(*connection, m_called->getCount() > 0);
            }
        }
        if (event.listenersChanged) {
            m_listenersChanged.reset();
            const CMutexLock lock(m_connectionMutex);
            for (const P<CConnection>& connection : m_connections)
                events.watch(*connection, m_called->getCount() > 0);
        }
        left = checkClients(events);
        events.setListening(getClientCount() < kMostClients);
    }
}

CPipeServer::ECheck CPipeServer::checkClients(CEventSet& events) {
    const CMutexLock lock(m_connectionMutex);
    ECheck result = ECheck::done;
    for (size_t i = m_connections.size(); i-- > 0;) {
        if (i >= m_connections.size()) continue; // a listener has called stop() against the rules
        const P<CConnection> connection = m_connections[i];
        if (connection->socket->isAtEnd()) {
            events.forget(*connection);
            m_connections.erase(m_connections.begin() + static_cast<ptrdiff_t>(i));
            if (m_connections.empty()) m_clientThere->reset();
            callListeners([&](IPipeServerListener& listener) {
                listener.onClientDisconnected(this, connection->client);
            });
            continue;
        }
        if (connection->socket->isPeerGone()) result = ECheck::linger;
        if (m_called->getCount() > 0 && connection->hasNews()) {
            callListeners([&](IPipeServerListener& listener) { listener.onData(this, connection->client); });
            return ECheck::again;
        }
    }
    return result;
}

// Returns an empty handle if the client is not admitted or has left already.
P<CPipeSocket> CPipeServer::acceptSocket(const CListeningPipe& pipe, const CPipeAccessList& access) const {
    CFileHandle socket(::accept4(pipe.get(), nullptr, nullptr, SOCK_CLOEXEC));
    if (!socket.isOpen()) {
        // The client stays in the queue, so an immediate next attempt would fail in the same way.
        if (errno == EMFILE || errno == ENFILE || errno == ENOBUFS || errno == ENOMEM)
            ::poll(nullptr, 0, kShortageWait);
        return nullptr;
    }
    ucred peer = {};
    socklen_t size = sizeof peer;
    const bool known = ::getsockopt(socket.get(), SOL_SOCKET, SO_PEERCRED, &peer, &size) == 0;
    if (!access.allows(getTrustees(known ? peer.uid : static_cast<uid_t>(-1)), kPipeRead | kPipeWrite)) {
        getLogManager()->warning(newString("pipe server"), format("User %d was refused at the pipe '%s'.",
                                                                  static_cast<int64_t>(peer.uid), m_name));
        return nullptr;
    }
    P<CPipeSocket> result = make<CPipeSocket>();
    result->attach(std::move(socket));
    return result;
}

P<CPipeServer::CConnection> CPipeServer::addConnection(const P<CPipeSocket>& socket) {
    const CMutexLock lock(m_connectionMutex);
    const P<CConnection> connection =
        make<CConnection>(socket, m_pipesMade++, make<CPipeClient>(m_name, socket));
    m_connections.push_back(connection);
    callListeners(
        [&](IPipeServerListener& listener) { listener.onClientConnected(this, connection->client); });
    m_clientThere->set();
    return connection;
}

P<IPipeClient> CPipeServer::acceptOne(IPipeCreatedListener* listener) {
    CStopEvent stop(*this);
    std::optional<CPipeAccessList> access;
    int64_t milliseconds;
    {
        const std::lock_guard settings(m_settingsMutex);
        access.emplace(formatPipeAccess(m_rules));
        milliseconds = m_deadline;
    }
    std::optional<CListeningPipe> pipe;
    try {
        pipe.emplace(CString::toStdString(m_name), 0); // room for one client
    } catch (const CError& error) {
        logFailure(error);
        return nullptr;
    }
    if (listener) listener->onPipeCreated(this);

    const CDeadline deadline(milliseconds);
    for (;;) {
        pollfd descriptors[] = {{pipe->get(), POLLIN, 0}, {stop.get(), POLLIN, 0}};
        const int count = ::poll(descriptors, std::size(descriptors), deadline.getRest());
        if (descriptors[1].revents != 0) return nullptr;
        if (count > 0)
            if (const P<CPipeSocket> socket = acceptSocket(*pipe, *access))
                return addConnection(socket)->client;
        if (deadline.hasPassed()) return nullptr;
    }
}

std::vector<P<CPipeServer::CConnection>> CPipeServer::getConnections() const {
    const CMutexLock lock(m_connectionMutex);
    return m_connections;
}

size_t CPipeServer::getClientCount() const {
    const CMutexLock lock(m_connectionMutex);
    return m_connections.size();
}

P<IPipeClient> CPipeServer::getClient(size_t index) const {
    const CMutexLock lock(m_connectionMutex);
    return index < m_connections.size() ? m_connections[index]->client : nullptr;
}

bool CPipeServer::waitForClient(uint32_t milliseconds) {
    m_clientThere->wait(milliseconds);
    return getClientCount() > 0;
}

P<IOutStream> CPipeServer::getOutStream() const {
    return make<COutStream>(P<const CPipeServer>::share(this));
}

// Calls the listeners from the last to the first. The caller holds the connection lock.
template <class Call> void CPipeServer::callListeners(Call&& call) {
    const CMutexLock lock(m_connectionMutex);
    for (size_t i = m_called->getCount(); i-- > 0;)
        if (IPipeServerListener* listener = m_called->at(i)) try {
                call(*listener);
            } catch (const CException& exception) {
                logFailure(exception);
            } catch (const std::exception& exception) {
                logFailure(CError(exception.what()));
            }
}

// Makes a change of the listeners visible to the calls. Takes over the listener lock and releases it: the
// two locks are never held together, so changes are ordered by their number.
void CPipeServer::publishListeners(std::unique_lock<std::mutex>& lock) {
    const uint64_t version = ++m_listenersVersion;
    const P<CListeners> copy = make<CListeners>();
    for (size_t i = 0; i < m_listeners->getCount(); ++i) copy->add(m_listeners->at(i));
    lock.unlock();

    const CMutexLock connectionLock(m_connectionMutex);
    if (version > m_calledVersion) {
        m_called = copy;
        m_calledVersion = version;
    }
    m_listenersChanged.set();
}

void CPipeServer::addListener(IPipeServerListener* listener) {
    if (!listener) throw CInvalidArgError("listener", "addListener", P<IBase>::share(this));
    std::unique_lock lock(m_listenerMutex);
    m_listeners->add(listener);
    publishListeners(lock);
}

bool CPipeServer::removeListener(IPipeServerListener* listener) {
    std::unique_lock lock(m_listenerMutex);
    if (!m_listeners->remove(listener)) return false;
    publishListeners(lock);
    return true;
}

void CPipeServer::setAccessRules(const CPipeAccessRules& rules) {
    const std::lock_guard lock(m_settingsMutex);
    m_rules = rules;
}

void CPipeServer::setDeadline(int64_t milliseconds) {
    const std::lock_guard lock(m_settingsMutex);
    m_deadline = milliseconds;
}

} // namespace peru::posix
