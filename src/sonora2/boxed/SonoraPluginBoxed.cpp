#include "sonora2/boxed/SonoraPluginBoxed.h"

#include "sonora2/boxed/PluginClient.h"
#include "sonora2/boxed/SlaveHandler.h"

namespace sonora2::common {

CSonoraPluginBoxed::CSonoraPluginBoxed(const P<ISonoraContext>& context, const P<peru::IString>& pluginName)
    : m_context(context), m_pluginName(pluginName) {}

CSonoraPluginBoxed::~CSonoraPluginBoxed() = default;

template <class Ask> auto CSonoraPluginBoxed::ask(const char* operation, Ask ask) {
    const P<CSlaveHandler> slave = peru::make<CSlaveHandler>(m_context, m_pluginName, kSlaveNiceValue);
    const P<CSonoraPluginClient> client = slave->getClient();
    return slave->call(operation, [&] { return ask(*client); });
}

P<peru::IString> CSonoraPluginBoxed::getPluginName() {
    return ask("getPluginName", [](CSonoraPluginClient& client) { return client.getPluginName(); });
}

int CSonoraPluginBoxed::getValidTypes() {
    return ask("getValidTypes", [](CSonoraPluginClient& client) { return client.getValidTypes(); });
}

P<IPluginExtensions> CSonoraPluginBoxed::getValidExtensions(int nTypes) {
    return ask("getValidExtensions",
               [nTypes](CSonoraPluginClient& client) { return client.getValidExtensions(nTypes); });
}

} // namespace sonora2::common
