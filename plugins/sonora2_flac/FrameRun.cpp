#include "sonora2_flac/FrameRun.h"

#include "sonora2_flac/FrameNumber.h"

#include <exception>

// Exported by the library, but not declared in its headers. Without it each run computes a checksum that
// nobody uses.
extern "C" FLAC__bool FLAC__stream_encoder_set_do_md5(FLAC__StreamEncoder* encoder, FLAC__bool value)
    __attribute__((weak));

namespace sonora2::plugins::flac {

CFrameRunEncoder::CFrameRunEncoder(const SStreamSettings& settings)
    : m_frameBytes(settings.format.frameBytes()), m_encoder(settings) {}

bool CFrameRunEncoder::canSplit(const SStreamSettings& settings) {
    // These levels choose how to join the channels of stereo for several frames at once.
    return settings.level != 1 && settings.level != 4;
}

void CFrameRunEncoder::encode(SFrameRun& run) noexcept {
    m_run = &run;
    FLAC__StreamEncoder* encoder = m_encoder.get();
    try {
        run.encoded.clear();
        run.frames.clear();
        m_encoder.configure();
        if (FLAC__stream_encoder_set_do_md5) FLAC__stream_encoder_set_do_md5(encoder, false);
        const bool encoded =
            FLAC__stream_encoder_init_stream(encoder, onWrite, nullptr, nullptr, nullptr, this) ==
                FLAC__STREAM_ENCODER_INIT_STATUS_OK &&
            m_encoder.process(run.pcm.data(), static_cast<int>(run.pcm.size()) / m_frameBytes);
        if (!encoded && run.failure.empty())
            run.failure = FLAC__stream_encoder_get_resolved_state_string(encoder);
        if (!FLAC__stream_encoder_finish(encoder) && run.failure.empty())
            run.failure = FLAC__stream_encoder_get_resolved_state_string(encoder);
    } catch (const std::exception& error) {
        run.failure = error.what();
    }
    m_run = nullptr;
}

FLAC__StreamEncoderWriteStatus CFrameRunEncoder::onWrite(const FLAC__StreamEncoder*, const FLAC__byte data[],
                                                         size_t size, uint32_t samples, uint32_t frame,
                                                         void* self) {
    if (samples == 0) return FLAC__STREAM_ENCODER_WRITE_STATUS_OK; // the header of a stream
    SFrameRun& run = *static_cast<CFrameRunEncoder*>(self)->m_run;
    try {
        const size_t before = run.encoded.size();
        appendRenumbered(run.encoded, data, size, run.firstNumber + frame);
        run.frames.push_back({static_cast<uint32_t>(run.encoded.size() - before), samples});
        return FLAC__STREAM_ENCODER_WRITE_STATUS_OK;
    } catch (const std::exception& error) {
        run.failure = error.what();
        return FLAC__STREAM_ENCODER_WRITE_STATUS_FATAL_ERROR;
    }
}

} // namespace sonora2::plugins::flac
