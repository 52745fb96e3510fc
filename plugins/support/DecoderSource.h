// The audio source over a decoder.
#pragma once

#include "sonora2/media/IAudioSource.h"
#include "sonora2/media/IClippingPrevention.h"
#include "sonora2/media/IFloatSamples.h"
#include "sonora2/media/IMediaDescription.h"
#include "sonora2/media/ISalvage.h"
#include "sonora2/media/ITwinSource.h"
#include "support/ReadAhead.h"
#include "support/WarningLog.h"

#include <memory>

namespace sonora2::plugins {

// Rate, channels and width are known once the file has been opened for the first time.
// Time 0, the duration and the timestamps are relative to the start time.
class CDecoderSource : public peru::CObject,
                       public common::IAudioSource,
                       public common::IMediaDescription,
                       public common::ISalvage,
                       public common::IClippingPrevention,
                       public common::IFloatSamples,
                       public common::ITwinSource {
public:
    // Created closed. A zero in `wanted` selects the file's own value.
    CDecoderSource(const P<common::ISonoraContext>& context, const P<peru::IString>& pluginName,
                   const SMediaFile& file, std::unique_ptr<IDecoder> decoder, const SPcmFormat& wanted);
    ~CDecoderSource() override;

    bool isOpened() override { return m_producer != nullptr; }
    // No effect on an open source. Throws if the file cannot be read or its format cannot be converted.
    void open() override;
    void close() override;
    void skipToTime(double fTimestamp) override;
    double getDuration() override; // exact, or an estimate until the end has been read
    int getBufferStatus() override;
    bool isEOF() override;
    // On an open source, delivery restarts at the new start time.
    void setStartTime(double fStartTime) override;
    double getStartTime() override { return m_startTime; }
    P<peru::IURI> getURI() override { return m_file.uri; }
    P<peru::IString> getPluginName() override { return m_pluginName; }

    P<audio::IAudioStreamInfos> getAudioStreamInfos() override;
    // An open source continues at the same time, with the format of that stream where none is wanted.
    void setAudioStream(int nAudioIndex) override;
    P<audio::IAudioChunk> getNextAudioChunk() override;
    int getSampleRate() override { return m_delivered.rate; }
    int getChannelCount() override { return m_delivered.channels; }
    int getBytesPerSample() override { return m_delivered.bytesPerSample; }

    void setSalvage(bool salvage) override;
    bool getSalvage() override { return m_salvage; }

    void setClippingPrevention(bool prevent) override;
    bool getClippingPrevention() override { return m_preventClipping; }

    bool canUseFloat(int bytesPerSample) override;
    void useFloat(int bytesPerSample) override;

    P<peru::IString> getCodecName() override;
    int64_t getBitRate() override; // of the whole file, including tags and covers
    int getOwnSampleRate() override { return m_media.format.rate; }
    int getOwnChannelCount() override { return m_media.format.channels; }
    int getOwnBytesPerSample() override { return m_integerFormat.bytesPerSample; }
    void setDeliveredFormat(int sampleRate, int channelCount, int bytesPerSample) override;
    P<peru::IString> takeWarnings() override;

    int64_t getFrame() override { return m_delivering; }
    int64_t getFrameCount() override { return m_total; }
    void skipToFrame(int64_t frame) override;
    P<common::IAudioSource> createTwin() override;

private:
    void openDecoder();
    void change(bool& option, bool value);
    SDecoderOptions getOptions() const;
    void requireOpened() const;
    void chooseFormat(const SPcmFormat& wanted);
    void startProducer(int64_t frame); // in delivered frames from the beginning of the file
    int64_t getStartFrame() const { return toFrame(m_startTime); }
    int64_t toFrame(double seconds) const;
    void restartAt(int64_t frame); // in delivered frames from the beginning of the file
    P<audio::IAudioChunk> pullChunk();
    void peekChunk();

    P<common::ISonoraContext> m_context;
    P<peru::IString> m_pluginName;
    SMediaFile m_file;
    SPcmFormat m_wanted;
    double m_startTime = 0.0;
    bool m_salvage = false;
    bool m_preventClipping = false;
    bool m_isTwin = false; // decodes on the caller's thread
    int m_soundtrack = 0;
    std::unique_ptr<IDecoder> m_decoder;
    P<CWarningLog> m_log;
    SDecodedMedia m_media;                      // known once opened
    SPcmFormat m_integerFormat;                 // of the file's samples unless floating point is used
    SPcmFormat m_delivered;                     // known once opened
    int64_t m_total = 0;                        // delivered frames of the whole file
    int64_t m_delivering = 0;                   // next frame for the consumer
    P<audio::IAudioChunk> m_peeked;             // read to find out whether this is the end
    P<peru::CException> m_peekError;            // thrown by the next read
    bool m_isBehindEnd = false;                 // reading started at an estimated end
    std::unique_ptr<CChunkProducer> m_producer; // while open
    std::unique_ptr<CReadAhead> m_readAhead;    // uses the producer
};

} // namespace sonora2::plugins
