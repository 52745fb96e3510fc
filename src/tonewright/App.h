// The application object, the state that the exports share.
#pragma once

#include "disciopp/IDrive.h"
#include "peru/streams/IStreamManager.h"
#include "peru/threads/IMutex.h"
#include "peru/uri/IURI.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/plugins/PluginHandler.h"
#include "tonewright/CancelAutoplay2.h"
#include "tonewright/NormalizeHandler.h"
#include "tonewright/tonewright.h"
#include "zvr_lang_manager/LanguageId.h"

#include <atomic>
#include <mutex>
#include <span>

namespace tonewright {

using peru::P;

// Feature flags of the library. Hosts read them by position.
struct __attribute__((packed)) SFeatures {
    uint32_t size = sizeof(SFeatures);
    uint8_t flags[5] = {1, 1, 1, 1, 1};
};
static_assert(sizeof(SFeatures) == 9);

// A singleton of the global object factory. init and shutdown must not run concurrently with anything else;
// between them all operations are thread-safe unless stated otherwise.
class CApp : public peru::CObject, public disciopp::IDriveManagerListener {
public:
    static P<CApp> get();

    // Creates contexts, plug-in handlers and the autoplay canceller. Logs a failure and returns false;
    // objects created before it remain. Exceptions of the canceller propagate. No effect when already
    // started.
    bool init();
    void shutdown();

    // These throw CInvalidObjectStateError while the application is not started.
    P<sonora2::common::ISonoraContext> getReadContext() const { return require(m_readContext); }
    P<sonora2::common::ISonoraContext> getWriteContext() const { return require(m_writeContext); }
    P<sonora2::common::CPluginHandler> getReadPluginHandler() const { return require(m_readPluginHandler); }
    P<sonora2::common::CPluginHandler> getWritePluginHandler() const { return require(m_writePluginHandler); }
    // Serialises opening and closing of plug-ins and sources.
    P<peru::IMutex> getServiceLock() const { return require(m_serviceLock); }

    // Loads the library that measures loudness on the first call, so that a start does not wait for it.
    // Throws CError if it is missing; the next call tries again.
    P<CNormalizeHandler> getNormalizeHandler();

    P<peru::IURI> getProgramFolder() const { return m_programFolder; }
    P<peru::IURI> getProductDataFolder() const { return m_productDataFolder; }
    const SFeatures& getFeatures() const { return m_features; }

    // Language and user data path are only accessed by the host's window thread.
    void setLanguageId(const zvr_lang::SLanguageId& id) { m_languageId = id; }
    const zvr_lang::SLanguageId& getLanguageId() const { return m_languageId; }
    void setUserDataPath(const P<peru::IString>& path) { m_userDataPath = path; }
    P<peru::IString> getUserDataPath() const { return m_userDataPath; }

    // Starts or, for null, ends the watching of the drives. Loads the disc library.
    void setDriveChangedCallback(TONEWRIGHT_DriveChangedCallback callback);
    void driveChanged(const P<disciopp::IDrive>& drive, int event) override;

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
                                                   std::span<const char* const> plugins) const;

    const SFeatures m_features;
    zvr_lang::SLanguageId m_languageId;
    P<peru::IString> m_userDataPath;
    P<sonora2::common::ILogManager> m_logProxy; // used by both contexts
    P<sonora2::common::ISonoraContext> m_readContext;
    P<sonora2::common::ISonoraContext> m_writeContext;
    P<sonora2::common::CPluginHandler> m_readPluginHandler;
    P<sonora2::common::CPluginHandler> m_writePluginHandler;
    P<peru::IMutex> m_serviceLock;
    P<peru::IURI> m_programFolder;
    P<peru::IURI> m_productDataFolder;
    std::atomic<TONEWRIGHT_DriveChangedCallback> m_driveChanged{nullptr};
    P<peru::IStreamFactory> m_discStreams;
    P<disciopp::IDriveManager> m_driveManager; // fetched on first need
    std::mutex m_normalizeMutex;
    P<CNormalizeHandler> m_normalizeHandler;   // guarded by the mutex; empty until it is needed
    P<cap::CCancelAutoplay2> m_cancelAutoplay; // created last, so it marks a complete init
};

} // namespace tonewright
