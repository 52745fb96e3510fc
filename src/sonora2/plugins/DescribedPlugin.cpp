#include "sonora2/plugins/DescribedPlugin.h"

#include "peru/Exception.h"
#include "peru/strings/StringFormat.h"
#include "sonora2/plugins/PluginExtensions.h"
#include "sonora2/plugins/PluginModule.h"

namespace sonora2::common {

using peru::CString;

void logLoadFailure(const P<ISonoraContext>& context, const peru::CException& failure) {
    if (const P<ILogManager> log = context->getLogManager())
        log->log(kSeverityWarning, peru::format("Error while loading DLL: %s - %s", failure.getTitle(),
                                                failure.getDescription()));
}

CDescribedPlugin::CDescribedPlugin(const P<ISonoraContext>& context, const P<peru::IURI>& library,
                                   SPluginDescription description)
    : m_context(context), m_library(library), m_description(std::move(description)) {}

CDescribedPlugin::~CDescribedPlugin() = default;

P<ISonoraPlugin> CDescribedPlugin::requirePlugin() {
    const std::lock_guard lock(m_mutex);
    if (m_plugin) return m_plugin;
    try {
        m_plugin = peru::make<CPluginModule>(m_context, m_library);
    } catch (const peru::CException& failure) {
        if (!m_hasFailed) logLoadFailure(m_context, failure);
        m_hasFailed = true;
        throw;
    }
    m_isWrong = describePlugin(*m_plugin, m_description.buildId) != m_description;
    if (m_isWrong)
        if (const P<ILogManager> log = m_context->getLogManager())
            log->log(kSeverityWarning, peru::format("the description of plugin %s does not match its library",
                                                    CString::fromUTF8(m_description.name)));
    return m_plugin;
}

P<ISonoraPlugin> CDescribedPlugin::findBetterSource() {
    const std::lock_guard lock(m_mutex);
    return m_isWrong ? m_plugin : nullptr;
}

P<peru::IString> CDescribedPlugin::getPluginName() {
    return CString::fromUTF8(m_description.name);
}

int CDescribedPlugin::getValidTypes() {
    const P<ISonoraPlugin> plugin = findBetterSource();
    return plugin ? plugin->getValidTypes() : m_description.types;
}

P<IPluginExtensions> CDescribedPlugin::getValidExtensions(int nTypes) {
    if (const P<ISonoraPlugin> plugin = findBetterSource()) return plugin->getValidExtensions(nTypes);
    const auto found = m_description.extensions.find(nTypes);
    if (found == m_description.extensions.end()) return requirePlugin()->getValidExtensions(nTypes);
    const auto extensions = peru::make<CPluginExtensions>();
    for (const std::string& extension : found->second) extensions->addExtension(CString::fromUTF8(extension));
    return extensions;
}

void CDescribedPlugin::load() {
    if (const P<ILazyPlugin> lazy = peru::tryCast<ILazyPlugin>(requirePlugin())) lazy->load();
}

P<ISource> CDescribedPlugin::tryCreateSource(const P<peru::IURI>& uri, int nTypes,
                                             bool bDontCloseAfterTesting, const SSourceParams* pParams) {
    return requirePlugin()->tryCreateSource(uri, nTypes, bDontCloseAfterTesting, pParams);
}

P<IFormat> CDescribedPlugin::tryCreateFormat(const P<peru::IURI>& uri, int nTypes,
                                             bool bDontCloseAfterTesting, const SFormatParams* pParams) {
    return requirePlugin()->tryCreateFormat(uri, nTypes, bDontCloseAfterTesting, pParams);
}

P<peru::IBase> CDescribedPlugin::tryCreateObject(const P<peru::IURI>& uri, const SObjectParams* pParams) {
    return requirePlugin()->tryCreateObject(uri, pParams);
}

} // namespace sonora2::common
