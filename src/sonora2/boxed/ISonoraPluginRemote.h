// A plug-in in a slave process and its remote procedures.
#pragma once

#include "sonora2/boxed/RemoteTools.h"
#include "sonora2/plugins/ISonoraPlugin.h"

namespace sonora2::common {

class SONORA2_API ISonoraPluginRemote : public virtual ISonoraPlugin {
public:
    virtual P<peru::IString> getLog() = 0; // what the slave has logged since the last call, see RemoteLog.h

    class getLogFunction : public TRemoteFunction<peru::CRemoteVarString> {
    public:
        getLogFunction() : TRemoteFunction("getLog") {}
    };
    class getPluginNameFunction : public TRemoteFunction<peru::CRemoteVarString> {
    public:
        getPluginNameFunction() : TRemoteFunction("getPluginName") {}
    };
    class getValidTypesFunction : public TRemoteFunction<peru::CRemoteVarInteger> {
    public:
        getValidTypesFunction() : TRemoteFunction("getValidTypes") {}
    };
    class getValidExtensionsFunction : public TRemoteFunction<peru::CRemoteVarObject> {
    public:
        getValidExtensionsFunction() : TRemoteFunction("getValidExtensions") {}
        const P<peru::CRemoteVarInteger> nTypes = addParam<peru::CRemoteVarInteger>("nTypes");
    };
    // Both results are objects without content; null if the plug-in declines.
    class tryCreateSourceFunction : public TRemoteFunction<peru::CRemoteVarObject> {
    public:
        tryCreateSourceFunction() : TRemoteFunction("tryCreateSource") {}
        const P<peru::CRemoteVarURI> uri = addParam<peru::CRemoteVarURI>("uri");
        const P<peru::CRemoteVarInteger> nTypes = addParam<peru::CRemoteVarInteger>("nTypes");
        const P<peru::CRemoteVarBool> bDontCloseAfterTesting =
            addParam<peru::CRemoteVarBool>("bDontCloseAfterTesting");
        const P<peru::CRemoteVarStruct<SSourceParams>> pParams =
            addParam<peru::CRemoteVarStruct<SSourceParams>>("pParams");
    };
    class tryCreateFormatFunction : public TRemoteFunction<peru::CRemoteVarObject> {
    public:
        tryCreateFormatFunction() : TRemoteFunction("tryCreateFormat") {}
        const P<peru::CRemoteVarURI> uri = addParam<peru::CRemoteVarURI>("uri");
        const P<peru::CRemoteVarInteger> nTypes = addParam<peru::CRemoteVarInteger>("nTypes");
        const P<peru::CRemoteVarBool> bDontCloseAfterTesting =
            addParam<peru::CRemoteVarBool>("bDontCloseAfterTesting");
        const P<peru::CRemoteVarStruct<SFormatParams>> pParams =
            addParam<peru::CRemoteVarStruct<SFormatParams>>("pParams");
    };
};

// The result of the two create functions.
class SONORA2_API CRemoteCreated : public peru::CObject, public virtual peru::ISerializable {
public:
    void writeTo(const P<peru::IDataOutStream>&) const override {}
    void readFrom(const P<peru::IDataInStream>&) override {}
};

} // namespace sonora2::common
