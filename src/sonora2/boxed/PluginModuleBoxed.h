// A plug-in that runs in slave processes.
#pragma once

#include "peru/Object.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/plugins/ISonoraPlugin.h"

namespace sonora2::common {

class CFormatProbe;

// Has no process of its own: each query starts one, and so does each source and format, which has it until it
// is destroyed.
class SONORA2_API CPluginModuleBoxed : public peru::CObject, public ISonoraPlugin {
public:
    CPluginModuleBoxed(const P<ISonoraContext>& context, const P<peru::IString>& pluginName);
    ~CPluginModuleBoxed() override;

    P<peru::IString> getPluginName() override { return m_name; }
    int getValidTypes() override;
    P<IPluginExtensions> getValidExtensions(int nTypes) override;
    // Both create the object in its slave, so that a plug-in that declines or throws does so here, as one in
    // this process would.
    P<ISource> tryCreateSource(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                               const SSourceParams* pParams) override;
    P<IFormat> tryCreateFormat(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                               const SFormatParams* pParams) override;
    // For many questions of whether the plug-in writes to that target.
    P<CFormatProbe> createFormatProbe(const P<peru::IURI>& uri);
    P<peru::IBase> tryCreateObject(const P<peru::IURI>&, const SObjectParams*) override { return nullptr; }

private:
    P<ISonoraContext> m_context;
    P<peru::IString> m_name;
};

} // namespace sonora2::common
