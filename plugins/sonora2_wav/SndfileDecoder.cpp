#include "sonora2_wav/SndfileDecoder.h"

#include "support/Pcm.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <filesystem>

namespace sonora2::plugins::wav {

namespace {

bool isOwnContainer(int format) {
    switch (format & SF_FORMAT_TYPEMASK) {
    case SF_FORMAT_WAV:
    case SF_FORMAT_WAVEX:
    case SF_FORMAT_RF64:
    case SF_FORMAT_W64:
    case SF_FORMAT_AIFF:
    case SF_FORMAT_AU:
    case SF_FORMAT_CAF:
        return true;
    default:
        return false; // compressed formats that the library also reads have plug-ins of their own
    }
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
    default:
        return "";
    }
}

int32_t quantise(double sample) {
    const double value = sample * 2147483648.0;
    if (!(value > -2147483648.0)) return value == value ? INT32_MIN : 0;
    return value < 2147483647.0 ? static_cast<int32_t>(std::lrint(value)) : INT32_MAX;
}

} // namespace

CSndfileDecoder::CSndfileDecoder(const SMediaFile& file) : m_file(file) {}

SDecodedMedia CSndfileDecoder::open() {
    close();
    m_input = openForReading(m_file);
    SF_INFO info{};
    m_handle.reset(sf_open_fd(fileno(m_input.get()), SFM_READ, &info, SF_FALSE));
    if (!m_handle)
        fail("could not read %s: %s", m_file.getDisplayName(), peru::CString::fromUTF8(sf_strerror(nullptr)));
    if (!isOwnContainer(info.format)) {
        close();
        fail("%s holds another kind of file than its name tells", m_file.getDisplayName());
    }
    m_format = {info.samplerate, info.channels, 0};
    chooseTransfer(info.format & SF_FORMAT_SUBMASK);

    int64_t frames = info.frames;
    if (m_transfer != ETransfer::shorts) {
        // A file cannot hold more linear samples than its size allows.
        std::error_code error;
        const uintmax_t size = std::filesystem::file_size(m_file.path, error);
        const int64_t width = m_transfer == ETransfer::doubles ? 8 : m_format.bytesPerSample;
        if (!error)
            frames = std::min(frames, static_cast<int64_t>(size) / (width * std::max(info.channels, 1)));
    }
    return {m_format, std::max<int64_t>(frames, 0), getCodecName(info.format & SF_FORMAT_SUBMASK)};
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
    m_handle.reset();
    m_input.reset();
}

int CSndfileDecoder::read(uint8_t* pcm, int frames) {
    SNDFILE* handle = m_handle.get();
    const size_t samples = static_cast<size_t>(frames) * m_format.channels;
    const auto countSamples = [&](sf_count_t got) { return static_cast<size_t>(got) * m_format.channels; };
    sf_count_t got = 0;
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
        pcm::packFloat(m_floats.data(), pcm, 4, countSamples(got));
        break;
    case ETransfer::doubles: {
        m_doubles.resize(samples);
        got = sf_readf_double(handle, m_doubles.data(), frames);
        const size_t count = countSamples(got);
        for (size_t i = 0; i < count; ++i) {
            const int32_t value = quantise(m_doubles[i]);
            std::memcpy(pcm + i * 4, &value, 4);
        }
        break;
    }
    }
    return static_cast<int>(std::max<sf_count_t>(got, 0));
}

void CSndfileDecoder::seek(int64_t frame) {
    if (sf_seek(m_handle.get(), frame, SEEK_SET) != frame)
        fail("could not find frame %d of %s: %s", frame, m_file.getDisplayName(),
             peru::CString::fromUTF8(sf_strerror(m_handle.get())));
}

} // namespace sonora2::plugins::wav
