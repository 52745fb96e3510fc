// Decodes the sound of whatever libav reads.
#pragma once

#include "codecs/Demuxer.h"
#include "support/Decoder.h"

#include <exception>
#include <vector>

namespace sonora2::plugins::av {

// Lossless codecs deliver the width of their samples, all others 16 bits. Encoder delay is removed, and the
// end is trimmed where the file states its length to the frame.
//
// The length is an estimate except after the end has been read: containers state it in milliseconds or not at
// all, and decoders decide how many frames the last packet has. Seeking uses the container's timestamps where
// they lead to an exact frame; otherwise it decodes from the beginning.
class CAvDecoder : public IDecoder {
public:
    explicit CAvDecoder(const SMediaFile& file) : m_file(file) {}
    ~CAvDecoder() override { close(); }

    SDecodedMedia open(const SDecoderOptions& options) override;
    void close() override;
    int read(uint8_t* pcm, int frames) override;
    void seek(int64_t frame) override;
    void deliverFloat() override;
    std::vector<SSoundtrack> getSoundtracks() override { return m_soundtracks; }
    void selectSoundtrack(int index) override;

private:
    // Packets of a file without timestamps, all of which hold the same number of frames.
    struct SPackets {
        int64_t frames = 0; // of the whole file; 0 if unknown
        int framesPerPacket = 0;
        std::vector<int64_t> places;
    };

    void start(); // opens the file; the next frame is the first
    void openCodec();
    void chooseFormat();
    void estimateLength();
    void findStatedEnd();
    void scanPackets();
    bool readFrame(); // false at the end, and if there is silence instead
    bool sendPacket();
    void handleDamage(int error);
    void convertFrame();
    int countUsedFrames() const;
    void silence(int64_t frames);
    void prepareConverter();
    void requireComplete();
    bool seekByTime(int64_t frame);
    bool seekByPlace(int64_t frame);
    bool continueAfterSeek();
    int64_t findFrame(int64_t timestamp) const;
    void drop(int64_t frames);
    bool isExact(AVRational timeBase) const; // whether it tells frames apart
    int64_t countPending() const;
    double toSeconds(int64_t frame) const;

    SMediaFile m_file;
    int m_soundtrack = 0;
    std::vector<SSoundtrack> m_soundtracks{{}};
    SDecoderOptions m_options;
    SPcmFormat m_format;
    bool m_isFloat = false;
    int m_floatBytes = 0;
    std::string m_codecName;
    SPackets m_packets;
    int64_t m_estimate = 0;
    bool m_hasScanned = false; // for packets
    int64_t m_stated = 0;      // frames according to the container; 0 if it does not say
    bool m_isMp4 = false;
    bool m_hasExactEnd = false;
    int64_t m_statedEnd = 0; // where the sound ends although the last packet has more; 0 if it does not say

    std::unique_ptr<CDemuxer> m_demuxer; // while open
    Codec m_codec;
    Packet m_packet;
    Frame m_frame;
    Resampler m_converter;
    AVSampleFormat m_convertedFrom = AV_SAMPLE_FMT_NONE;
    int m_convertedChannels = 0;
    int64_t m_firstTime = AV_NOPTS_VALUE; // timestamp of frame 0
    int m_firstCount = 0;                 // frames of the first packet that are delivered
    int m_packetFrames = 0;               // frames of the others; 0 if they vary
    bool m_hasDecoded = false;            // since the last start or seek
    int m_failures = 0;                   // packets that could not be decoded before that
    int64_t m_lostAtStart = 0;            // frames of packets that could not be decoded before the first
    std::exception_ptr m_damage;          // thrown if sound follows it
    int64_t m_place = -1;                 // of the packet decoded last, in the file
    int64_t m_packetDuration = 0;         // of the same packet, in frames
    bool m_flushed = false;
    bool m_hasSilenced = false; // while looking for a frame
    bool m_mustRestart = false; // the pending frames have another format

    std::vector<uint8_t> m_pending; // converted frames
    size_t m_pendingStart = 0;
    int64_t m_position = 0; // next frame to deliver
};

} // namespace sonora2::plugins::av
