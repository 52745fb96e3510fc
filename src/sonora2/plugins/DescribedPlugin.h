// A plug-in whose library is loaded when it is needed.
#pragma once

#include "sonora2/context/ISonoraContext.h"
#include "sonora2/plugins/ILazyPlugin.h"
#include "sonora2/plugins/PluginDescription.h"

#include <mutex>

namespace sonora2::common {

// Answers from the description until it is asked for media. Objects created by the plug-in must be destroyed
// before it. Thread-safe if the plug-in is.
class SONORA2_API CDescribedPlugin : public peru::CObject, public ISonoraPlugin, public ILazyPlugin {
public:
    CDescribedPlugin(const P<ISonoraContext>& context, const P<peru::IURI>& library,
                     SPluginDescription description);

    P<peru::IString> getPluginName() override;
    int getValidTypes() override;
    P<IPluginExtensions> getValidExtensions(int nTypes) override;
    // These throw CSonoraError if the library cannot be loaded, which is logged once.
    P<ISource> tryCreateSource(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                               const SSourceParams* pParams) override;
    P<IFormat> tryCreateFormat(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                               const SFormatParams* pParams) override;
    P<peru::IBase> tryCreateObject(const P<peru::IURI>& uri, const SObjectParams* pParams) override;
    void load() override;

protected:
    ~CDescribedPlugin() override;

private:
    P<ISonoraPlugin> requirePlugin();
    // Empty as long as the description's answer holds.
    P<ISonoraPlugin> findBetterSource();

    const P<ISonoraContext> m_context;
    const P<peru::IURI> m_library;
    const SPluginDescription m_description;
    std::mutex m_mutex; // guards the members below
    P<ISonoraPlugin> m_plugin;
    bool m_isWrong = false;   // the library answers differently
    bool m_hasFailed = false; // and the failure is logged
};

// Logs why a plug-in's library cannot be used.
void logLoadFailure(const P<ISonoraContext>& context, const peru::CException& failure);

} // namespace sonora2::common
