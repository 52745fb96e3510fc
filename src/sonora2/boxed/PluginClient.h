// The host's end of a plug-in in a slave process.
#pragma once

#include "peru/remote/RemoteStreamClient.h"
#include "sonora2/boxed/ISonoraPluginRemote.h"
#include "sonora2/context/ISonoraContext.h"

namespace sonora2::common {

class CSourceClient;
class CFormatClient;

// The slave serves one source or format at a time: creating one replaces the one before. Errors are those of
// the remote calls.
class SONORA2_API CSonoraPluginClient : public ISonoraPluginRemote, public peru::CRemoteStreamClient {
public:
    CSonoraPluginClient(const P<peru::IInStream>& in, const P<peru::IOutStream>& out,
                        const P<ISonoraContext>& context, uint32_t deadline = 0);
    ~CSonoraPluginClient() override;

    P<peru::IString> getLog() override;
    P<peru::IString> getPluginName() override;
    int getValidTypes() override;
    P<IPluginExtensions> getValidExtensions(int nTypes) override;
    P<ISource> tryCreateSource(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                               const SSourceParams* pParams) override;
    P<IFormat> tryCreateFormat(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                               const SFormatParams* pParams) override;
    P<peru::IBase> tryCreateObject(const P<peru::IURI>&, const SObjectParams*) override { return nullptr; }

private:
    P<peru::IInStream> m_inStream;
    P<peru::IOutStream> m_outStream;
    P<ISonoraContext> m_context;
    uint32_t m_callDeadline; // milliseconds
};

} // namespace sonora2::common
