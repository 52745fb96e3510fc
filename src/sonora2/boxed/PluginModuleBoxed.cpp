#include "sonora2/boxed/PluginModuleBoxed.h"

#include "sonora2/boxed/EncapsulatedFormat.h"
#include "sonora2/boxed/EncapsulatedSource.h"
#include "sonora2/boxed/FormatProbe.h"
#include "sonora2/boxed/SonoraPluginBoxed.h"

namespace sonora2::common {

CPluginModuleBoxed::CPluginModuleBoxed(const P<ISonoraContext>& context, const P<peru::IString>& pluginName)
    : m_context(context), m_name(pluginName) {}

CPluginModuleBoxed::~CPluginModuleBoxed() = default;

int CPluginModuleBoxed::getValidTypes() {
    return peru::make<CSonoraPluginBoxed>(m_context, m_name)->getValidTypes();
}

P<IPluginExtensions> CPluginModuleBoxed::getValidExtensions(int nTypes) {
    return peru::make<CSonoraPluginBoxed>(m_context, m_name)->getValidExtensions(nTypes);
}

P<ISource> CPluginModuleBoxed::tryCreateSource(const P<peru::IURI>& uri, int nTypes,
                                               bool bDontCloseAfterTesting, const SSourceParams* pParams) {
    if (!uri) return nullptr;
    const auto source = peru::make<CEncapsulatedSource>(m_context, m_name, uri, nTypes, pParams);
    if (!source->prepare()) return nullptr;
    if (!bDontCloseAfterTesting) source->close();
    return source;
}

P<IFormat> CPluginModuleBoxed::tryCreateFormat(const P<peru::IURI>& uri, int nTypes, bool,
                                               const SFormatParams* pParams) {
    if (!uri) return nullptr;
    const auto format = peru::make<CEncapsulatedFormat>(m_context, m_name, uri, nTypes, pParams);
    if (!format->prepare()) return nullptr;
    return format;
}

P<CFormatProbe> CPluginModuleBoxed::createFormatProbe(const P<peru::IURI>& uri) {
    return peru::make<CFormatProbe>(m_context, m_name, uri);
}

} // namespace sonora2::common
