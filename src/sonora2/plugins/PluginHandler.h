// Loads the plug-ins and selects the one that reads or writes a URI.
#pragma once

#include "peru/threads/IMutex.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/context/LastFailure.h"
#include "sonora2/media/ISonoraPicture.h"
#include "sonora2/plugins/IPluginHandler.h"
#include "sonora2/plugins/IPluginPreference.h"

#include <vector>

namespace sonora2::common {

// Plug-ins that list the URI's extension are tried in the order of the context's list; a source is accepted
// once it has actually been opened. Exceptions of a plug-in are logged and never reach the caller. A create
// call for a source or a format that returns empty records the reason as this thread's last failure.
//
// The plug-ins stay loaded for the handler's lifetime; every object created by them must be destroyed first.
class SONORA2_API CPluginHandler : public peru::CObject, public IPluginHandler {
public:
    // Loads the context's plug-ins, or the default ones if it names none; failures to load are only logged.
    // The preference may be empty. `boxed` runs all plug-ins in slave processes; otherwise the context names
    // those that do (see BoxedSettings.h).
    explicit CPluginHandler(const P<ISonoraContext>& context, bool boxed = false,
                            const peru::CStringArg& uriSuffix = "",
                            const P<IPluginPreference>& preference = nullptr);
    ~CPluginHandler() override;

    P<ISonoraPicture> createPreviewImage(const P<peru::IURI>& uri, double time, int& width,
                                         int& height) override;
    P<ISource> createSource(const P<peru::IURI>& uri, const SSourceParams* params) override;
    P<IVideoSource> createVideoSource(const P<peru::IURI>& uri, const SSourceParams* params) override;
    P<IAudioSource> createAudioSource(const P<peru::IURI>& uri, const SSourceParams* params) override;
    P<IAudioSource> createAudioSource(const P<peru::IURI>& uri, int rate, int channels, int bytesPerSample,
                                      bool keepOpened) override;
    P<IFormat> createFormat(const P<peru::IURI>& uri, const SFormatParams* params) override;
    P<IVideoFormat> createVideoFormat(const P<peru::IURI>& uri, const SFormatParams* params) override;
    P<IAudioFormat> createAudioFormat(const P<peru::IURI>& uri, const SFormatParams* params) override;
    P<IAudioFormat> createAudioFormat(const P<peru::IURI>& uri, int rate, int channels,
                                      int bytesPerSample) override;
    P<peru::IBase> createObject(const P<peru::IURI>& uri, const SObjectParams* params) override;
    P<IPluginExtensions> getValidExtensions(int mask) override;
    void loadPlugin(const peru::CStringArg& name) override;
    bool isBoxed() override { return m_boxed; }
    int getPluginCount() override { return static_cast<int>(m_plugins.size()); }
    P<ISonoraPlugin> getPlugin(int index) override; // throws CInvalidArgError
    void setVerifyByOpening(bool verify) override;
    bool getVerifyByOpening() override;
    void setURISuffix(const peru::CStringArg& suffix) override;
    P<peru::IString> getURISuffix() override;
    P<ISonoraPlugin> getPlainPlugin(int index) override; // throws CInvalidArgError

    // `plugin` creates objects, `plainPlugin` is asked for extensions and never starts a slave; for plug-ins
    // that run in this process both are the same object. Must not be called once create calls may run.
    void addPlugin(const P<ISonoraPlugin>& plugin, const P<ISonoraPlugin>& plainPlugin);

private:
    struct STexts;    // log messages for a failing plug-in
    struct SAttempts; // what the candidates for a URI did

    P<ISource> findSource(const P<peru::IURI>& uri, int mask, const SSourceParams* params);
    P<IFormat> findFormat(const P<peru::IURI>& uri, int mask, const SFormatParams* params);
    template <class T, class TryCreate> P<T> findObject(const P<peru::IURI>& uri, int mask,
                                                        const STexts& texts, SAttempts& attempts,
                                                        TryCreate tryCreate);
    SFailure explainSource(const P<peru::IURI>& uri, int mask, const SAttempts& attempts,
                           const SSourceParams& wanted) const;
    bool passesOpening(const P<ISource>& source, bool keepOpened) const;
    template <class Call> void askPreference(const P<peru::IURI>& uri, Call call);
    P<ISonoraPlugin> findPreferred(int mask, const P<peru::IURI>& uri);
    void storePreferred(int mask, const P<peru::IURI>& uri, ISonoraPlugin& plugin);
    P<peru::IString> getShownName(const P<peru::IURI>& uri) const;
    P<peru::IURI> findLibrary(const P<peru::IString>& fileName) const;
    P<ISonoraPlugin> makeBoxed(ISonoraPlugin& module, const P<peru::IURI>& library) const;
    void log(int32_t severity, const P<peru::IString>& text) const;

    std::vector<P<ISonoraPlugin>> m_plugins;
    std::vector<P<ISonoraPlugin>> m_plainPlugins; // parallel
    P<ISonoraContext> m_context;
    bool m_boxed;
    bool m_verifyByOpening = true; // guarded by m_lock, like the suffix
    P<peru::IString> m_uriSuffix;
    P<IPluginPreference> m_preference;
    P<peru::IMutex> m_lock; // held during every create call
};

} // namespace sonora2::common
