#include "sonora2/plugins/PluginModule.h"

#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "peru/uri/URI.h"
#include "sonora2/context/SonoraError.h"

namespace sonora2::common {

namespace {

// Copies a text, since one from a plug-in may live in the plug-in's memory.
P<peru::IString> detachText(const P<peru::IString>& text) {
    return peru::CString::fromUTF8(peru::CString::toStdString(text));
}

P<peru::IDynamicLibrary> loadLibrary(const P<ISonoraContext>& context, const P<peru::IURI>& file,
                                     const std::string& name) {
    try {
        return peru::getDynamicLibraryLoader()->load(file);
    } catch (const peru::CException& e) {
        // The file exists, so the loader's reason matters: a missing symbol or dependency.
        if (P<ILogManager> log = context->getLogManager()) log->log(kSeverityDebug, e.getDescription());
        throw CSonoraError(
            peru::format({"sonora2.CPluginModule.load", "could not load plugin: %s"}, name.c_str()));
    }
}

// Converts exceptions of the entry point: the library is unloaded while they propagate, so they must not
// refer to it.
P<ISonoraPlugin> createPlugin(PluginCreateFunction create, const P<ISonoraContext>& context) {
    P<peru::IString> reason;
    try {
        P<ISonoraPlugin> plugin;
        create(context, plugin);
        return plugin;
    } catch (const peru::CException& e) {
        reason = detachText(e.getDescription());
    } catch (const std::exception& e) {
        reason = peru::CString::fromUTF8(e.what());
    } catch (...) {
        return nullptr;
    }
    throw CSonoraError(reason);
}

} // namespace

CPluginModule::CPluginModule(const P<ISonoraContext>& context, const P<peru::IURI>& library)
    : m_name(peru::CString::toStdString(peru::CURI::unescape(library->getFileName()))),
      m_library(loadLibrary(context, library, m_name)) {
    auto create = reinterpret_cast<PluginCreateFunction>(m_library->findSymbol(kPluginCreateName));
    if (!create)
        throw CSonoraError(
            peru::format({"sonora2.CPluginModule.function", "could not load link create function for: %s"},
                         m_name.c_str()));
    m_plugin = createPlugin(create, context);
    if (!m_plugin)
        throw CSonoraError(
            peru::format({"sonora2.CPluginModule.object", "could not load link create plugin object for: %s"},
                         m_name.c_str()));
}

CPluginModule::~CPluginModule() {
    m_plugin.reset();
}

P<peru::IString> CPluginModule::getPluginName() {
    return m_plugin->getPluginName();
}

int CPluginModule::getValidTypes() {
    return m_plugin->getValidTypes();
}

P<IPluginExtensions> CPluginModule::getValidExtensions(int nTypes) {
    return m_plugin->getValidExtensions(nTypes);
}

void CPluginModule::load() {
    if (const P<ILazyPlugin> lazy = peru::tryCast<ILazyPlugin>(m_plugin)) lazy->load();
}

P<ISource> CPluginModule::tryCreateSource(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                                          const SSourceParams* pParams) {
    return m_plugin->tryCreateSource(uri, nTypes, bDontCloseAfterTesting, pParams);
}

P<IFormat> CPluginModule::tryCreateFormat(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                                          const SFormatParams* pParams) {
    return m_plugin->tryCreateFormat(uri, nTypes, bDontCloseAfterTesting, pParams);
}

P<peru::IBase> CPluginModule::tryCreateObject(const P<peru::IURI>& uri, const SObjectParams* pParams) {
    return m_plugin->tryCreateObject(uri, pParams);
}

} // namespace sonora2::common
