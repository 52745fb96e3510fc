#include "sonora2_slave/Slave.h"

#include "InstallFolders.h"
#include "peru/pipes/IPipeManager.h"
#include "peru/streams/DataStreams.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/IPathes.h"
#include "peru/system/ISystem.h"
#include "peru/uri/URI.h"
#include "sonora2/boxed/BoxedSettings.h"
#include "sonora2/boxed/ISonoraPluginRemote.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/plugins/ILazyPlugin.h"
#include "sonora2/plugins/PluginExtensions.h"
#include "sonora2/plugins/PluginModule.h"
#include "sonora2/samplerateconverter/IResampler.h"
#include "sonora2_slave/CrashDetails.h"
#include "sonora2_slave/ServedMedia.h"
#include "sonora2_slave/sandbox/JobAccess.h"

#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <limits>
#include <unistd.h>

namespace slave {

using namespace sonora2::common;
using peru::CString;
using Remote = ISonoraPluginRemote;

namespace {

#ifdef __SANITIZE_THREAD__ // delivers signals late; the sandbox sends one to each thread
constexpr bool kHasSandbox = false;
#else
constexpr bool kHasSandbox = true;
#endif

constexpr const char* kSandboxVariable = "TONEWRIGHT_BOXED_SANDBOX"; // "none": for debugging
constexpr int kPollInterval = 100; // milliseconds; data wakes the thread earlier

// The host's input and output may carry media or keystrokes. What a plug-in prints is a message. A target
// may be "/dev/stdout".
void redirectStandardFiles(bool isWritten) {
    const int nothing = ::open("/dev/null", O_RDONLY | O_CLOEXEC);
    if (nothing >= 0) ::dup2(nothing, STDIN_FILENO);
    if (nothing >= 0) ::close(nothing);
    if (!isWritten) ::dup2(STDERR_FILENO, STDOUT_FILENO);
}

std::string toPath(const P<peru::IURI>& file) {
    return CString::toStdString(peru::getPathes()->toPlatformPath(file));
}

} // namespace

class CSlave::CQuit : public peru::CRemoteVoid {
public:
    explicit CQuit(CSlave& slave) : CRemoteVoid("Quit"), m_slave(slave) {}
    void execute() override {
        m_slave.m_hasQuit = true;
        m_slave.m_remote->stopWorkInThread();
    }

private:
    CSlave& m_slave;
};

CSlave::CSlave(const SSlaveOptions& options)
    : m_options(options), m_log(peru::make<CSlaveLog>(options.logLevel)),
      m_context(peru::make<sonora2::audio::CSonoraContextAudio>()) {
    CCrashDetails::setPlugin(m_options.pluginName);
}

CSlave::~CSlave() = default;

bool CSlave::run() {
    m_pipe = peru::getPipeManager()->createClient(CString::fromUTF8(m_options.pipeName));
    if (!m_pipe->connect()) return false;
    readContext();
    loadPlugin();
    m_remote = peru::make<peru::CRemoteStreamClient>(m_pipe->getInStream(), m_pipe->getOutStream());
    servePlugin();
    m_remote->startWorkInThread(kPollInterval);
    while (!m_remote->waitForWorkEnd(std::numeric_limits<int32_t>::max())) {
    }
    if (!m_hasQuit) return true;
    // The remote end may not be destroyed by its own thread, and its procedures hold sources and formats.
    m_remote = nullptr;
    m_plugin = nullptr;
    return true;
}

void CSlave::readContext() {
    m_context->readFrom(peru::make<peru::CDataInStream>(m_pipe->getInStream()));
    m_context->setFlags(static_cast<uint64_t>(m_options.flags));
    m_context->setSwitchB(m_options.switchB);
    m_context->setLogManager(m_log);
}

P<peru::IURI> CSlave::findLibrary() const {
    const P<peru::IString> stated = m_context->getParameter(
        kBoxedParameterKey, CString::fromUTF8(kBoxedLibraryParameter + m_options.pluginName));
    if (!stated->isEmpty()) return peru::make<peru::CURI>(stated);
    std::vector<P<peru::IURI>> folders =
        peru::getSystem()->getSearchFolders("TONEWRIGHT_PLUGIN_PATH", TONEWRIGHT_PLUGIN_FOLDER);
    folders.push_back(peru::getSystem()->getProgramFileFolder());
    for (const P<peru::IURI>& folder : folders) {
        P<peru::IURI> file = folder->appendPath(CString::fromUTF8(m_options.pluginName + ".so"));
        std::error_code ignored;
        if (std::filesystem::is_regular_file(toPath(file), ignored)) return file;
    }
    throw CSonoraError(peru::format("could not load plugin: %s", (m_options.pluginName + ".so").c_str()));
}

void CSlave::loadPlugin() {
    const CCrashDetails::CCall call("load");
    try {
        m_plugin = peru::make<CPluginModule>(m_context, findLibrary());
    } catch (const peru::CException& exception) {
        m_loadFailure = exception.clone();
    }
}

ISonoraPlugin& CSlave::requirePlugin() const {
    if (m_loadFailure) m_loadFailure->raise();
    return *m_plugin;
}

// Called on the serving thread, before the plug-in gets to see the medium.
void CSlave::beforeMedia(const P<peru::IURI>& medium, bool isWritten) {
    if (!medium) throw CSonoraError("a medium is missing");
    CCrashDetails::setFile(CString::toStdString(peru::getShownName(medium)));
    if (!m_isConfined) confine(medium, isWritten);
}

// A plug-in may need the filter later. Without it all media can be read in their own format.
void CSlave::loadResampler() const {
    try {
        sonora2::samplerateconverter::getResamplerLibrary();
    } catch (const peru::CException& exception) {
        m_log->log(kSeverityWarning, exception.getDescription());
    }
}

// For good: a slave that is asked for a second medium cannot open it.
void CSlave::confine(const P<peru::IURI>& medium, bool isWritten) {
    // Libraries that are not loaded yet cannot be read later.
    if (const auto lazy = peru::tryCast<ILazyPlugin>(m_plugin)) lazy->load();
    loadResampler();
    redirectStandardFiles(isWritten);
    const char* mode = std::getenv(kSandboxVariable);
    if (kHasSandbox && (!mode || std::strcmp(mode, "none") != 0)) {
        SSandbox sandbox = isWritten ? allowWriting(toPath(medium)) : allowReading(toPath(medium));
        sandbox.memoryLimit = uint64_t{getBoxedMemory(m_context)} << 20;
        const std::vector<std::string> lacking = enterSandbox(sandbox);
        if (m_context->getParameter(kBoxedParameterKey, kBoxedWarnedParameter)->isEmpty())
            for (const std::string& text : lacking) m_log->log(kSeverityWarning, CString::fromUTF8(text));
    }
    m_isConfined = true;
}

void CSlave::servePlugin() {
    peru::CRemoteStreamClient& remote = *m_remote;
    remote.addProc(peru::make<CQuit>(*this));
    addFunction<Remote::getLogFunction>(remote, "getLog",
                                        [this](auto& proc) { proc.result->setValue(m_log->take()); });
    addFunction<Remote::getPluginNameFunction>(remote, "getPluginName", [this](auto& proc) {
        proc.result->setValue(requirePlugin().getPluginName());
    });
    addFunction<Remote::getValidTypesFunction>(remote, "getValidTypes", [this](auto& proc) {
        proc.result->setValue(requirePlugin().getValidTypes());
    });
    addFunction<Remote::getValidExtensionsFunction>(remote, "getValidExtensions", [this](auto& proc) {
        const P<IPluginExtensions> list = requirePlugin().getValidExtensions(proc.nTypes->getValue());
        const auto copy = peru::make<CPluginExtensions>();
        for (int i = 0; list && i < list->getCount(); ++i) copy->addExtension(list->getExtension(i));
        proc.result->setValue(copy);
    });
    addFunction<Remote::tryCreateSourceFunction>(remote, "tryCreateSource", [this](auto& proc) {
        const P<peru::IURI> uri = proc.uri->getValue();
        beforeMedia(uri, false);
        const P<ISource> source = requirePlugin().tryCreateSource(
            uri, proc.nTypes->getValue(), proc.bDontCloseAfterTesting->getValue(), &proc.pParams->getValue());
        proc.result->setValue(source ? peru::make<CRemoteCreated>() : nullptr);
        if (source) serveSource(*m_remote, source, m_context->getMemoryManager(), m_log);
    });
    addFunction<Remote::tryCreateFormatFunction>(remote, "tryCreateFormat", [this](auto& proc) {
        const P<peru::IURI> uri = proc.uri->getValue();
        beforeMedia(uri, true);
        const P<IFormat> format = requirePlugin().tryCreateFormat(
            uri, proc.nTypes->getValue(), proc.bDontCloseAfterTesting->getValue(), &proc.pParams->getValue());
        proc.result->setValue(format ? peru::make<CRemoteCreated>() : nullptr);
        if (format) serveFormat(*m_remote, format, m_context->getMemoryManager(), m_log);
    });
}

} // namespace slave
