// A source in a slave process, for callers that need not know.
#pragma once

#include "peru/IInterfaceQuery.h"
#include "peru/Object.h"
#include "sonora2/boxed/BoxedMedia.h"
#include "sonora2/boxed/PicturePrefetch.h"
#include "sonora2/boxed/SourceClient.h"
#include "sonora2/plugins/ISonoraPlugin.h"

#include <array>
#include <deque>
#include <optional>

namespace sonora2::common {

// Starts a slave with the first open(), which it has for itself until it is destroyed. If the slave fails,
// every operation throws until close(); the next open() starts another one with the same settings. The
// interface cast finds the optional interfaces that the source in the slave has.
//
// Sound is fetched in runs of chunks. Properties that only change by operations are answered from what was
// fetched with the last one.
class SONORA2_API CEncapsulatedSource : public peru::CObject,
                                        public IVideoSource,
                                        public IAudioSource,
                                        public peru::IInterfaceQuery,
                                        private TBoxedMedia<CSourceClient> {
public:
    using SSourceParams = ISonoraPlugin::SSourceParams;

    CEncapsulatedSource(const P<ISonoraContext>& context, const P<peru::IString>& pluginName,
                        const P<peru::IURI>& uri, int types, const SSourceParams* params);
    ~CEncapsulatedSource() override;

    // Creates the source in a slave now. Returns false if the plug-in declines.
    bool prepare();

    bool isOpened() override;
    void open() override;
    void close() override;
    void skipToTime(double fTimestamp) override;
    double getDuration() override;
    int getBufferStatus() override;
    bool isEOF() override;
    void setStartTime(double fStartTime) override;
    double getStartTime() override;
    P<peru::IURI> getURI() override { return m_uri; }
    P<peru::IString> getPluginName() override { return m_pluginName; }

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

    peru::SInterfaceQueryResult queryInterface(const std::type_info& wanted) override;

private:
    class CFloatSamples;
    class CMediaDescription;
    class CSalvage;
    class CClippingPrevention;

    bool has(ERemoteFacet facet) const { return (m_state->facets & facet) != 0; }
    void applySettings(CSourceClient& client);
    void forgetChunks();
    void returnChunks(CSourceClient& client);
    void fetchChunks();
    template <class Call> auto forwardVideo(const char* operation, Call call);
    CPicturePrefetch::EFetched fetchPicture(const std::function<void()>& locked, P<ISonoraPicture>& picture);

    int m_types;
    SSourceParams m_params;

    // Guarded by the lock of the slave.
    double m_startTime = 0.0;
    int m_maxWidth = 0;
    int m_maxHeight = 0;
    double m_frameDuration = 0.0;
    std::optional<int> m_audioStream;
    std::optional<bool> m_salvage;
    std::optional<bool> m_preventClipping;
    std::optional<std::array<int, 3>> m_deliveredFormat;
    bool m_isApplied = false; // the settings above, in the slave's source as it is open
    std::deque<P<audio::IAudioChunk>> m_chunks;
    P<peru::IString> m_chunkFailure; // of the read after m_chunks; empty handle if there is none
    int m_runBytes = 0;              // of the next run

    CPicturePrefetch m_prefetch;
};

} // namespace sonora2::common
