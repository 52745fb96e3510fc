#include "tonewright/App.h"

#include "disciopp/LazyLibrary.h"
#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/log/ILog.h"
#include "peru/system/ISystem.h"
#include "peru/uri/URI.h"
#include "sonora2/boxed/BoxedSettings.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/plugins/MediaEnvironment.h"
#include "tonewright/AudioToolsHandler.h"
#include "tonewright/DiscStreamFactory.h"
#include "tonewright/Quietly.h"
#include "tonewright/SonoraLogManagerProxy.h"

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <set>
#include <string_view>

namespace tonewright {

using sonora2::common::CPluginHandler;
using sonora2::common::ISonoraContext;

namespace {

// Passed to the plug-ins, which interpret them.
constexpr uint64_t kReadFlags = 0x23E8;
constexpr uint64_t kWriteFlags = 0x3C8;

// In order of preference.
constexpr const char* kReadPlugins[] = {"sonora2_flac", "sonora2_decmpa",  "sonora2_vorbis", "sonora2_wav",
                                        "sonora2_wmf",  "sonora2_dsgraph", "sonora2_discio"};
constexpr const char* kWritePlugins[] = {"sonora2_flac", "sonora2_l3codec", "sonora2_vorbis", "sonora2_wav",
                                         "sonora2_wmf"};

// They read many formats of unknown origin.
constexpr const char* kBoxedPlugins = "sonora2_dsgraph,sonora2_wmf";

constexpr const char* kProductFolder = "Zelvanor Tonewright 4/";

// Also in the plug-ins' folder: a library that is loaded on demand, and sonora2_dsgraph under another name.
constexpr std::string_view kOtherModules[] = {"audiotools", "sonora2_ffmpeg"};

bool isStandardPlugin(std::string_view name) {
    return std::ranges::count(kOtherModules, name) + std::ranges::count(kReadPlugins, name) +
               std::ranges::count(kWritePlugins, name) >
           0;
}

// Names of the plug-ins that the user has added, in alphabetical order: every NAME.so in the folders of
// TONEWRIGHT_PLUGIN_PATH that is not a standard plug-in. Ordinary shared libraries (lib*.so) are skipped, so
// the folder of a build tree may be named as well.
std::set<std::string> findAddedPlugins() {
    std::set<std::string> names;
    const char* value = std::getenv("TONEWRIGHT_PLUGIN_PATH");
    std::string_view list = value ? value : "";
    while (!list.empty()) {
        const std::filesystem::path folder = list.substr(0, list.find(':'));
        list.remove_prefix(std::min(list.size(), folder.native().size() + 1));
        if (!folder.is_absolute()) continue;
        std::error_code error; // an unreadable folder has no plug-ins
        for (auto i = std::filesystem::directory_iterator(folder, error);
             !error && i != std::filesystem::directory_iterator(); i.increment(error)) {
            const std::string name = i->path().stem();
            std::error_code ignored;
            if (i->path().extension() == ".so" && !name.starts_with("lib") && !isStandardPlugin(name) &&
                i->is_regular_file(ignored))
                names.insert(name);
        }
    }
    return names;
}

// TONEWRIGHT_BOXED lists further plug-ins that run in a process of their own, "all", or "none".
// TONEWRIGHT_BOXED_DEADLINE is the number of milliseconds after which such a process counts as hanging,
// TONEWRIGHT_BOXED_MEMORY the number of MiB that it may use.
void setBoxedPlugins(ISonoraContext& context) {
    using namespace sonora2::common;
    const auto set = [&](const char* parameter, const std::string& value) {
        context.setParameter(kBoxedParameterKey, parameter, peru::CString::fromUTF8(value));
    };
    const char* value = std::getenv("TONEWRIGHT_BOXED");
    const std::string list = value ? value : "";
    if (list != "none")
        set(kBoxedPluginsParameter, list.empty() ? kBoxedPlugins : list + "," + kBoxedPlugins);
    if (const char* deadline = std::getenv("TONEWRIGHT_BOXED_DEADLINE"))
        set(kBoxedDeadlineParameter, deadline);
    if (const char* memory = std::getenv("TONEWRIGHT_BOXED_MEMORY")) set(kBoxedMemoryParameter, memory);
}

bool fail(const char* text) {
    peru::getLogManager()->info(peru::CString::fromUTF8("tonewright_shared"), text);
    return false;
}

// Empty after an exception, whose reason is in the log.
template <class T, class Make> P<T> attempt(Make make) {
    P<T> made;
    quietly("CApp::init", [&] { made = make(); });
    return made;
}

} // namespace

CApp::CApp() : m_userDataPath(peru::CString::empty()) {}
CApp::~CApp() = default;

P<CApp> CApp::get() {
    static const peru::CGlobalObjFactory::SKey kKey;
    return peru::CGlobalObjFactory::get<CApp>(kKey, [] { return P<CApp>(new CApp); });
}

void CApp::throwNotStarted() const {
    throw peru::CInvalidObjectStateError("TONEWRIGHT_InitStartup has not been called or has failed",
                                         P<peru::IBase>::share(const_cast<CApp*>(this)));
}

bool CApp::init() {
    if (m_cancelAutoplay) return true;
    const P<peru::ISystem> system = peru::getSystem();
    const P<peru::IURI> executable = system->getMainExecutableFile();
    if (!executable) return fail("CApp::init could not get main executable file");
    m_programFolder = executable->getParent();
    if (!m_programFolder) return fail("CApp::init could not parent folder of main executable file");
    m_productDataFolder = peru::make<peru::CURI>("", "", "", "", kProductFolder, "", "")
                              ->resolveAgainst(system->getDataFolder());

    m_logProxy = peru::make<CSonoraLogManagerProxy>();
    m_readContext = attempt<ISonoraContext>([this] { return makeContext(kReadFlags, kReadPlugins); });
    if (!m_readContext) return fail("CApp::init could not create SonoraReadContext");
    m_readPluginHandler =
        attempt<CPluginHandler>([this] { return peru::make<CPluginHandler>(m_readContext, false); });
    if (!m_readPluginHandler) return fail("CApp::init could not create SonoraReadPluginHandler");

    m_writeContext = attempt<ISonoraContext>([this] { return makeContext(kWriteFlags, kWritePlugins); });
    if (!m_writeContext) return fail("CApp::init could not create SonoraWriteContext");
    m_writePluginHandler =
        attempt<CPluginHandler>([this] { return peru::make<CPluginHandler>(m_writeContext, false); });
    if (!m_writePluginHandler) return fail("CApp::init could not create SonoraWritePluginHandler");
    sonora2::common::setMediaEnvironment(
        {m_readContext, m_readPluginHandler, m_writeContext, m_writePluginHandler});

    sonora2::audio::setAudioToolsHandlerFactory(audiotoolshandler::findAudioToolsHandler);

    m_serviceLock = peru::getMutexFactory()->createMutex();
    m_driveChanged = nullptr;
    m_discStreams = peru::make<CDiscStreamFactory>();
    peru::getStreamManager()->addFactory(m_discStreams);
    m_cancelAutoplay = peru::make<cap::CCancelAutoplay2>();
    return true;
}

P<ISonoraContext> CApp::makeContext(uint64_t flags, std::span<const char* const> plugins) const {
    P<ISonoraContext> context = peru::make<sonora2::audio::CSonoraContextAudio>();
    context->setLogManager(m_logProxy);
    context->getBaseDirectories()->setDataDirectory(m_productDataFolder);
    context->setFlags(flags);
    for (const char* name : plugins) context->addPluginName(name);
    for (const std::string& name : findAddedPlugins()) context->addPluginName(peru::CString::fromUTF8(name));
    context->setSwitchB(true);
    setBoxedPlugins(*context);
    return context;
}

void CApp::setDriveChangedCallback(TONEWRIGHT_DriveChangedCallback callback) {
    m_driveChanged = callback;
    if (!m_driveManager) {
        if (!callback) return;
        m_driveManager = disciopp::getLibrary()->getDriveManager();
    }
    if (!callback) {
        m_driveManager->removeListener(this);
        return;
    }
    m_driveManager->start();
    m_driveManager->addListener(this);
}

void CApp::driveChanged(const P<disciopp::IDrive>& drive, int event) {
    if (const TONEWRIGHT_DriveChangedCallback callback = m_driveChanged) callback(drive->getHandle(), event);
}

P<CNormalizeHandler> CApp::getNormalizeHandler() {
    std::scoped_lock lock(m_normalizeMutex);
    if (!m_normalizeHandler) m_normalizeHandler = peru::make<CNormalizeHandler>();
    return m_normalizeHandler;
}

void CApp::shutdown() {
    if (m_discStreams) peru::getStreamManager()->removeFactory(m_discStreams);
    m_discStreams.reset();
    if (m_driveManager) {
        m_driveManager->removeListener(this);
        m_driveManager->stop();
        m_driveManager.reset();
    }
    m_driveChanged = nullptr;
    sonora2::audio::setAudioToolsHandlerFactory(nullptr);
    {
        std::scoped_lock lock(m_normalizeMutex);
        m_normalizeHandler.reset();
    }
    sonora2::common::setMediaEnvironment({});
    m_readPluginHandler.reset();
    m_writePluginHandler.reset();
    m_readContext.reset();
    m_writeContext.reset();
    m_cancelAutoplay.reset();
}

} // namespace tonewright
