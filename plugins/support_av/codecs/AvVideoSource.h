// Delivers the pictures of whatever libav reads.
#pragma once

#include "codecs/Demuxer.h"
#include "codecs/FrameBlock.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/media/ISonoraPicture.h"
#include "sonora2/media/IVideoSource.h"

#include <exception>
#include <vector>

namespace sonora2::plugins::av {

// Pictures have the layout of the stream where there is a class for it, otherwise RGB. Damaged pictures are
// left out. Time 0 is the start time within the file. Not safe for concurrent use.
class CAvVideoSource : public peru::CObject, public common::IVideoSource {
public:
    CAvVideoSource(const P<common::ISonoraContext>& context, const P<peru::IString>& pluginName,
                   const SMediaFile& file); // created closed
    ~CAvVideoSource() override;

    bool isOpened() override { return m_demuxer != nullptr; }
    void open() override;
    void close() override;
    // Behind the last picture's time, that picture is delivered again.
    void skipToTime(double fTimestamp) override;
    double getDuration() override;
    int getBufferStatus() override { return isEOF() ? 100 : 0; }
    bool isEOF() override { return !m_hasNext && !m_failure; }
    void setStartTime(double fStartTime) override;
    double getStartTime() override { return m_startTime; }
    P<peru::IURI> getURI() override { return m_file.uri; }
    P<peru::IString> getPluginName() override { return m_pluginName; }

    // Larger pictures are reduced, with their proportions; 0 is no limit. Used by the next open().
    void setMaxSize(int nWidth, int nHeight) override;
    // The size and the rates are known once the source has been open.
    int getWidth() override { return m_width; }
    int getHeight() override { return m_height; }
    double peekNextPictureTimestamp() override; // below 0 at the end
    P<common::ISonoraPicture> getNextPicture() override;
    int getPixelAspectNum() override { return m_pixelAspect.num; }
    int getPixelAspectDen() override { return m_pixelAspect.den; }
    double getFrameDuration() override { return m_frameDuration; }
    int getFrameRateNum() override { return m_frameRate.num; }
    int getFrameRateDen() override { return m_frameRate.den; }

private:
    void start(); // at the beginning of the file
    void openCodec();
    void readProperties();
    void fitSize(int width, int height);
    void readNext();
    bool decode();
    bool sendPacket();
    void find(double time); // in the file
    bool goTo(double time, double from);
    void advanceTo(double time); // to the last picture if there is none at or after the time
    void requireOpened() const;
    P<common::ISonoraPicture> makePicture(); // readNext() has to follow
    P<peru::IMemoryBlock> makeBlock(AVPixelFormat format, const std::vector<CFrameBlock::SPlane>& planes);
    void scale(AVPixelFormat format, uint8_t* const planes[], const int pitches[]);

    const P<common::ISonoraContext> m_context;
    const P<peru::IString> m_pluginName;
    const SMediaFile m_file;
    double m_startTime = 0.0;
    int m_maxWidth = 0;
    int m_maxHeight = 0;

    int m_width = 0;
    int m_height = 0;
    AVRational m_pixelAspect{1, 1};
    AVRational m_frameRate{0, 1};
    double m_frameDuration = 0.0;
    double m_duration = 0.0;
    double m_origin = 0.0; // the file's own time at which it starts

    std::unique_ptr<CDemuxer> m_demuxer; // while open
    Codec m_codec;
    Packet m_packet;
    Frame m_frame; // the next one
    Scaler m_scaler;
    bool m_hasNext = false;
    std::exception_ptr m_failure; // of reading the picture after the one delivered last
    double m_nextTime = 0.0;      // in the file
    int m_failures = 0;           // packets in a row that could not be decoded
    bool m_flushed = false;
};

} // namespace sonora2::plugins::av
