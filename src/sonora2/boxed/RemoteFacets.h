// Remote procedures of the optional interfaces of sources and formats.
#pragma once

#include "peru/Object.h"
#include "sonora2/boxed/RemoteTools.h"

namespace sonora2::common {

// Functions without a value return true: the answer shows that the call has succeeded.
struct SRemoteFacets {
    class canUseFloatFunction : public TRemoteFunction<peru::CRemoteVarBool> {
    public:
        canUseFloatFunction() : TRemoteFunction("canUseFloat") {}
        const P<peru::CRemoteVarInteger> nBytesPerSample =
            addParam<peru::CRemoteVarInteger>("nBytesPerSample");
    };
    class useFloatFunction : public TRemoteFunction<peru::CRemoteVarBool> {
    public:
        useFloatFunction() : TRemoteFunction("useFloat") {}
        const P<peru::CRemoteVarInteger> nBytesPerSample =
            addParam<peru::CRemoteVarInteger>("nBytesPerSample");
    };
    class setSalvageFunction : public TRemoteFunction<peru::CRemoteVarBool> {
    public:
        setSalvageFunction() : TRemoteFunction("setSalvage") {}
        const P<peru::CRemoteVarBool> bSalvage = addParam<peru::CRemoteVarBool>("bSalvage");
    };
    class getSalvageFunction : public TRemoteFunction<peru::CRemoteVarBool> {
    public:
        getSalvageFunction() : TRemoteFunction("getSalvage") {}
    };
    class setClippingPreventionFunction : public TRemoteFunction<peru::CRemoteVarBool> {
    public:
        setClippingPreventionFunction() : TRemoteFunction("setClippingPrevention") {}
        const P<peru::CRemoteVarBool> bPrevent = addParam<peru::CRemoteVarBool>("bPrevent");
    };
    class getClippingPreventionFunction : public TRemoteFunction<peru::CRemoteVarBool> {
    public:
        getClippingPreventionFunction() : TRemoteFunction("getClippingPrevention") {}
    };
    class getMediaDescriptionFunction : public TRemoteFunction<peru::CRemoteVarObject> {
    public:
        getMediaDescriptionFunction() : TRemoteFunction("getMediaDescription") {}
    };
    class setDeliveredFormatFunction : public TRemoteFunction<peru::CRemoteVarBool> {
    public:
        setDeliveredFormatFunction() : TRemoteFunction("setDeliveredFormat") {}
        const P<peru::CRemoteVarInteger> nSampleRate = addParam<peru::CRemoteVarInteger>("nSampleRate");
        const P<peru::CRemoteVarInteger> nChannelCount = addParam<peru::CRemoteVarInteger>("nChannelCount");
        const P<peru::CRemoteVarInteger> nBytesPerSample =
            addParam<peru::CRemoteVarInteger>("nBytesPerSample");
    };
    class takeWarningsFunction : public TRemoteFunction<peru::CRemoteVarString> {
    public:
        takeWarningsFunction() : TRemoteFunction("takeWarnings") {}
    };
    class discardFunction : public TRemoteFunction<peru::CRemoteVarBool> {
    public:
        discardFunction() : TRemoteFunction("discard") {}
    };
};

// The values of IMediaDescription.
class SONORA2_API CRemoteMediaDescription : public peru::CObject, public virtual peru::ISerializable {
public:
    P<peru::IString> codecName = peru::CString::empty();
    int64_t bitRate = 0;
    int32_t sampleRate = 0;
    int32_t channelCount = 0;
    int32_t bytesPerSample = 0;

    void writeTo(const P<peru::IDataOutStream>& stream) const override;
    void readFrom(const P<peru::IDataInStream>& stream) override;
};

} // namespace sonora2::common
