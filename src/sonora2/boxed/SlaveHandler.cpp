#include "sonora2/boxed/SlaveHandler.h"

#include "InstallFolders.h"
#include "peru/log/ILog.h"
#include "peru/pipes/IPipeManager.h"
#include "peru/remote/MessageOutStream.h"
#include "peru/remote/RemoteException.h"
#include "peru/streams/DataStreams.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/IPathes.h"
#include "peru/system/ISystem.h"
#include "sonora2/boxed/BoxedSettings.h"
#include "sonora2/boxed/PluginClient.h"
#include "sonora2/boxed/RemoteLog.h"
#include "sonora2/boxed/SlaveFiles.h"
#include "sonora2/context/LoggedCall.h"
#include "sonora2/context/SonoraError.h"

#include <algorithm>
#include <atomic>
#include <filesystem>
#include <fstream>
#include <functional>
#include <thread>

namespace sonora2::common {

namespace {

using peru::CString;
using peru::IString;

constexpr const char* kSlaveProgram = "sonora2_slave";
constexpr int kOpenTries = 10;
constexpr uint32_t kOpenPause = 500;  // milliseconds between tries
constexpr uint32_t kEndWait = 2'000;  // milliseconds for a process whose pipe is closed
constexpr uint32_t kKillWait = 5'000; // milliseconds for one that was killed
constexpr size_t kMostReport = 1 << 20;
constexpr char kErrorStart[] = "Error: ";
constexpr int kFirstSignal = 128; // exit codes above it are signals

std::string toPath(const P<peru::IURI>& file) {
    return CString::toStdString(peru::getPathes()->toPlatformPath(file));
}

P<peru::IURI> findProgram() {
    const P<peru::ISystem> system = peru::getSystem();
    std::vector<P<peru::IURI>> folders =
        system->getSearchFolders("TONEWRIGHT_COMPANION_PATH", TONEWRIGHT_COMPANION_FOLDER);
    if (P<peru::IURI> program = system->getProgramFileFolder()) folders.push_back(program);
    for (const P<peru::IURI>& folder : folders) {
        P<peru::IURI> file = folder->appendPath(kSlaveProgram);
        std::error_code ignored;
        if (std::filesystem::is_regular_file(toPath(file), ignored)) return file;
    }
    throw CSonoraError(peru::localize("sonora2.CSlaveHandler.noProgram",
                                      "The program %PROGRAM%, which runs plug-ins, is not installed.",
                                      {{"%PROGRAM%", kSlaveProgram}}));
}

P<peru::CURI> makeCrashLog(const P<ISonoraContext>& context) {
    const P<peru::ISystem> system = peru::getSystem();
    // A folder that was set for this context; programs have no business in their own.
    std::string path;
    const P<peru::IURI> first = context->getBaseDirectories()->getPluginDirectory();
    const P<peru::IURI> program = system->getProgramFileFolder();
    if (first && !(program && first->equals(program))) path = createCrashLog(toPath(first));
    if (path.empty()) path = createCrashLog(toPath(system->getTemporaryFolder()));
    if (path.empty())
        throw CSonoraError(peru::localize("sonora2.CSlaveHandler.noCrashLog",
                                          "No file can be created in the temporary folder %FOLDER%.",
                                          {{"%FOLDER%", peru::getShownName(system->getTemporaryFolder())}}));
    return P<peru::CURI>(peru::getPathes()->fromPlatformPath(CString::fromUTF8(path)));
}

P<IString> makePipeName() {
    static std::atomic<uint32_t> s_counter{0};
    const auto thread = static_cast<uint32_t>(std::hash<std::thread::id>()(std::this_thread::get_id()) >> 4);
    return peru::format("sonora2_slave-%08x-%08x-%08x",
                        static_cast<uint32_t>(peru::getProcessManager()->getCurrentProcessId()), thread,
                        ++s_counter);
}

} // namespace

// Ends the wait for a slave that has died before it could connect.
class CSlaveHandler::CEndAction : public peru::CObject, public peru::IAction {
public:
    explicit CEndAction(const P<peru::IPipeServer>& server) : m_server(server) {}
    void run() override { m_server->stop(); }

private:
    P<peru::IPipeServer> m_server;
};

CSlaveHandler::CSlaveHandler(const P<ISonoraContext>& context, const P<peru::IString>& pluginName,
                             int niceValue)
    : m_niceValue(niceValue), m_context(context), m_pluginName(pluginName), m_crashLog(makeCrashLog(context)),
      m_deadline(getBoxedDeadline(context)), m_failureMutex(peru::getMutexFactory()->createMutex()) {}

CSlaveHandler::~CSlaveHandler() {
    if (m_pluginClient && !hasFailed()) {
        fetchLog();
        callLogged(nullptr, [this] { m_pluginClient->quit(); });
        // The slave ends by itself, which it shows by closing its end.
        int exitCode = 0;
        const uint32_t wait = m_deadline == 0 ? kEndWait : std::min(m_deadline, kEndWait);
        if (m_process && !m_process->wait(wait, exitCode)) m_process->kill();
    }
    endSlave();
    m_pluginClient = nullptr;
    m_client = nullptr;
    m_pipeServer = nullptr;
    std::error_code ignored;
    std::filesystem::remove(toPath(m_crashLog), ignored);
}

// Afterwards there is neither a process nor a connection.
void CSlaveHandler::endSlave() noexcept {
    callLogged(m_context->getLogManager(), [this] {
        if (m_client) m_client->close();
        int exitCode = 0;
        if (!m_process || m_process->wait(0, exitCode)) return;
        m_process->kill();
        m_process->wait(kKillWait, exitCode);
    });
}

P<CSonoraPluginClient> CSlaveHandler::getClient() {
    if (!m_pluginClient) createSlave();
    return m_pluginClient;
}

void CSlaveHandler::createSlave() {
    m_pipeServer = peru::getPipeManager()->createServer(makePipeName());
    m_pipeServer->setDeadline(m_deadline);
    m_client = m_pipeServer->acceptOne(this);
    // Without a pipe nothing was started. Its log entry names the reason.
    if (!m_process)
        throw CSonoraError(peru::localize("sonora2.CSlaveHandler.noPipe",
                                          "The pipe to the plug-in %PLUGIN% could not be created.",
                                          {{"%PLUGIN%", m_pluginName}}));
    m_process->setEndAction(nullptr);
    if (!m_client) {
        endSlave();
        checkForSlaveError();
        throw CSonoraError(
            "CSonoraPluginBoxed::createSlave: Client connection disappeared after connecting.");
    }
    m_patience = peru::make<CSlavePatience>(m_process, uint64_t{m_deadline} * kCloseDeadlineFactor);
    const auto extend = [patience = m_patience] { return patience->extend(); };
    m_client->getInStream()->setExtension(extend);
    m_client->getOutStream()->setExtension(extend);
    const P<CSonoraPluginClient> client = peru::make<CSonoraPluginClient>(
        m_client->getInStream(), m_client->getOutStream(), m_context, m_deadline);
    call("createSlave", [&] {
        const P<peru::CDataOutStream> out =
            peru::make<peru::CDataOutStream>(peru::make<peru::CMessageOutStream>(m_client->getOutStream()));
        m_context->writeTo(out);
        out->flush();
    });
    m_context->setParameter(kBoxedParameterKey, kBoxedWarnedParameter, peru::newString("1"));
    m_pluginClient = client;
    if (const P<ILogManager> log = m_context->getLogManager())
        replayLog(call("getLog", [&] { return client->getLog(); }), *log);
}

void CSlaveHandler::onPipeCreated(peru::IPipeServer* server) {
    const P<peru::IProcessManager> processes = peru::getProcessManager();
    const int logLevel = m_context->getLogManager() ? kSeverityTrace : 0;
    m_process =
        processes->start(findProgram(),
                         {peru::format("%d", processes->getCurrentProcessId()), server->getName(),
                          m_pluginName, CString::fromUTF8(toPath(m_crashLog)), peru::format("%d", logLevel),
                          peru::format("%d", static_cast<int64_t>(m_context->getFlags())),
                          peru::format("%d", m_context->getSwitchB() ? 1 : 0)},
                         m_niceValue);
    m_process->setEndAction(peru::make<CEndAction>(P<peru::IPipeServer>::share(server)));
}

bool CSlaveHandler::hasFailed() const {
    const peru::CMutexLock lock(m_failureMutex);
    return static_cast<bool>(m_failure);
}

void CSlaveHandler::keepFailure(const P<IString>& failure) {
    const peru::CMutexLock lock(m_failureMutex);
    if (!m_failure) m_failure = failure;
}

void CSlaveHandler::checkForSlaveError() {
    const peru::CMutexLock lock(m_failureMutex);
    if (!m_failure) m_failure = readCrashLog();
    if (m_failure) throw CSonoraError(m_failure);
}

// Empty if the slave has not crashed. Otherwise the text for the error; the file is removed.
P<IString> CSlaveHandler::readCrashLog() {
    const std::string path = toPath(m_crashLog);
    std::error_code error;
    const uintmax_t size = std::filesystem::file_size(path, error);
    if (error || size == 0) return nullptr;
    peru::outputDebugString(CString::fromUTF8("sonora2_slave: crash crashlogfile: " + path + "\n"));
    // The report is complete once the process has ended.
    int exitCode = 0;
    if (m_process) m_process->wait(kEndWait, exitCode);
    for (int i = 0; i < kOpenTries; ++i) {
        if (i > 0) peru::getThreadManager()->sleep(kOpenPause);
        std::ifstream file(path);
        if (!file) continue;
        std::string text(kMostReport, '\0'); // the slave may have written without end
        file.read(text.data(), static_cast<std::streamsize>(text.size()));
        text.resize(static_cast<size_t>(file.gcount()));
        file.close();
        std::filesystem::remove(path, error);
        return CString::fromUTF8("CSonoraPluginBoxed::checkForSlaveError: Error in sonora2_slave:\n\n" +
                                 text);
    }
    return CString::fromUTF8(
        "CSonoraPluginBoxed::checkForSlaveError: crash in slave, but errorfile could not be opened!" + path);
}

void CSlaveHandler::fail(const char* operation, const peru::CException& exception,
                         std::chrono::steady_clock::duration elapsed) {
    const P<IString> title = exception.getTitle();
    const bool isRemote = dynamic_cast<const peru::CRemoteException*>(&exception) != nullptr;
    if (isRemote && title->startsWith(kErrorStart)) {
        // The plug-in has thrown; the slave is in order.
        fetchLog();
        const std::string text = CString::toStdString(title);
        throw CSonoraError(CString::fromUTF8(text.substr(sizeof kErrorStart - 1)));
    }
    const bool isLate = m_deadline != 0 && elapsed >= std::chrono::milliseconds(getAllowedTime());
    const P<IString> reason = describeEnd(operation, exception, isLate);
    endSlave();
    {
        const peru::CMutexLock lock(m_failureMutex);
        if (!m_failure) m_failure = readCrashLog();
    }
    keepFailure(reason);
    checkForSlaveError();
    throw CSonoraError(reason);
}

// Milliseconds that the current call had, with its extensions.
uint64_t CSlaveHandler::getAllowedTime() const {
    return m_patience ? m_patience->getAllowed() : m_deadline;
}

P<IString> CSlaveHandler::describeEnd(const char* operation, const peru::CException& exception, bool isLate) {
    const P<IString> where =
        m_medium ? peru::format("%s (%s)", operation, m_medium) : peru::newString(operation);
    // Such an answer closes the connection, upon which the slave ends in order.
    const bool isNonsense = dynamic_cast<const peru::CRemoteException*>(&exception) != nullptr;
    int exitCode = 0;
    // The pipe closes a moment before the process ends.
    if (m_process && m_process->wait(isLate ? 0 : kEndWait, exitCode) && !(isNonsense && exitCode == 0)) {
        if (exitCode > kFirstSignal)
            return peru::localize("sonora2.CSlaveHandler.killed",
                                  "The plug-in %PLUGIN% has crashed in %OPERATION% (signal %SIGNAL%).",
                                  {{"%PLUGIN%", m_pluginName},
                                   {"%OPERATION%", where},
                                   {"%SIGNAL%", peru::format("%d", exitCode - kFirstSignal)}});
        return peru::localize(
            "sonora2.CSlaveHandler.exited",
            "The process of the plug-in %PLUGIN% has ended in %OPERATION% (exit code %CODE%).",
            {{"%PLUGIN%", m_pluginName}, {"%OPERATION%", where}, {"%CODE%", peru::format("%d", exitCode)}});
    }
    if (isLate)
        return peru::localize(
            "sonora2.CSlaveHandler.hanging",
            "The plug-in %PLUGIN% does not respond in %OPERATION%; it was ended after "
            "%SECONDS% s.",
            {{"%PLUGIN%", m_pluginName},
             {"%OPERATION%", where},
             {"%SECONDS%", peru::format("%g", static_cast<double>(getAllowedTime()) / 1000.0)}});
    const P<IString> description = exception.getDescription();
    return peru::localize("sonora2.CSlaveHandler.connectionFailed",
                          "The connection to the plug-in %PLUGIN% has failed in %OPERATION% (%REASON%).",
                          {{"%PLUGIN%", m_pluginName},
                           {"%OPERATION%", where},
                           {"%REASON%", description->isEmpty() ? exception.getTitle() : description}});
}

void CSlaveHandler::fetchLog() noexcept {
    const P<ILogManager> log = m_context->getLogManager();
    if (!log || !m_pluginClient || hasFailed()) return;
    callLogged(nullptr, [&] { replayLog(m_pluginClient->getLog(), *log); });
}

} // namespace sonora2::common
