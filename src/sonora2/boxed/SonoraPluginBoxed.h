// A plug-in in a slave process that lives for one call only.
#pragma once

#include "peru/Object.h"
#include "sonora2/boxed/RemoteTools.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/plugins/ISonoraPlugin.h"

namespace sonora2::common {

// Answers questions about a plug-in. Creates nothing: sources and formats have a slave of their own, see
// CEncapsulatedSource and CEncapsulatedFormat. Throws CSonoraError.
class SONORA2_API CSonoraPluginBoxed : public peru::CObject, public ISonoraPlugin {
public:
    CSonoraPluginBoxed(const P<ISonoraContext>& context, const P<peru::IString>& pluginName);
    ~CSonoraPluginBoxed() override;

    P<peru::IString> getPluginName() override;
    int getValidTypes() override;
    P<IPluginExtensions> getValidExtensions(int nTypes) override;
    P<ISource> tryCreateSource(const P<peru::IURI>&, int, bool, const SSourceParams*) override {
        return nullptr;
    }
    P<IFormat> tryCreateFormat(const P<peru::IURI>&, int, bool, const SFormatParams*) override {
        return nullptr;
    }
    P<peru::IBase> tryCreateObject(const P<peru::IURI>&, const SObjectParams*) override { return nullptr; }

private:
    template <class Ask> auto ask(const char* operation, Ask ask);

    P<ISonoraContext> m_context;
    P<peru::IString> m_pluginName;
};

} // namespace sonora2::common
