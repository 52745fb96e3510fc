// The host's end of a format in a slave process.
#pragma once

#include "peru/remote/RemoteStreamClient.h"
#include "sonora2/boxed/IFormatServer.h"
#include "sonora2/context/ISonoraContext.h"

namespace sonora2::common {

// Every operation is one remote call, on the streams of the plug-in's client. Operations without a result are
// sent without waiting for them. Thread-safe, one call at a time.
class SONORA2_API CFormatClient : public IFormatServer, public peru::CRemoteStreamClient {
public:
    CFormatClient(const P<peru::IInStream>& in, const P<peru::IOutStream>& out,
                  const P<ISonoraContext>& context, uint32_t deadline = 0);
    ~CFormatClient() override;

    P<peru::IString> getLog() override;
    P<CRemoteMediaState> getState() override;

    bool isOpened() override;
    void open() override;
    void close() override;
    P<peru::IURI> getURI() override;
    P<peru::IString> getPluginName() override;
    int64_t getEstimatedSizeBytes(double fDuration) override;

    ISonoraPlugin::SFormatParams getVideoParameter() override;
    void writeFrame(const P<ISonoraPicture>& pPicture) override;
    int getWantedImageType() override;

    int getSampleRate() override;
    int getChannelCount() override;
    int getBytesPerSample() override;
    void setAudioQuality(double fQuality) override;
    void setAudioBitRate(int nNominal, int nMin, int nMax) override;
    void writeAudioChunk(const P<audio::IAudioChunk>& pAudioChunk) override;

    // Empty: as an answer it only shows that the slave has created the format.
    void writeTo(const P<peru::IDataOutStream>&) const override {}
    void readFrom(const P<peru::IDataInStream>&) override {}

private:
    P<ISonoraContext> m_context;
};

} // namespace sonora2::common
