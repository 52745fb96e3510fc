// Owners of libav's objects.
#pragma once

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
#include <libswresample/swresample.h>
#include <libswscale/swscale.h>
}

#include <memory>

namespace sonora2::plugins::av {

struct SFreeAv {
    void operator()(AVCodecContext* codec) const { avcodec_free_context(&codec); }
    void operator()(AVFrame* frame) const { av_frame_free(&frame); }
    void operator()(AVPacket* packet) const { av_packet_free(&packet); }
    void operator()(SwrContext* converter) const { swr_free(&converter); }
    void operator()(SwsContext* scaler) const { sws_freeContext(scaler); }
    void operator()(AVIOContext* io) const {
        av_freep(&io->buffer);
        avio_context_free(&io);
    }
};

using Codec = std::unique_ptr<AVCodecContext, SFreeAv>;
using Frame = std::unique_ptr<AVFrame, SFreeAv>;
using Packet = std::unique_ptr<AVPacket, SFreeAv>;
using Resampler = std::unique_ptr<SwrContext, SFreeAv>;
using Scaler = std::unique_ptr<SwsContext, SFreeAv>;
using IoContext = std::unique_ptr<AVIOContext, SFreeAv>;

} // namespace sonora2::plugins::av
