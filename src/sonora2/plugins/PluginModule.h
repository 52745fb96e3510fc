// A plug-in running in this process.
#pragma once

#include "peru/system/IDynamicLibrary.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/plugins/ILazyPlugin.h"
#include "sonora2/plugins/ISonoraPlugin.h"

#include <string>

namespace sonora2::common {

// Keeps the library loaded. Objects created by the plug-in do not, and must be destroyed before the module.
class SONORA2_API CPluginModule : public peru::CObject, public ISonoraPlugin, public ILazyPlugin {
public:
    // Loads the library and creates its plug-in. Throws CSonoraError, which names the library.
    CPluginModule(const P<ISonoraContext>& context, const P<peru::IURI>& library);
    ~CPluginModule() override;

    P<peru::IString> getPluginName() override;
    int getValidTypes() override;
    P<IPluginExtensions> getValidExtensions(int nTypes) override;
    P<ISource> tryCreateSource(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                               const SSourceParams* pParams) override;
    P<IFormat> tryCreateFormat(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                               const SFormatParams* pParams) override;
    P<peru::IBase> tryCreateObject(const P<peru::IURI>& uri, const SObjectParams* pParams) override;
    void load() override; // no effect if the plug-in has nothing left to load

private:
    std::string m_name;
    P<ISonoraPlugin> m_plugin; // its code is in the library: released first
    P<peru::IDynamicLibrary> m_library;
};

} // namespace sonora2::common
