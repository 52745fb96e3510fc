// The audio source over a decoder.
#pragma once

#include "sonora2/media/IAudioSource.h"
#include "sonora2/media/IMediaDescription.h"
#include "support/ReadAhead.h"

#include <memory>

namespace sonora2::plugins {

// Rate, channels and width can be asked for as soon as the file has been open once.
// With a start time the source begins there: its time 0, its duration and its timestamps count from it.
class CDecoderSource : public peru::CObject, public common::IAudioSource, public common::IMediaDescription {
public:
    // Closed. Zeros in `wanted` stand for the file's own values.
    CDecoderSource(const P<common::ISonoraContext>& context, const P<peru::IString>& pluginName,
                   const SMediaFile& file, std::unique_ptr<IDecoder> decoder, const SPcmFormat& wanted);
    ~CDecoderSource() override;

    // Opens the file once to see its format; false when the wanted one cannot be had from it. Throws when
    // the file cannot be opened. Leaves the source closed.
    bool probe();

    bool isOpened() override { return m_producer != nullptr; }
    void open() override; // nothing on an open source
    void close() override;
    void skipToTime(double fTimestamp) override;
    double getDuration() override; // exact
    int getBufferStatus() override;
    bool isEOF() override;
    // On an open source the delivery starts again, at the new start.
    void setStartTime(double fStartTime) override;
    double getStartTime() override { return m_startTime; }
    P<peru::IURI> getURI() override { return m_file.uri; }
    P<peru::IString> getPluginName() override { return m_pluginName; }

    P<audio::IAudioStreamInfos> getAudioStreamInfos() override;
    void setAudioStream(int nAudioIndex) override; // 0 only
    P<audio::IAudioChunk> getNextAudioChunk() override;
    int getSampleRate() override { return m_delivered.rate; }
    int getChannelCount() override { return m_delivered.channels; }
    int getBytesPerSample() override { return m_delivered.bytesPerSample; }

    P<peru::IString> getCodecName() override;
    int64_t getBitRate() override; // of the whole file, tags and covers included
    int getOwnSampleRate() override { return m_media.format.rate; }
    int getOwnChannelCount() override { return m_media.format.channels; }
    int getOwnBytesPerSample() override { return m_media.format.bytesPerSample; }

private:
    bool openDecoder(); // false when its format cannot become the wanted one
    void requireOpened() const;
    int64_t toFrame(double seconds) const;
    void restartAt(int64_t frame); // a delivered frame of the whole file

    P<common::ISonoraContext> m_context;
    P<peru::IString> m_pluginName;
    SMediaFile m_file;
    SPcmFormat m_wanted;
    double m_startTime = 0.0;
    std::unique_ptr<IDecoder> m_decoder;
    SDecodedMedia m_media;                      // known once opened
    SPcmFormat m_delivered;                     // known once opened
    int64_t m_total = 0;                        // delivered frames of the whole file
    int64_t m_delivering = 0;                   // the frame that the consumer gets next
    std::unique_ptr<CChunkProducer> m_producer; // while open
    std::unique_ptr<CReadAhead> m_readAhead;    // uses the producer
};

} // namespace sonora2::plugins
