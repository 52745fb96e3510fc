// A source in a slave process and its remote procedures.
#pragma once

#include "sonora2/boxed/AudioRun.h"
#include "sonora2/boxed/RemoteFacets.h"
#include "sonora2/boxed/RemoteMediaState.h"
#include "sonora2/media/IAudioSource.h"
#include "sonora2/media/IVideoSource.h"

namespace sonora2::common {

// Procedures without an answer (Proc) report their errors through getState.
class SONORA2_API ISourceServer : public virtual IVideoSource,
                                  public virtual IAudioSource,
                                  public virtual peru::ISerializable {
public:
    virtual P<peru::IString> getLog() = 0;
    virtual P<CRemoteMediaState> getState() = 0;
    // As many calls of getNextAudioChunk as it takes to deliver `maxBytes`, but at least one.
    virtual P<audio::CAudioRun> getNextAudioChunks(int maxBytes) = 0;

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
    class skipToTimeProc : public peru::CRemoteVoid {
    public:
        skipToTimeProc() : CRemoteVoid("skipToTime") {}
        const P<peru::CRemoteVarDouble> fTimestamp = addParam<peru::CRemoteVarDouble>("fTimestamp");
    };
    class getDurationFunction : public TRemoteFunction<peru::CRemoteVarDouble> {
    public:
        getDurationFunction() : TRemoteFunction("getDuration") {}
    };
    class getBufferStatusFunction : public TRemoteFunction<peru::CRemoteVarInteger> {
    public:
        getBufferStatusFunction() : TRemoteFunction("getBufferStatus") {}
    };
    class isEOFFunction : public TRemoteFunction<peru::CRemoteVarBool> {
    public:
        isEOFFunction() : TRemoteFunction("isEOF") {}
    };
    class setStartTimeProc : public peru::CRemoteVoid {
    public:
        setStartTimeProc() : CRemoteVoid("setStartTime") {}
        const P<peru::CRemoteVarDouble> fStartTime = addParam<peru::CRemoteVarDouble>("fStartTime");
    };
    class getStartTimeFunction : public TRemoteFunction<peru::CRemoteVarDouble> {
    public:
        getStartTimeFunction() : TRemoteFunction("getStartTime") {}
    };
    class getURIFunction : public TRemoteFunction<peru::CRemoteVarURI> {
    public:
        getURIFunction() : TRemoteFunction("getURI") {}
    };
    class getPluginNameFunction : public TRemoteFunction<peru::CRemoteVarString> {
    public:
        getPluginNameFunction() : TRemoteFunction("getPluginName") {}
    };
    class setMaxSizeProc : public peru::CRemoteVoid {
    public:
        setMaxSizeProc() : CRemoteVoid("setMaxSize") {}
        const P<peru::CRemoteVarInteger> nWidth = addParam<peru::CRemoteVarInteger>("nWidth");
        const P<peru::CRemoteVarInteger> nHeight = addParam<peru::CRemoteVarInteger>("nHeight");
    };
    class getWidthFunction : public TRemoteFunction<peru::CRemoteVarInteger> {
    public:
        getWidthFunction() : TRemoteFunction("getWidth") {}
    };
    class getHeightFunction : public TRemoteFunction<peru::CRemoteVarInteger> {
    public:
        getHeightFunction() : TRemoteFunction("getHeight") {}
    };
    class peekNextPictureTimestampFunction : public TRemoteFunction<peru::CRemoteVarDouble> {
    public:
        peekNextPictureTimestampFunction() : TRemoteFunction("peekNextPictureTimestamp") {}
    };
    class getNextPictureFunction : public TRemoteFunction<peru::CRemoteVarObject> {
    public:
        getNextPictureFunction() : TRemoteFunction("getNextPicture") {}
    };
    class getPixelAspectNumFunction : public TRemoteFunction<peru::CRemoteVarInteger> {
    public:
        getPixelAspectNumFunction() : TRemoteFunction("getPixelAspectNum") {}
    };
    class getPixelAspectDenFunction : public TRemoteFunction<peru::CRemoteVarInteger> {
    public:
        getPixelAspectDenFunction() : TRemoteFunction("getPixelAspectDen") {}
    };
    class getFrameDurationFunction : public TRemoteFunction<peru::CRemoteVarDouble> {
    public:
        getFrameDurationFunction() : TRemoteFunction("getFrameDuration") {}
    };
    class getFrameRateNumFunction : public TRemoteFunction<peru::CRemoteVarInteger> {
    public:
        getFrameRateNumFunction() : TRemoteFunction("getFrameRateNum") {}
    };
    class getFrameRateDenFunction : public TRemoteFunction<peru::CRemoteVarInteger> {
    public:
        getFrameRateDenFunction() : TRemoteFunction("getFrameRateDen") {}
    };
    class getAudioStreamInfosFunction : public TRemoteFunction<peru::CRemoteVarObject> {
    public:
        getAudioStreamInfosFunction() : TRemoteFunction("getAudioStreamInfos") {}
    };
    class setAudioStreamProc : public peru::CRemoteVoid {
    public:
        setAudioStreamProc() : CRemoteVoid("setAudioStream") {}
        const P<peru::CRemoteVarInteger> nAudioIndex = addParam<peru::CRemoteVarInteger>("nAudioIndex");
    };
    class getNextAudioChunkFunction : public TRemoteFunction<peru::CRemoteVarObject> {
    public:
        getNextAudioChunkFunction() : TRemoteFunction("getNextAudioChunk") {}
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
    class getNextAudioChunksFunction : public TRemoteFunction<peru::CRemoteVarObject> {
    public:
        getNextAudioChunksFunction() : TRemoteFunction("getNextAudioChunks") {}
        const P<peru::CRemoteVarInteger> nMaxBytes = addParam<peru::CRemoteVarInteger>("nMaxBytes");
    };
};

} // namespace sonora2::common
