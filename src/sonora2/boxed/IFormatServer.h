// A format in a slave process and its remote procedures.
#pragma once

#include "sonora2/boxed/RemoteFacets.h"
#include "sonora2/boxed/RemoteMediaState.h"
#include "sonora2/media/IAudioFormat.h"
#include "sonora2/plugins/IVideoFormat.h"

namespace sonora2::common {

// Procedures without an answer (Proc) report their errors through getState.
class SONORA2_API IFormatServer : public virtual IVideoFormat,
                                  public virtual IAudioFormat,
                                  public virtual peru::ISerializable {
public:
    virtual P<peru::IString> getLog() = 0;
    virtual P<CRemoteMediaState> getState() = 0;

    class getLogFunction : public TRemoteFunction<peru::CRemoteVarString> {
    public:
        getLogFunction() : TRemoteFunction("getLog") {}
    };
    class isOpenedFunction : public TRemoteFunction<peru::CRemoteVarBool> {
    public:
        isOpenedFunction() : TRemoteFunction("isOpened") {}
    };
    class openProc : public peru::CRemoteVoid {
    public:
        openProc() : CRemoteVoid("open") {}
    };
    class closeProc : public peru::CRemoteVoid {
    public:
        closeProc() : CRemoteVoid("close") {}
    };
    class getURIFunction : public TRemoteFunction<peru::CRemoteVarURI> {
    public:
        getURIFunction() : TRemoteFunction("getURI") {}
    };
    class getPluginNameFunction : public TRemoteFunction<peru::CRemoteVarString> {
    public:
        getPluginNameFunction() : TRemoteFunction("getPluginName") {}
    };
    class getEstimatedSizeBytesFunction : public TRemoteFunction<peru::CRemoteVarInteger64> {
    public:
        getEstimatedSizeBytesFunction() : TRemoteFunction("getEstimatedSizeBytes") {}
        const P<peru::CRemoteVarDouble> fDuration = addParam<peru::CRemoteVarDouble>("fDuration");
    };
    class getVideoParameterFunction
        : public TRemoteFunction<peru::CRemoteVarStruct<ISonoraPlugin::SFormatParams>> {
    public:
        getVideoParameterFunction() : TRemoteFunction("getVideoParameter") {}
    };
    class writeFrameProc : public peru::CRemoteVoid {
    public:
        writeFrameProc() : CRemoteVoid("writeFrame") {}
        const P<peru::CRemoteVarObject> pPicture = addParam<peru::CRemoteVarObject>("pPicture");
    };
    class getWantedImageTypeFunction : public TRemoteFunction<peru::CRemoteVarInteger> {
    public:
        getWantedImageTypeFunction() : TRemoteFunction("getWantedImageType") {}
    };
    class getSampleRateFunction : public TRemoteFunction<peru::CRemoteVarInteger> {
    public:
        getSampleRateFunction() : TRemoteFunction("getSampleRate") {}
    };
    class getChannelCountFunction : public TRemoteFunction<peru::CRemoteVarInteger> {
    public:
        getChannelCountFunction() : TRemoteFunction("getChannelCount") {}
    };
    class getBytesPerSampleFunction : public TRemoteFunction<peru::CRemoteVarInteger> {
    public:
        getBytesPerSampleFunction() : TRemoteFunction("getBytesPerSample") {}
    };
    class setAudioQualityProc : public peru::CRemoteVoid {
    public:
        setAudioQualityProc() : CRemoteVoid("setAudioQuality") {}
        const P<peru::CRemoteVarDouble> fQuality = addParam<peru::CRemoteVarDouble>("fQuality");
    };
    class setAudioBitRateProc : public peru::CRemoteVoid {
    public:
        setAudioBitRateProc() : CRemoteVoid("setAudioBitRate") {}
        const P<peru::CRemoteVarInteger> nNominal = addParam<peru::CRemoteVarInteger>("nNominal");
        const P<peru::CRemoteVarInteger> nMin = addParam<peru::CRemoteVarInteger>("nMin");
        const P<peru::CRemoteVarInteger> nMax = addParam<peru::CRemoteVarInteger>("nMax");
    };
    class writeAudioChunkProc : public peru::CRemoteVoid {
    public:
        writeAudioChunkProc() : CRemoteVoid("writeAudioChunk") {}
        const P<peru::CRemoteVarObject> pAudioChunk = addParam<peru::CRemoteVarObject>("pAudioChunk");
    };
};

} // namespace sonora2::common
