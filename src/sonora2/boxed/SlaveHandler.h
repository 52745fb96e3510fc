// Starts a slave process for one job and connects to it.
#pragma once

#include "peru/Errors.h"
#include "peru/Object.h"
#include "peru/pipes/IPipeServer.h"
#include "peru/system/IDynamicLibrary.h"
#include "peru/threads/IMutex.h"
#include "peru/uri/URI.h"
#include "sonora2/boxed/SlavePatience.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/context/SonoraError.h"

#include <chrono>
#include <cstdint>

namespace sonora2::common {

class CSonoraPluginClient;

// What all callers pass to the handler.
constexpr int kSlaveNiceValue = -10;

// The slave serves one source, one format or one query. It starts with the first request for its client and
// ends with the handler. Used under the lock of the owning object, except for checkForSlaveError.
class SONORA2_API CSlaveHandler : public peru::CObject, public peru::IPipeServer::IPipeCreatedListener {
public:
    // `niceValue` is the priority of the process where the user may choose it.
    CSlaveHandler(const P<ISonoraContext>& context, const P<peru::IString>& pluginName, int niceValue);
    ~CSlaveHandler() override; // returns once the process has ended; one that does not is killed

    // The file that errors name in addition.
    void setMedium(const P<peru::IString>& name) { m_medium = name; }
    // Throws CSonoraError if the slave does not start or connect within the deadline of the context.
    P<CSonoraPluginClient> getClient();
    // Throws CSonoraError with the slave's crash report, or with the failure of an earlier call. Any thread.
    void checkForSlaveError();

    // Makes one or more remote calls. An error of the plug-in is thrown as a CSonoraError with the same text.
    // If the slave has died, does not answer in time or answers something else, the slave is ended and the
    // error names the plug-in, the operation and the reason; it is thrown again by every later call.
    template <class Call> auto call(const char* operation, Call&& call) {
        checkForSlaveError();
        if (m_patience) m_patience->start(m_deadline);
        const auto start = std::chrono::steady_clock::now();
        try {
            return call();
        } catch (const CSonoraError&) {
            throw; // not of a remote call
        } catch (const peru::CException& exception) {
            fail(operation, exception, std::chrono::steady_clock::now() - start);
        } catch (const std::exception& exception) { // such as an answer for which there is no memory
            fail(operation, peru::CError(exception.what()), std::chrono::steady_clock::now() - start);
        }
    }
    // What call() counts as late; the deadline of the context by default. 0 means never. While the slave
    // waits for a device, a call may take kCloseDeadlineFactor times the deadline of the context.
    uint32_t getDeadline() const { return m_deadline; }
    void setDeadline(uint32_t milliseconds) { m_deadline = milliseconds; }
    bool hasFailed() const;
    // Passes what the slave has logged on to the context's log. Does nothing if the slave has failed.
    void fetchLog() noexcept;

    void onPipeCreated(peru::IPipeServer* server) override;

private:
    class CEndAction;

    void createSlave();
    [[noreturn]] void fail(const char* operation, const peru::CException& exception,
                           std::chrono::steady_clock::duration elapsed);
    P<peru::IString> readCrashLog();
    P<peru::IString> describeEnd(const char* operation, const peru::CException& exception, bool isLate);
    uint64_t getAllowedTime() const;
    void keepFailure(const P<peru::IString>& failure);
    void endSlave() noexcept;

    int m_niceValue;
    P<peru::IProcess> m_process;
    P<peru::IPipeServer> m_pipeServer;
    P<peru::IPipeClient> m_client;
    P<CSonoraPluginClient> m_pluginClient;
    P<ISonoraContext> m_context;
    P<peru::IString> m_pluginName;
    P<peru::IString> m_medium; // may be empty
    P<peru::CURI> m_crashLog;
    uint32_t m_deadline;          // milliseconds; 0 means without limit
    P<CSlavePatience> m_patience; // empty until the slave has started

    P<peru::IMutex> m_failureMutex; // guards the member below and the reading of the crash log
    P<peru::IString> m_failure;     // empty handle until the slave has failed
};

} // namespace sonora2::common
