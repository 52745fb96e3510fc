#include "sonora2_l3codec/Mp3Encoder.h"

#include "support/BitRate.h"
#include "support/Pcm.h"

#include <algorithm>
#include <cstdarg>
#include <iterator>
#include <new>

namespace sonora2::plugins {

namespace {

constexpr double kDefaultQuality = 0.8; // V2
constexpr int kRates[] = {8000, 11025, 12000, 16000, 22050, 24000, 32000, 44100, 48000};

int toKilobits(int bitRate) {
    return bitRate / 1000; // never 0, which would leave the choice to the codec
}

// Those of MPEG-1, MPEG-2 and MPEG-2.5. The codec would silently use the nearest one instead of others.
SBitRateRange getBitRates(int rate) {
    return rate >= 32000   ? SBitRateRange{32000, 320000}
           : rate >= 16000 ? SBitRateRange{8000, 160000}
                           : SBitRateRange{8000, 64000};
}

float toVbrQuality(double quality) {
    return static_cast<float>(std::clamp((1.0 - quality) * 10, 0.0, 9.999));
}

bool isAverage(const SEncoderSettings& settings) {
    const int nominal = settings.nominalBitRate;
    return (settings.minBitRate > 0 && settings.minBitRate != nominal) ||
           (settings.maxBitRate > 0 && settings.maxBitRate != nominal);
}

} // namespace

// The codec would silently resample other rates and drop channels after the second.
bool CMp3Encoder::accepts(const SPcmFormat& format) const {
    if (format.channels <= 2 &&
        std::find(std::begin(kRates), std::end(kRates), format.rate) != std::end(kRates))
        return true;
    fail({"sonora2.CMp3Encoder.formats", "MP3 files hold 1 or 2 channels at 8, 11.025, 12, 16, 22.05, 24, "
                                         "32, 44.1 or 48 kHz, not %d channels at %d Hz"},
         format.channels, format.rate);
}

void CMp3Encoder::open(COutputFile& file, const SEncoderSettings& settings) {
    m_file = &file;
    m_format = settings.format;
    const SBitRateRange range = getBitRates(m_format.rate);
    for (const int bitRate : {settings.nominalBitRate, settings.maxBitRate, settings.minBitRate})
        requireBitRate(file.getFile(), "MP3", m_format, bitRate, range);
    m_encoder.reset(lame_init());
    lame_t encoder = m_encoder.get();
    if (!encoder) throw std::bad_alloc();
    const auto ignore = [](const char*, va_list) {};
    lame_set_errorf(encoder, ignore);
    lame_set_debugf(encoder, ignore);
    lame_set_msgf(encoder, ignore);

    lame_set_num_channels(encoder, m_format.channels);
    lame_set_in_samplerate(encoder, m_format.rate);
    lame_set_out_samplerate(encoder, m_format.rate); // otherwise low bit rates would change it
    if (m_format.channels == 1) lame_set_mode(encoder, MONO);
    lame_set_write_id3tag_automatic(encoder, 0);
    if (settings.nominalBitRate > 0 && !isAverage(settings)) {
        lame_set_brate(encoder, toKilobits(settings.nominalBitRate));
    } else if (settings.nominalBitRate > 0) {
        lame_set_VBR(encoder, vbr_abr);
        lame_set_VBR_mean_bitrate_kbps(encoder, toKilobits(settings.nominalBitRate));
    } else {
        lame_set_VBR(encoder, vbr_default);
        lame_set_VBR_quality(encoder, toVbrQuality(settings.quality.value_or(kDefaultQuality)));
    }
    if (isAverage(settings)) {
        if (settings.minBitRate > 0) lame_set_VBR_min_bitrate_kbps(encoder, toKilobits(settings.minBitRate));
        if (settings.maxBitRate > 0) lame_set_VBR_max_bitrate_kbps(encoder, toKilobits(settings.maxBitRate));
    }
    if (lame_init_params(encoder) < 0)
        fail({"sonora2.CMp3Encoder.noMode",
              "could not write %s: MP3 has no mode for %d Hz, %d channels and these bit rates"},
             file.getFile().getDisplayName(), m_format.rate, m_format.channels);
}

void CMp3Encoder::write(const uint8_t* pcm, int frames) {
    // The bound given in the codec's documentation.
    m_encoded.resize(static_cast<size_t>(frames) * 5 / 4 + 7200);
    const int capacity = static_cast<int>(m_encoded.size());
    const bool stereo = m_format.channels == 2;
    if (m_format.bytesPerSample == 2) {
        auto* samples = reinterpret_cast<short*>(const_cast<uint8_t*>(pcm)); // not modified
        writeEncoded(
            stereo
                ? lame_encode_buffer_interleaved(m_encoder.get(), samples, frames, m_encoded.data(), capacity)
                : lame_encode_buffer(m_encoder.get(), samples, nullptr, frames, m_encoded.data(), capacity));
        return;
    }
    // The codec expects integers scaled to the full 32-bit range.
    m_samples.resize(static_cast<size_t>(frames) * static_cast<size_t>(m_format.channels));
    pcm::unpack(pcm, m_format.bytesPerSample, m_samples.data(), m_samples.size());
    const int shift = 32 - 8 * m_format.bytesPerSample;
    for (int32_t& sample : m_samples) sample <<= shift;
    writeEncoded(stereo ? lame_encode_buffer_interleaved_int(m_encoder.get(), m_samples.data(), frames,
                                                             m_encoded.data(), capacity)
                        : lame_encode_buffer_int(m_encoder.get(), m_samples.data(), nullptr, frames,
                                                 m_encoded.data(), capacity));
}

void CMp3Encoder::finish() {
    m_encoded.resize(7200);
    writeEncoded(lame_encode_flush(m_encoder.get(), m_encoded.data(), static_cast<int>(m_encoded.size())));

    // The first frame was reserved for what is only known now: length, delay and the seek table.
    size_t size = lame_get_lametag_frame(m_encoder.get(), nullptr, 0);
    if (size == 0) return;
    m_encoded.resize(size);
    size = lame_get_lametag_frame(m_encoder.get(), m_encoded.data(), m_encoded.size());
    m_file->seek(0);
    m_file->write(m_encoded.data(), size);
}

void CMp3Encoder::writeEncoded(int bytes) {
    if (bytes < 0)
        fail({"sonora2.CMp3Encoder.failed", "could not write %s: the MP3 encoder failed with %d"},
             m_file->getFile().getDisplayName(), bytes);
    m_file->write(m_encoded.data(), static_cast<size_t>(bytes));
}

int64_t CMp3Encoder::estimateBytes(double seconds, const SEncoderSettings& settings) const {
    double bitRate = settings.nominalBitRate;
    if (bitRate <= 0) {
        // Typical bit rates of V10 to V0 for stereo at 44.1 kHz, in kbit/s.
        static constexpr double kBitRates[] = {65, 85, 100, 115, 130, 165, 175, 190, 225, 245, 260};
        const double tenths = settings.quality.value_or(kDefaultQuality) * 10;
        const int below = std::min(static_cast<int>(tenths), static_cast<int>(std::size(kBitRates)) - 2);
        bitRate = (kBitRates[below] + (tenths - below) * (kBitRates[below + 1] - kBitRates[below])) * 1000;
        bitRate *= settings.format.channels == 1 ? 0.6 : 1.0;
    }
    return static_cast<int64_t>(seconds * bitRate / 8);
}

} // namespace sonora2::plugins
