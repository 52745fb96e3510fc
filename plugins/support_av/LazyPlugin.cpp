#include "support_av/LazyPlugin.h"

#include "sonora2/plugins/PluginExtensions.h"
#include "support_av/CodecLibrary.h"
#include "support_av/Extensions.h"

namespace sonora2::plugins::av {

CLazyPlugin::CLazyPlugin(const P<common::ISonoraContext>& context, const char* name, bool isForWindowsMedia)
    : m_context(context), m_name(name), m_isForWindowsMedia(isForWindowsMedia) {}

CLazyPlugin::~CLazyPlugin() = default;

P<peru::IString> CLazyPlugin::getPluginName() {
    return peru::newString(m_name);
}

int CLazyPlugin::getValidTypes() {
    return common::kVideoSource | common::kAudioSource | (m_isForWindowsMedia ? common::kAudioFormat : 0);
}

P<common::IPluginExtensions> CLazyPlugin::getValidExtensions(int nTypes) {
    auto extensions = peru::make<common::CPluginExtensions>();
    for (const SExtension& extension : getExtensions()) {
        if (m_isForWindowsMedia != ((extension.kind & kWindows) != 0)) continue;
        const bool isWanted = ((nTypes & common::kAudioSource) && (extension.kind & (kSound | kWindows))) ||
                              ((nTypes & common::kVideoSource) && (extension.kind & kVideo)) ||
                              ((nTypes & common::kAudioFormat) && (extension.kind & kWritten));
        if (isWanted) extensions->addExtension(peru::newString(extension.name));
    }
    return extensions;
}

void CLazyPlugin::load() {
    const std::lock_guard lock(m_mutex);
    if (!m_plugin) loadCodecLibrary()(m_context, m_name, m_plugin);
}

P<common::ISource> CLazyPlugin::tryCreateSource(const P<peru::IURI>& uri, int nTypes,
                                                bool bDontCloseAfterTesting, const SSourceParams* pParams) {
    load();
    return m_plugin->tryCreateSource(uri, nTypes, bDontCloseAfterTesting, pParams);
}

P<common::IFormat> CLazyPlugin::tryCreateFormat(const P<peru::IURI>& uri, int nTypes,
                                                bool bDontCloseAfterTesting, const SFormatParams* pParams) {
    if (!m_isForWindowsMedia) return nullptr;
    load();
    return m_plugin->tryCreateFormat(uri, nTypes, bDontCloseAfterTesting, pParams);
}

P<peru::IBase> CLazyPlugin::tryCreateObject(const P<peru::IURI>&, const SObjectParams*) {
    return nullptr;
}

} // namespace sonora2::plugins::av
