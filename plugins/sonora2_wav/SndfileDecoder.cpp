#include "sonora2_wav/SndfileDecoder.h"

#include "sonora2_wav/CodecName.h"
#include "support/Pcm.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <string>
#include <string_view>
#include <sys/stat.h>

namespace sonora2::plugins::wav {

namespace {

// The start of the container, behind a tag; -1 if it is of another kind. Other formats that the library reads
// have plug-ins of their own, and its MPEG decoder writes to standard error.
int64_t findContainer(std::FILE* file) {
    int64_t at = 0;
    std::array<char, 12> start{};
    size_t got = std::fread(start.data(), 1, start.size(), file);
    if (got == start.size() && std::string_view(start.data(), 3) == "ID3") {
        for (size_t i = 6; i < 10; ++i) at = at << 7 | (start[i] & 0x7F);
        at += 10;
        ::fseeko(file, at, SEEK_SET);
        got = std::fread(start.data(), 1, start.size(), file);
    }
    const std::string_view text(start.data(), got);
    const std::string_view type = text.substr(std::min<size_t>(got, 8));
    constexpr std::string_view kWave64("riff\x2E\x91\xCF\x11", 8);
    const bool isOwn = text.starts_with("FORM") ? type == "AIFF" || type == "AIFC"
                                                : text.starts_with("RIFF") || text.starts_with("RIFX") ||
                                                      text.starts_with("RF64") || text.starts_with(kWave64) ||
                                                      text.starts_with(".snd") || text.starts_with("dns.") ||
                                                      text.starts_with("caff");
    return isOwn ? at : -1;
}

bool isMpeg(int sampleFormat) {
    return sampleFormat >= SF_FORMAT_MPEG_LAYER_I && sampleFormat <= SF_FORMAT_MPEG_LAYER_III;
}

const char* getCodecName(int sampleFormat) {
    switch (sampleFormat) {
    case SF_FORMAT_PCM_U8:
        return "PCM unsigned 8 bit";
    case SF_FORMAT_PCM_S8:
        return "PCM signed 8 bit";
    case SF_FORMAT_PCM_16:
        return "PCM signed 16 bit";
    case SF_FORMAT_PCM_24:
        return "PCM signed 24 bit";
    case SF_FORMAT_PCM_32:
        return "PCM signed 32 bit";
    case SF_FORMAT_FLOAT:
        return "PCM float 32 bit";
    case SF_FORMAT_DOUBLE:
        return "PCM float 64 bit";
    case SF_FORMAT_ULAW:
        return "\u00b5-law";
    case SF_FORMAT_ALAW:
        return "A-law";
    case SF_FORMAT_IMA_ADPCM:
        return "IMA ADPCM";
    case SF_FORMAT_MS_ADPCM:
        return "Microsoft ADPCM";
    case SF_FORMAT_GSM610:
        return "GSM 06.10";
    case SF_FORMAT_G721_32:
        return "G.721 ADPCM";
    case SF_FORMAT_G723_24:
    case SF_FORMAT_G723_40:
        return "G.723 ADPCM";
    case SF_FORMAT_DWVW_12:
    case SF_FORMAT_DWVW_16:
    case SF_FORMAT_DWVW_24:
        return "DWVW";
    case SF_FORMAT_ALAC_16:
    case SF_FORMAT_ALAC_20:
    case SF_FORMAT_ALAC_24:
    case SF_FORMAT_ALAC_32:
        return "ALAC";
    case SF_FORMAT_MPEG_LAYER_I:
        return "MPEG audio layer I";
    case SF_FORMAT_MPEG_LAYER_II:
        return "MPEG audio layer II";
    case SF_FORMAT_MPEG_LAYER_III:
        return "MPEG audio layer III";
    default:
        return "";
    }
}

// 0 for compressed samples.
int getLinearBytes(int sampleFormat) {
    switch (sampleFormat) {
    case SF_FORMAT_PCM_U8:
    case SF_FORMAT_PCM_S8:
        return 1;
    case SF_FORMAT_PCM_16:
        return 2;
    case SF_FORMAT_PCM_24:
        return 3;
    case SF_FORMAT_PCM_32:
    case SF_FORMAT_FLOAT:
        return 4;
    case SF_FORMAT_DOUBLE:
        return 8;
    default:
        return 0;
    }
}

int32_t quantise(double sample) {
    const double value = sample * 2147483648.0;
    if (!(value > -2147483648.0)) return value == value ? INT32_MIN : 0;
    return value < 2147483647.0 ? static_cast<int32_t>(std::lrint(value)) : INT32_MAX;
}

} // namespace

CSndfileDecoder::CSndfileDecoder(const SMediaFile& file) : m_file(file) {}

SDecodedMedia CSndfileDecoder::open(const SDecoderOptions& options) {
    close();
    m_options = options;
    m_input = openForReading(m_file);
    m_start = findContainer(m_input.get());
    if (m_start < 0)
        fail({"sonora2.CSndfileDecoder.otherKind",
              "could not read %s: it is another kind of file than its name suggests"},
             m_file.getDisplayName());
    SF_INFO info{};
    openHandle(info);
    m_format = {info.samplerate, info.channels, 0};
    chooseTransfer(info.format & SF_FORMAT_SUBMASK);

    // A file cannot hold more linear samples than its size allows.
    const int sampleFormat = info.format & SF_FORMAT_SUBMASK;
    const int64_t frameBytes = getLinearBytes(sampleFormat) * std::max<int64_t>(info.channels, 1);
    m_frames = std::max<int64_t>(info.frames, 0);
    if (frameBytes > 0) m_frames = std::min(m_frames, getLength(this) / frameBytes);
    if (isMpeg(sampleFormat)) countFrames();
    return {m_format, m_frames, getCodecName(sampleFormat), getFloatBytes()};
}

// The library only estimates the length of MPEG audio.
void CSndfileDecoder::countFrames() {
    std::vector<short> samples(static_cast<size_t>(m_format.channels) * 8192);
    m_frames = 0;
    for (sf_count_t got = 1; got > 0; m_frames += got)
        got = std::max<sf_count_t>(sf_readf_short(m_handle.get(), samples.data(), 8192), 0);
    seek(0);
}

void CSndfileDecoder::chooseTransfer(int sampleFormat) {
    const bool swapped = sf_command(m_handle.get(), SFC_RAW_DATA_NEEDS_ENDSWAP, nullptr, 0) == SF_TRUE;
    const auto choose = [&](int bytesPerSample, ETransfer transfer) {
        m_format.bytesPerSample = bytesPerSample;
        m_transfer = transfer;
    };
    switch (sampleFormat) {
    case SF_FORMAT_PCM_U8:
        return choose(1, ETransfer::raw);
    case SF_FORMAT_PCM_S8:
        return choose(1, ETransfer::rawSigned8);
    case SF_FORMAT_PCM_16:
        return choose(2, swapped ? ETransfer::shorts : ETransfer::raw);
    case SF_FORMAT_PCM_24:
        return choose(3, swapped ? ETransfer::integers24 : ETransfer::raw);
    case SF_FORMAT_PCM_32:
        return choose(4, swapped ? ETransfer::integers32 : ETransfer::raw);
    case SF_FORMAT_FLOAT:
        return choose(4, ETransfer::floats);
    case SF_FORMAT_DOUBLE:
        return choose(4, ETransfer::doubles);
    case SF_FORMAT_ALAC_20:
    case SF_FORMAT_ALAC_24:
        return choose(3, ETransfer::integers24);
    case SF_FORMAT_ALAC_32:
        return choose(4, ETransfer::integers32);
    default:
        return choose(2, ETransfer::shorts);
    }
}

void CSndfileDecoder::close() {
    reportClipping();
    m_handle.reset();
    m_input.reset();
    m_position = m_checked = 0;
    m_deliversFloat = false;
    m_scale = 0.0;
}

int CSndfileDecoder::read(uint8_t* pcm, int frames) {
    SNDFILE* handle = m_handle.get();
    const size_t samples = static_cast<size_t>(frames) * m_format.channels;
    const auto countSamples = [&](sf_count_t got) { return static_cast<size_t>(got) * m_format.channels; };
    sf_count_t got = 0;
    frames = static_cast<int>(std::min<int64_t>(frames, m_frames - m_position));
    if (m_deliversFloat) return readFloat(pcm, frames);
    if (getFloatBytes() > 0 && m_scale == 0.0) findScale();
    switch (m_transfer) {
    case ETransfer::raw:
    case ETransfer::rawSigned8: {
        const int64_t frameBytes = m_format.frameBytes();
        got = std::max<sf_count_t>(sf_read_raw(handle, pcm, frames * frameBytes), 0) / frameBytes;
        if (m_transfer == ETransfer::rawSigned8) pcm::flipSign8(pcm, countSamples(got));
        break;
    }
    case ETransfer::shorts:
        got = sf_readf_short(handle, reinterpret_cast<short*>(pcm), frames);
        break;
    case ETransfer::integers32:
        got = sf_readf_int(handle, reinterpret_cast<int*>(pcm), frames);
        break;
    case ETransfer::integers24: {
        m_integers.resize(samples);
        got = sf_readf_int(handle, m_integers.data(), frames);
        const size_t count = countSamples(got);
        for (size_t i = 0; i < count; ++i) m_integers[i] >>= 8;
        pcm::pack(m_integers.data(), pcm, 3, count);
        break;
    }
    case ETransfer::floats:
        m_floats.resize(samples);
        got = sf_readf_float(handle, m_floats.data(), frames);
        scale(m_floats, countSamples(got));
        checkClipping(m_floats.data(), got);
        pcm::packFloat(m_floats.data(), pcm, 4, countSamples(got));
        break;
    case ETransfer::doubles: {
        m_doubles.resize(samples);
        got = sf_readf_double(handle, m_doubles.data(), frames);
        scale(m_doubles, countSamples(got));
        checkClipping(m_doubles.data(), got);
        const size_t count = countSamples(got);
        for (size_t i = 0; i < count; ++i) {
            const int32_t value = quantise(m_doubles[i]);
            std::memcpy(pcm + i * 4, &value, 4);
        }
        break;
    }
    }
    got = std::max<sf_count_t>(got, 0);
    m_position += got;
    if (m_position >= m_frames) reportClipping();
    return static_cast<int>(got);
}

int CSndfileDecoder::getFloatBytes() const {
    return m_transfer == ETransfer::floats ? 4 : m_transfer == ETransfer::doubles ? 8 : 0;
}

int CSndfileDecoder::readFloat(uint8_t* pcm, int frames) {
    SNDFILE* handle = m_handle.get();
    const sf_count_t got = m_transfer == ETransfer::floats
                               ? sf_readf_float(handle, reinterpret_cast<float*>(pcm), frames)
                               : sf_readf_double(handle, reinterpret_cast<double*>(pcm), frames);
    m_position += std::max<sf_count_t>(got, 0);
    return static_cast<int>(std::max<sf_count_t>(got, 0));
}

// A peak stored in the file may be wrong or missing.
void CSndfileDecoder::findScale() {
    m_scale = 1.0;
    if (!m_options.preventClipping) return;
    constexpr int kFrames = 4096;
    m_doubles.resize(static_cast<size_t>(m_format.channels) * kFrames);
    const int64_t position = m_position;
    double peak = 0.0;
    seek(0);
    for (sf_count_t got; (got = sf_readf_double(m_handle.get(), m_doubles.data(), kFrames)) > 0;)
        for (sf_count_t i = 0; i < got * m_format.channels; ++i)
            if (const double level = std::fabs(m_doubles[static_cast<size_t>(i)]); std::isfinite(level))
                peak = std::max(peak, level);
    seek(position);
    if (peak <= 1.0) return;
    m_scale = 1.0 / peak;
    m_options.warn({"sonora2.CSndfileDecoder.reduced", "%s: reduced by %.1f dB to prevent clipping"},
                   m_file.getDisplayName(), 20.0 * std::log10(peak));
}

template <class Sample> void CSndfileDecoder::scale(std::vector<Sample>& samples, size_t count) const {
    if (m_scale == 1.0) return;
    // One step less, so that the rounded peak does not exceed full scale.
    const Sample factor = std::nextafter(static_cast<Sample>(m_scale), Sample{0});
    for (size_t i = 0; i < count; ++i) samples[i] *= factor;
}

void CSndfileDecoder::seek(int64_t frame) {
    if (sf_seek(m_handle.get(), frame, SEEK_SET) == frame) {
        m_position = frame;
        return;
    }
    // Some compressed formats can only be decoded from their start.
    SF_INFO info{};
    openHandle(info);
    constexpr int kFrames = 4096;
    std::vector<short> dropped(static_cast<size_t>(m_format.channels) * kFrames);
    for (m_position = 0; m_position < frame;) {
        const sf_count_t got =
            sf_readf_short(m_handle.get(), dropped.data(), std::min<int64_t>(frame - m_position, kFrames));
        if (got <= 0)
            fail({"sonora2.CSndfileDecoder.seek", "could not find frame %d of %s: %s"}, frame,
                 m_file.getDisplayName(), peru::CString::fromUTF8(sf_strerror(m_handle.get())));
        m_position += got;
    }
}

// Floating-point samples are left to one decoder, which counts those that clip.
std::unique_ptr<IDecoder> CSndfileDecoder::createTwin() {
    if (m_transfer != ETransfer::raw && m_transfer != ETransfer::rawSigned8) return nullptr;
    return std::make_unique<CSndfileDecoder>(m_file);
}

template <class Sample> void CSndfileDecoder::checkClipping(const Sample* samples, sf_count_t frames) {
    const int64_t known = std::clamp<int64_t>(m_checked - m_position, 0, std::max<int64_t>(frames, 0));
    Sample peak = 0;
    int64_t clipped = 0;
    for (int64_t i = known * m_format.channels; i < frames * m_format.channels; ++i) {
        const Sample level = std::fabs(samples[i]);
        if (!(level > Sample{1})) continue; // NaN is converted to 0
        ++clipped;
        peak = std::max(peak, level);
    }
    m_clipped += clipped;
    m_peak = std::max<double>(m_peak, peak);
    m_checked = std::max(m_checked, m_position + frames);
}

void CSndfileDecoder::reportClipping() {
    if (m_clipped == 0) return;
    m_options.warn({"sonora2.CSndfileDecoder.clipped", "%s: clipped %d samples, peak +%.1f dB"},
                   m_file.getDisplayName(), m_clipped, 20.0 * std::log10(m_peak));
    m_clipped = 0;
    m_peak = 0.0;
}

void CSndfileDecoder::openHandle(SF_INFO& info) {
    m_patches = {findMissingSize(m_input.get()), findMissingWidth(m_input.get())};
    if (m_patches[0].size > 0)
        m_options.warn({"sonora2.CSndfileDecoder.notCompleted",
                        "%s was not completed by its writer and is read to its end"},
                       m_file.getDisplayName());
    ::fseeko(m_input.get(), m_start, SEEK_SET);
    SOpenedSndfile opened =
        openSndfile({getLength, seekInput, readInput, writeNothing, tellInput}, SFM_READ, info, this);
    m_handle = std::move(opened.handle);
    if (m_handle) return;
    const std::string codec = readUnsupportedCodec(m_input.get(), opened.isUnsupportedCodec);
    if (!codec.empty())
        fail({"sonora2.CSndfileDecoder.codec",
              "could not read %s: the codec %s is not supported in this type of file"},
             m_file.getDisplayName(), peru::CString::fromUTF8(codec));
    fail({"sonora2.plugins.read", "could not read %s: %s"}, m_file.getDisplayName(),
         peru::CString::fromUTF8(opened.reason));
}

// What the library sees begins at the container: it would miscount the sound behind a tag.
sf_count_t CSndfileDecoder::getLength(void* self) {
    const CSndfileDecoder& decoder = *static_cast<CSndfileDecoder*>(self);
    struct stat status {};
    return ::fstat(::fileno(decoder.m_input.get()), &status) == 0 ? status.st_size - decoder.m_start : 0;
}

sf_count_t CSndfileDecoder::seekInput(sf_count_t offset, int whence, void* self) {
    const CSndfileDecoder& decoder = *static_cast<CSndfileDecoder*>(self);
    if (whence == SEEK_SET) offset += decoder.m_start;
    return ::fseeko(decoder.m_input.get(), offset, whence) == 0 ? tellInput(self) : -1;
}

sf_count_t CSndfileDecoder::readInput(void* data, sf_count_t size, void* self) {
    const CSndfileDecoder& decoder = *static_cast<CSndfileDecoder*>(self);
    const int64_t at = tellInput(self);
    const auto got =
        static_cast<int64_t>(std::fread(data, 1, static_cast<size_t>(size), decoder.m_input.get()));
    for (const SPatch& patch : decoder.m_patches)
        for (size_t i = 0; i < patch.size; ++i) {
            const int64_t place = patch.offset + static_cast<int64_t>(i) - at;
            if (place >= 0 && place < got) static_cast<uint8_t*>(data)[place] = patch.bytes[i];
        }
    return got;
}

sf_count_t CSndfileDecoder::writeNothing(const void*, sf_count_t, void*) {
    return 0;
}

sf_count_t CSndfileDecoder::tellInput(void* self) {
    const CSndfileDecoder& decoder = *static_cast<CSndfileDecoder*>(self);
    return ::ftello(decoder.m_input.get()) - decoder.m_start;
}

} // namespace sonora2::plugins::wav
