#include "sonora2/boxed/PluginClient.h"

#include "sonora2/boxed/BoxedSettings.h"
#include "sonora2/boxed/FormatClient.h"
#include "sonora2/boxed/SourceClient.h"
#include "sonora2/plugins/ParameterRecord.h"
#include "sonora2/plugins/PluginExtensions.h"

namespace sonora2::common {

CSonoraPluginClient::CSonoraPluginClient(const P<peru::IInStream>& in, const P<peru::IOutStream>& out,
                                         const P<ISonoraContext>& context, uint32_t deadline)
    : CRemoteStreamClient(in, out), m_inStream(in), m_outStream(out), m_context(context),
      m_callDeadline(deadline) {
    setDeadline(deadline);
    setLimits(kLargestAnswer, kLongestAnswerText);
}

CSonoraPluginClient::~CSonoraPluginClient() = default;

P<peru::IString> CSonoraPluginClient::getLog() {
    return callReturningString(peru::make<getLogFunction>());
}

P<peru::IString> CSonoraPluginClient::getPluginName() {
    return callReturningString(peru::make<getPluginNameFunction>());
}

int CSonoraPluginClient::getValidTypes() {
    return callReturningInt(peru::make<getValidTypesFunction>());
}

P<IPluginExtensions> CSonoraPluginClient::getValidExtensions(int nTypes) {
    const auto proc = peru::make<getValidExtensionsFunction>();
    proc->nTypes->setValue(nTypes);
    return peru::tryCast<IPluginExtensions>(callReturningObject(proc, peru::make<CPluginExtensions>()));
}

P<ISource> CSonoraPluginClient::tryCreateSource(const P<peru::IURI>& uri, int nTypes,
                                                bool bDontCloseAfterTesting, const SSourceParams* pParams) {
    const auto proc = peru::make<tryCreateSourceFunction>();
    proc->uri->setValue(uri);
    proc->nTypes->setValue(nTypes);
    proc->bDontCloseAfterTesting->setValue(bDontCloseAfterTesting);
    proc->pParams->setValue(receiveRecord(pParams));
    const auto source = peru::make<CSourceClient>(m_inStream, m_outStream, m_context, m_callDeadline);
    if (!callReturningObject(proc, source)) return nullptr;
    return source;
}

P<IFormat> CSonoraPluginClient::tryCreateFormat(const P<peru::IURI>& uri, int nTypes,
                                                bool bDontCloseAfterTesting, const SFormatParams* pParams) {
    const auto proc = peru::make<tryCreateFormatFunction>();
    proc->uri->setValue(uri);
    proc->nTypes->setValue(nTypes);
    proc->bDontCloseAfterTesting->setValue(bDontCloseAfterTesting);
    proc->pParams->setValue(receiveRecord(pParams));
    const auto format = peru::make<CFormatClient>(m_inStream, m_outStream, m_context, m_callDeadline);
    if (!callReturningObject(proc, format)) return nullptr;
    return format;
}

} // namespace sonora2::common
