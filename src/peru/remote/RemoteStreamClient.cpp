#include "peru/remote/RemoteStreamClient.h"

#include "peru/Errors.h"
#include "peru/log/ILog.h"
#include "peru/pipes/IPipeStreams.h"
#include "peru/remote/MessageInStream.h"
#include "peru/remote/MessageOutStream.h"
#include "peru/remote/RemoteException.h"
#include "peru/streams/DataStreams.h"
#include "peru/strings/StringFormat.h"

#include <algorithm>
#include <string_view>

namespace peru {

namespace {

constexpr int64_t kTempBlock = 0x100000;
constexpr uint32_t kLongestPoll = 100;  // milliseconds that a stop may have to wait
constexpr uint32_t kTrailerWait = 1000; // milliseconds for the word that ends a request

constexpr char kFunction[] = "function";
constexpr char kVoid[] = "void";
constexpr char kExecute[] = "execute";
constexpr char kReturn[] = "return";
constexpr char kNotFound[] = "notfound";
constexpr char kError[] = "Error:";

// A string in its wire form, without creating one.
void writeWord(IDataOutStream& stream, std::string_view word) {
    stream.writeInt32(static_cast<int32_t>(word.size()));
    stream.write(word.data(), static_cast<int64_t>(word.size()));
}

void logFailure(const CException& exception) noexcept {
    try {
        getLogManager()->logException(newString("remote calls"), exception);
    } catch (...) {
        zvrTrace(__FILE__, __LINE__, "an exception of a remote call could not be logged");
    }
}

} // namespace

// Ends the serving thread.
class CRemoteStreamClient::QuitProc : public CRemoteVoid {
public:
    explicit QuitProc(const P<ISignal>& stop = nullptr) : CRemoteVoid("Quit"), m_stop(stop) {}
    void execute() override { m_stop->set(); }

private:
    P<ISignal> m_stop;
};

// Applies the deadline to both streams.
class CRemoteStreamClient::CDeadlineScope {
public:
    explicit CDeadlineScope(CRemoteStreamClient& client)
        : m_client(client), m_milliseconds(client.m_deadline) {
        restart();
    }
    ~CDeadlineScope() {
        if (m_milliseconds != 0) set(IPipeStream::kNoDeadline);
    }
    CDeadlineScope(const CDeadlineScope&) = delete;
    CDeadlineScope& operator=(const CDeadlineScope&) = delete;

    void restart() {
        if (m_milliseconds != 0) set(m_milliseconds);
    }
    // For the time in which a procedure runs.
    void pause() {
        if (m_milliseconds != 0) set(IPipeStream::kNoDeadline);
    }

private:
    void set(uint32_t milliseconds) {
        if (m_client.m_inPipe) m_client.m_inPipe->setDeadline(milliseconds);
        if (m_client.m_outPipe) m_client.m_outPipe->setDeadline(milliseconds);
    }

    CRemoteStreamClient& m_client;
    uint32_t m_milliseconds;
};

// Marks the time in which stopWorkInThread may interrupt the streams.
class CRemoteStreamClient::CServing {
public:
    explicit CServing(CRemoteStreamClient& client) : m_client(client) {
        const CMutexLock lock(m_client.m_servingMutex);
        m_client.m_isServing = true;
    }
    ~CServing() {
        const CMutexLock lock(m_client.m_servingMutex);
        m_client.m_isServing = false;
        if (!std::exchange(m_client.m_isInterrupted, false)) return;
        m_client.m_inPipe->resume();
        if (m_client.m_outPipe) m_client.m_outPipe->resume();
    }
    CServing(const CServing&) = delete;
    CServing& operator=(const CServing&) = delete;

private:
    CRemoteStreamClient& m_client;
};

CRemoteStreamClient::CRemoteStreamClient(const P<IInStream>& in, const P<IOutStream>& out)
    : m_inSource(in), m_outSource(out), m_inPipe(tryCast<IPipeInStream>(in)),
      m_outPipe(tryCast<IPipeOutStream>(out)), m_message(make<CMessageOutStream>(out)),
      m_in(make<CMessageInStream>(in)), m_out(make<CDataOutStream>(m_message)),
      m_outMutex(getMutexFactory()->createMutex()), m_inMutex(getMutexFactory()->createMutex()),
      m_threadMutex(getMutexFactory()->createMutex()), m_stop(getSignalFactory()->createSignal()),
      m_ended(getSignalFactory()->createSignal()), m_servingMutex(getMutexFactory()->createMutex()),
      m_procMutex(getMutexFactory()->createMutex()) {
    addProc(make<QuitProc>(m_stop));
}

CRemoteStreamClient::~CRemoteStreamClient() {
    try {
        stopWorkInThread();
    } catch (const CException& exception) {
        logFailure(exception);
    }
}

void CRemoteStreamClient::addProc(const P<CRemoteProc>& proc) {
    if (!proc) throw CInvalidArgError("proc", "addProc", P<IBase>::share(this));
    const CMutexLock lock(m_procMutex);
    m_procs[CString::toStdString(proc->getName())] = proc;
}

P<CRemoteProc> CRemoteStreamClient::findProc(const P<IString>& name) const {
    const CMutexLock lock(m_procMutex);
    const auto found = m_procs.find(CString::toStdString(name));
    return found == m_procs.end() ? nullptr : found->second;
}

void CRemoteStreamClient::setLimits(int64_t messageBytes, int32_t textBytes) {
    const CMutexLock outLock(m_outMutex);
    const CMutexLock inLock(m_inMutex);
    m_in->setLimits(messageBytes, textBytes);
}

void CRemoteStreamClient::setTempBlock(const P<IMemoryManager>& manager) {
    const CMutexLock lock(m_outMutex);
    m_message->setBuffer(manager->getBlock(kTempBlock));
}

void CRemoteStreamClient::closeStreams() noexcept {
    try {
        m_outSource->close();
        m_inSource->close();
    } catch (const CException& exception) {
        logFailure(exception);
    }
}

// --- Calling ---

void CRemoteStreamClient::writeRequest(CRemoteProc& proc) {
    try {
        writeWord(*m_out, proc.isVoid() ? kVoid : kFunction);
        m_out->writeString(proc.getName());
        for (const P<CRemoteVar>& param : proc.getParams()) param->writeTo(m_out);
        writeWord(*m_out, kExecute);
        m_out->flush();
    } catch (...) {
        // Half a request would make the other end take the next one for the rest of it.
        if (!m_message->discard()) closeStreams();
        throw;
    }
}

void CRemoteStreamClient::readAnswer(CRemoteFunction& function) {
    bool isAnswered = false;
    try {
        m_in->startMessage();
        const P<IString> line = m_in->readString();
        // An answer starts with some text. Reading once more tells a closed pipe from an empty line.
        if (line->isEmpty() && m_inPipe && m_inPipe->isAtEnd()) m_in->readUInt8();
        const bool isError = line->find(kError).isFound(), isMissing = line->equals(kNotFound);
        // The other end leaves the parameters of a missing function unread and takes them for messages.
        isAnswered = isError || (isMissing && function.getParams().empty());
        if (isError) throw CRemoteException(line);
        if (isMissing)
            throw CRemoteException(format("Remote Procedure not found on host: %s", function.getName()));
        if (!line->equals(kReturn)) throw CRemoteException(format("Unexpected return received: %s", line));
        for (const P<CRemoteVar>& result : function.getResults()) result->readFrom(m_in);
    } catch (...) {
        // What is left of the answer, or arrives late, must not become the answer to the next call.
        if (!isAnswered) closeStreams();
        throw;
    }
}

void CRemoteStreamClient::call(const P<CRemoteProc>& proc) {
    if (!proc) throw CInvalidArgError("proc", "call", P<IBase>::share(this));
    const P<CRemoteFunction> function = proc->isVoid() ? nullptr : P<CRemoteFunction>(proc);
    const CMutexLock outLock(m_outMutex);
    const CMutexLock inLock(m_inMutex);
    const CDeadlineScope deadline(*this);
    writeRequest(*proc);
    if (function) readAnswer(*function);
}

template <class Var> auto CRemoteStreamClient::callForResult(const P<CRemoteProc>& proc) {
    const P<Var> result(P<CRemoteFunction>(proc)->getResult());
    call(proc);
    return result->getValue();
}

int32_t CRemoteStreamClient::callReturningInt(const P<CRemoteProc>& proc) {
    return callForResult<CRemoteVarInteger>(proc);
}

int64_t CRemoteStreamClient::callReturningInt64(const P<CRemoteProc>& proc) {
    return callForResult<CRemoteVarInteger64>(proc);
}

double CRemoteStreamClient::callReturningDouble(const P<CRemoteProc>& proc) {
    return callForResult<CRemoteVarDouble>(proc);
}

bool CRemoteStreamClient::callReturningBool(const P<CRemoteProc>& proc) {
    return callForResult<CRemoteVarBool>(proc);
}

P<IString> CRemoteStreamClient::callReturningString(const P<CRemoteProc>& proc) {
    return callForResult<CRemoteVarString>(proc);
}

P<IURI> CRemoteStreamClient::callReturningURI(const P<CRemoteProc>& proc) {
    return callForResult<CRemoteVarURI>(proc);
}

P<ISerializable> CRemoteStreamClient::callReturningObject(const P<CRemoteProc>& proc,
                                                          const P<ISerializable>& target) {
    const P<CRemoteVarObject> result(P<CRemoteFunction>(proc)->getResult());
    if (target) result->setTarget(target);
    call(proc);
    return result->getValue();
}

void CRemoteStreamClient::quit() {
    call(make<QuitProc>());
}

// --- Serving ---

bool CRemoteStreamClient::processOne() {
    const CMutexLock outLock(m_outMutex);
    const CMutexLock inLock(m_inMutex);
    CDeadlineScope deadline(*this);
    m_stage = EStage::reading;
    m_isFunction = false;
    m_in->startMessage();
    const P<IString> kind = m_in->readString();
    m_isFunction = kind->equals(kFunction);
    if (!m_isFunction && !kind->equals(kVoid)) {
        m_stage = EStage::between;
        return false;
    }
    const P<CRemoteProc> proc = findProc(m_in->readString());
    // A function that is called as a procedure, or the other way round, counts as missing: the two ends
    // would disagree on whether there is an answer.
    if (!proc || proc->isVoid() == m_isFunction) {
        m_stage = EStage::between;
        if (!m_isFunction) throw CRemoteException(newString("Remote Procedure not found on this computer"));
        writeWord(*m_out, kNotFound);
        m_out->flush();
        return false;
    }
    for (const P<CRemoteVar>& param : proc->getParams()) param->readFrom(m_in);
    m_stage = EStage::executing;
    deadline.pause();
    proc->execute();
    deadline.restart();
    if (m_isFunction) writeAnswer(*P<CRemoteFunction>(proc));
    m_stage = EStage::between;
    return true;
}

void CRemoteStreamClient::writeAnswer(const CRemoteFunction& function) {
    try {
        writeWord(*m_out, kReturn);
        for (const P<CRemoteVar>& result : function.getResults()) result->writeTo(m_out);
        m_out->flush();
    } catch (...) {
        if (!m_message->discard()) closeStreams();
        throw;
    }
}

// Returns false if the connection can no longer be used.
bool CRemoteStreamClient::answerException(const CException& exception) {
    // A message that was not read to its end leaves its rest in the stream.
    const EStage stage = std::exchange(m_stage, EStage::between);
    if (m_isFunction && stage != EStage::between) {
        const P<IString> description = exception.getDescription();
        const CDeadlineScope deadline(*this);
        m_out->writeString(format("Error: %s", description->isEmpty() ? exception.getTitle() : description));
        m_out->flush();
    }
    return stage != EStage::reading;
}

// Serves one message; returns false if the connection can no longer be used.
bool CRemoteStreamClient::serveOne(bool& isExecuted) {
    P<CException> failure;
    try {
        isExecuted = processOne();
        return true;
    } catch (const CException& exception) {
        failure = exception.clone();
    } catch (const std::exception& exception) {
        failure = CError(exception.what()).clone();
    }
    logFailure(*failure);
    isExecuted = m_stage == EStage::executing;
    try {
        if (answerException(*failure)) return true;
    } catch (const CException& exception) {
        logFailure(exception);
    }
    m_failure = failure;
    return false;
}

// One look at the pipe. Returns false if serving ends.
bool CRemoteStreamClient::serve() {
    const auto interval = static_cast<uint32_t>(std::max(m_pollInterval, 1));
    if (!m_inPipe->waitForData(std::min(interval, kLongestPoll))) {
        // Returns at once on a stream that somebody has aborted, hence the pause.
        return !m_stop->wait(1) && !m_inPipe->isAtEnd();
    }
    const CMutexLock outLock(m_outMutex);
    const CMutexLock inLock(m_inMutex);
    const CServing serving(*this);
    // A call of another thread may have read what was there, and a stop may have come while it did.
    if (m_stop->wait(0)) return false;
    switch (m_inPipe->fetch()) {
    case IPipeInStream::EArrival::nothing:
        return true;
    case IPipeInStream::EArrival::end:
        return false;
    case IPipeInStream::EArrival::bytes:
        break;
    }
    // The word that ends a request is dropped before the locks are released, so that a call does not take it
    // for its answer.
    for (bool isExecuted = true; isExecuted && !m_stop->wait(0);) {
        if (!m_inPipe->waitForData(kTrailerWait)) break;
        if (!serveOne(isExecuted)) return false;
    }
    return true;
}

void CRemoteStreamClient::work() {
    m_servingThread = std::this_thread::get_id();
    try {
        while (serve()) {
        }
        if (m_failure) closeStreams();
        if (m_listener) m_listener->onWorkEnded(this, m_failure.get());
    } catch (const CException& exception) {
        logFailure(exception);
    } catch (const std::exception& exception) {
        logFailure(CError(exception.what()));
    }
    m_servingThread = std::thread::id();
    m_ended->set();
}

void CRemoteStreamClient::startWorkInThread(int pollInterval) {
    if (!m_inPipe) throw CRemoteException(newString("Work in Thread only possible with named Pipe Streams"));
    const CMutexLock lock(m_threadMutex);
    if (m_thread) {
        if (!m_ended->wait(0))
            throw CInvalidObjectStateError("the serving thread runs", P<IBase>::share(this));
        m_thread->wait();
        m_thread = nullptr;
    }
    m_stop->reset();
    m_ended->reset();
    m_failure = nullptr;
    m_pollInterval = pollInterval;
    SThreadBody body;
    body.owner = PFrail<IBase>(this, false); // stopWorkInThread waits for the thread
    body.argument = this;
    body.function = [](IBase*, void* client) { static_cast<CRemoteStreamClient*>(client)->work(); };
    m_thread = getThreadManager()->createThread(body);
}

void CRemoteStreamClient::stopWorkInThread() {
    if (m_servingThread == std::this_thread::get_id()) {
        m_stop->set();
        return;
    }
    const CMutexLock lock(m_threadMutex);
    if (!m_thread) return;
    m_stop->set();
    {
        const CMutexLock servingLock(m_servingMutex);
        if (m_isServing && !m_isInterrupted) {
            m_isInterrupted = true;
            m_inPipe->abort();
            if (m_outPipe) m_outPipe->abort();
        }
    }
    m_thread->wait();
    m_thread = nullptr;
}

bool CRemoteStreamClient::waitForWorkEnd(uint32_t milliseconds) {
    return m_ended->wait(milliseconds);
}

} // namespace peru
