// The host's end of a source in a slave process.
#pragma once

#include "peru/remote/RemoteStreamClient.h"
#include "sonora2/boxed/ISourceServer.h"
#include "sonora2/context/ISonoraContext.h"

namespace sonora2::common {

// Every operation is one remote call, on the streams of the plug-in's client. Operations without a result are
// sent without waiting for them. Thread-safe, one call at a time.
class SONORA2_API CSourceClient : public ISourceServer, public peru::CRemoteStreamClient {
public:
    CSourceClient(const P<peru::IInStream>& in, const P<peru::IOutStream>& out,
                  const P<ISonoraContext>& context, uint32_t deadline = 0);
    ~CSourceClient() override;

    P<peru::IString> getLog() override;
    P<CRemoteMediaState> getState() override;
    P<audio::CAudioRun> getNextAudioChunks(int maxBytes) override;

    bool isOpened() override;
    void open() override;
    void close() override;
    void skipToTime(double fTimestamp) override;
    double getDuration() override;
    int getBufferStatus() override;
    bool isEOF() override;
    void setStartTime(double fStartTime) override;
    double getStartTime() override;
    P<peru::IURI> getURI() override;
    P<peru::IString> getPluginName() override;

    void setMaxSize(int nWidth, int nHeight) override;
    int getWidth() override;
    int getHeight() override;
    double peekNextPictureTimestamp() override;
    P<ISonoraPicture> getNextPicture() override;
    int getPixelAspectNum() override;
    int getPixelAspectDen() override;
    double getFrameDuration() override;
    int getFrameRateNum() override;
    int getFrameRateDen() override;

    P<audio::IAudioStreamInfos> getAudioStreamInfos() override;
    void setAudioStream(int nAudioIndex) override;
    P<audio::IAudioChunk> getNextAudioChunk() override;
    int getSampleRate() override;
    int getChannelCount() override;
    int getBytesPerSample() override;

    // Empty: as an answer it only shows that the slave has created the source.
    void writeTo(const P<peru::IDataOutStream>&) const override {}
    void readFrom(const P<peru::IDataInStream>&) override {}

private:
    P<ISonoraContext> m_context;
};

} // namespace sonora2::common
