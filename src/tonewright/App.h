// The application object: what stands behind the exports.
#pragma once

#include "peru/threads/IMutex.h"
#include "peru/uri/IURI.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/plugins/PluginHandler.h"
#include "tonewright/CancelAutoplay2.h"
#include "tonewright/tonewright.h"
#include "zvr_lang_manager/LanguageId.h"

#include <atomic>

namespace tonewright {

using peru::P;

// What the library can do, for the host, which reads the flags by position.
struct __attribute__((packed)) SFeatures {
    uint32_t size = sizeof(SFeatures);
    uint8_t flags[5] = {1, 1, 1, 1, 1};
};
static_assert(sizeof(SFeatures) == 9);

// A singleton of the global object factory. Started and shut down by one thread while no other uses it; in
// between its operations are safe from any thread, unless told otherwise.
class CApp : public peru::CObject {
public:
    static P<CApp> get();

    // Makes contexts, plug-in handlers and the autoplay canceller. False after a failure, which is in the
    // log; what was made before it stays. Throws what the canceller throws. A started application stays as
    // it is.
    bool init();
    void shutdown();

    // These throw CInvalidObjectStateError while the application is not started.
    P<sonora2::common::ISonoraContext> getReadContext() const { return require(m_readContext); }
    P<sonora2::common::ISonoraContext> getWriteContext() const { return require(m_writeContext); }
    P<sonora2::common::CPluginHandler> getReadPluginHandler() const { return require(m_readPluginHandler); }
    P<sonora2::common::CPluginHandler> getWritePluginHandler() const { return require(m_writePluginHandler); }
    // Keeps plug-in and source state from being opened and closed by two threads at the same time.
    P<peru::IMutex> getServiceLock() const { return require(m_serviceLock); }

    P<peru::IURI> getProgramFolder() const { return m_programFolder; }
    P<peru::IURI> getProductDataFolder() const { return m_productDataFolder; }
    const SFeatures& getFeatures() const { return m_features; }

    // Both belong to the host's window thread.
    void setLanguageId(const zvr_lang::SLanguageId& id) { m_languageId = id; }
    const zvr_lang::SLanguageId& getLanguageId() const { return m_languageId; }
    void setUserDataPath(const P<peru::IString>& path) { m_userDataPath = path; }
    P<peru::IString> getUserDataPath() const { return m_userDataPath; }

    void setDriveChangedCallback(TONEWRIGHT_DriveChangedCallback callback) { m_driveChanged = callback; }

protected:
    CApp();
    ~CApp() override;

private:
    template <class T> P<T> require(const P<T>& object) const {
        if (!object) throwNotStarted();
        return object;
    }
    [[noreturn]] void throwNotStarted() const;
    P<sonora2::common::ISonoraContext> makeContext(uint64_t flags,
                                                   std::initializer_list<const char*> plugins) const;

    const SFeatures m_features;
    zvr_lang::SLanguageId m_languageId;
    P<peru::IString> m_userDataPath;
    P<sonora2::common::ILogManager> m_logProxy; // both contexts write to it
    P<sonora2::common::ISonoraContext> m_readContext;
    P<sonora2::common::ISonoraContext> m_writeContext;
    P<sonora2::common::CPluginHandler> m_readPluginHandler;
    P<sonora2::common::CPluginHandler> m_writePluginHandler;
    P<peru::IMutex> m_serviceLock;
    P<peru::IURI> m_programFolder;
    P<peru::IURI> m_productDataFolder;
    std::atomic<TONEWRIGHT_DriveChangedCallback> m_driveChanged{nullptr};
    P<cap::CCancelAutoplay2> m_cancelAutoplay; // the last thing that init makes
};

} // namespace tonewright
