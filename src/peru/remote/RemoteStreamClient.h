// Remote calls over a pair of streams.
#pragma once

#include "peru/MemoryManager.h"
#include "peru/remote/IRemote.h"
#include "peru/threads/ISignal.h"
#include "peru/threads/IThreadManager.h"

#include <atomic>
#include <map>
#include <string>
#include <thread>

namespace peru {

class CMessageInStream;
class CMessageOutStream;
class IPipeInStream;
class IPipeOutStream;

// Both ends of a connection use this class, and an end can call and serve. Any thread may call: calls are
// made one at a time, and a served message excludes them. An end that calls while the other end calls gets
// that request in place of its answer, so only one of them may start calls at a time.
//
// A request is the string "function" or "void", the name, the parameters and the string "execute". The answer
// to a function is the string "return" and the results, the string "notfound", or a line with "Error:". Since
// the parameters of a missing function stay unread, its caller closes the connection if there are any.
class PERU_API CRemoteStreamClient : public CObject, public IRemote {
public:
    CRemoteStreamClient(const P<IInStream>& in, const P<IOutStream>& out);
    ~CRemoteStreamClient() override; // stops serving

    void addProc(const P<CRemoteProc>& proc) override;
    void call(const P<CRemoteProc>& proc) override;
    // Call a function and return the value of its result. Throw CCastError, before the call, if the result
    // is of another type.
    int32_t callReturningInt(const P<CRemoteProc>& proc);
    int64_t callReturningInt64(const P<CRemoteProc>& proc);
    double callReturningDouble(const P<CRemoteProc>& proc);
    bool callReturningBool(const P<CRemoteProc>& proc);
    P<IString> callReturningString(const P<CRemoteProc>& proc);
    P<IURI> callReturningURI(const P<CRemoteProc>& proc);
    // `target` is the object that the result is read into; if empty, the one that the var has.
    P<ISerializable> callReturningObject(const P<CRemoteProc>& proc,
                                         const P<ISerializable>& target = nullptr);

    // Serves messages on a thread of its own until the other end calls "Quit" or closes the pipe, or
    // stopWorkInThread. An exception of a procedure is sent to the caller of a function as a line with
    // "Error:"; if a message cannot be read, the connection is closed. Looks for messages and for the end of
    // the pipe at least every `pollInterval` milliseconds. Throws CRemoteException with "Work in Thread only
    // possible with named Pipe Streams", and CInvalidObjectStateError if the thread runs.
    void startWorkInThread(int pollInterval);
    // Returns when the thread has ended. A message that it executes is completed first; if one has arrived in
    // part, the connection is closed. Called by a procedure, it only ends the thread after that message.
    void stopWorkInThread();
    // True once the serving thread has ended; false when the time is over.
    bool waitForWorkEnd(uint32_t milliseconds);
    // Ends the serving thread of the other end, without waiting for it.
    void quit();

    // Serves one message and returns whether a procedure was executed. Waits for the message. A string that
    // starts no message is dropped, among them the "execute" of the message before. Exceptions of the
    // procedure propagate; the caller then gets no answer.
    bool processOne();

    // How long, in milliseconds, a call may take including its answer, and how long a served message may take
    // to arrive and its answer to be sent. Without a limit by default (0). Needs pipe streams. A call that
    // fails by it closes the connection, since its answer could still arrive.
    void setDeadline(uint32_t milliseconds) { m_deadline = milliseconds; }
    // What one message of the other end may take in bytes, and a single text in it; 0, the default, means
    // without limit. Beyond it reading throws CRemoteException and the connection is closed. Set before the
    // first message.
    void setLimits(int64_t messageBytes, int32_t textBytes);
    // Gathers messages in a block of 1 MiB of the manager instead of a small buffer.
    void setTempBlock(const P<IMemoryManager>& manager);
    // Held without a reference; null removes it. Set while the thread does not run.
    void setListener(IRemoteListener* listener) { m_listener = listener; }

private:
    class QuitProc;
    class CDeadlineScope;
    class CServing;

    // How far the served message has come, which decides what an exception means.
    enum class EStage { between, reading, executing };

    template <class Var> auto callForResult(const P<CRemoteProc>& proc);
    void writeRequest(CRemoteProc& proc);
    void readAnswer(CRemoteFunction& function);
    P<CRemoteProc> findProc(const P<IString>& name) const;
    void work();
    bool serve();
    bool serveOne(bool& isExecuted);
    void writeAnswer(const CRemoteFunction& function);
    bool answerException(const CException& exception);
    void closeStreams() noexcept;

    P<IInStream> m_inSource;
    P<IOutStream> m_outSource;
    P<IPipeInStream> m_inPipe; // the sources, if they are pipes
    P<IPipeOutStream> m_outPipe;
    P<CMessageOutStream> m_message;
    P<CMessageInStream> m_in;
    P<IDataOutStream> m_out;
    // Always taken in this order and held for a whole call or served message. Guard the streams and the two
    // members below.
    P<IMutex> m_outMutex;
    P<IMutex> m_inMutex;
    EStage m_stage = EStage::between;
    bool m_isFunction = false; // the served message

    P<IMutex> m_threadMutex; // guards m_thread
    P<IThread> m_thread;
    std::atomic<std::thread::id> m_servingThread{};
    P<ISignal> m_stop;
    P<ISignal> m_ended;
    int m_pollInterval = 0;
    P<CException> m_failure; // of the connection; used by the serving thread only

    // Guards the two members below: the streams are only interrupted while the thread serves a message, so
    // that a call of another thread is not.
    P<IMutex> m_servingMutex;
    bool m_isServing = false;
    bool m_isInterrupted = false;

    mutable P<IMutex> m_procMutex; // guards m_procs
    std::map<std::string, P<CRemoteProc>> m_procs;
    std::atomic<uint32_t> m_deadline{0};
    IRemoteListener* m_listener = nullptr;
};

} // namespace peru
