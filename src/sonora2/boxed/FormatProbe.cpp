#include "sonora2/boxed/FormatProbe.h"

#include "peru/system/IPathes.h"
#include "sonora2/boxed/FormatClient.h"
#include "sonora2/boxed/PluginClient.h"
#include "sonora2/media/IFormatSettings.h"

namespace sonora2::common {

CFormatProbe::CFormatProbe(const P<ISonoraContext>& context, const P<peru::IString>& pluginName,
                           const P<peru::IURI>& uri)
    : m_context(context), m_pluginName(pluginName), m_uri(uri) {}

CFormatProbe::~CFormatProbe() = default;

std::optional<uint32_t> CFormatProbe::ask(const ISonoraPlugin::SFormatParams& params) {
    if (!m_slave) {
        m_slave = peru::make<CSlaveHandler>(m_context, m_pluginName, kSlaveNiceValue);
        m_slave->setMedium(peru::getShownName(m_uri));
        m_plugin = m_slave->getClient();
    }
    if (!m_plugin) throw CSonoraError("the slave has not started");
    return m_slave->call("tryCreateFormat", [&]() -> std::optional<uint32_t> {
        const P<CFormatClient> format(m_plugin->tryCreateFormat(m_uri, kAudioFormat, false, &params));
        if (!format) return {};
        const P<CRemoteMediaState> state = format->getState();
        if (!(state->facets & kFacetFormatSettings)) return uint32_t{IFormatSettings::kAllSettings};
        return state->usedSettings;
    });
}

} // namespace sonora2::common
