// A plug-in that loads its code when it is needed.
#pragma once

#include "peru/Object.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/plugins/ILazyPlugin.h"
#include "sonora2/plugins/ISonoraPlugin.h"

#include <mutex>

namespace sonora2::plugins::av {

using peru::P;

// Thread-safe. The derived class selects extensions from the common table.
class CLazyPlugin : public peru::CObject, public common::ISonoraPlugin, public common::ILazyPlugin {
public:
    P<peru::IString> getPluginName() override;
    int getValidTypes() override;
    P<common::IPluginExtensions> getValidExtensions(int nTypes) override;
    P<common::ISource> tryCreateSource(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                                       const SSourceParams* pParams) override;
    P<common::IFormat> tryCreateFormat(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                                       const SFormatParams* pParams) override;
    P<peru::IBase> tryCreateObject(const P<peru::IURI>& uri, const SObjectParams* pParams) override;
    void load() override;

protected:
    CLazyPlugin(const P<common::ISonoraContext>& context, const char* name, bool isForWindowsMedia);
    ~CLazyPlugin() override;

private:
    const P<common::ISonoraContext> m_context;
    const char* const m_name;
    const bool m_isForWindowsMedia;
    std::mutex m_mutex; // guards the plug-in's creation
    P<common::ISonoraPlugin> m_plugin;
};

} // namespace sonora2::plugins::av
