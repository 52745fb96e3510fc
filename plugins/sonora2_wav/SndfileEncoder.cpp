#include "sonora2_wav/SndfileEncoder.h"

#include "support/Pcm.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>

namespace sonora2::plugins::wav {

namespace {

constexpr int64_t kFourGiB = int64_t{1} << 32;

sf_count_t getLength(void* file) {
    return static_cast<COutputFile*>(file)->getSize();
}

sf_count_t seekTo(sf_count_t offset, int whence, void* context) {
    COutputFile* file = static_cast<COutputFile*>(context);
    const int64_t base = whence == SEEK_SET ? 0 : whence == SEEK_CUR ? file->tell() : file->getSize();
    file->trySeek(base + offset);
    return file->tell();
}

sf_count_t readNothing(void*, sf_count_t, void*) {
    return 0; // the file is only written
}

sf_count_t writeBytes(const void* data, sf_count_t size, void* file) {
    return static_cast<COutputFile*>(file)->tryWrite(data, static_cast<size_t>(size)) ? size : 0;
}

sf_count_t getPosition(void* file) {
    return static_cast<COutputFile*>(file)->tell();
}

} // namespace

// One row per extension. The header size is what the library writes in addition to the samples; the size of
// the samples is rounded up to `alignment`.
struct CSndfileEncoder::SContainer {
    const char* extension;
    int format;
    bool signed8;
    bool below4GiB; // its header stores 32-bit sizes
    int headerBytes;
    int floatHeaderBytes; // the same for floating-point samples
    int alignment;

    int getHeaderBytes(const SPcmFormat& samples) const {
        return samples.isFloat ? floatHeaderBytes : headerBytes;
    }
};

const CSndfileEncoder::SContainer& CSndfileEncoder::findContainer(const std::string& extension) {
    static constexpr std::array<SContainer, 8> kContainers{{
        {"aif", SF_FORMAT_AIFF, true, true, 54, 72, 2},
        {"aiff", SF_FORMAT_AIFF, true, true, 54, 72, 2},
        {"aifc", SF_FORMAT_AIFF, true, true, 54, 72, 2},
        {"au", SF_FORMAT_AU, true, true, 24, 24, 1},
        {"snd", SF_FORMAT_AU, true, true, 24, 24, 1},
        {"caf", SF_FORMAT_CAF, true, false, 4096, 4096, 2},
        {"w64", SF_FORMAT_W64, false, false, 104, 136, 1},
        {"rf64", SF_FORMAT_RF64, false, false, 104, 136, 2},
    }};
    const auto found = std::ranges::find(kContainers, extension, &SContainer::extension);
    return found != kContainers.end() ? *found : kContainers.front();
}

CSndfileEncoder::CSndfileEncoder(const std::string& extension) : m_container(findContainer(extension)) {}

SF_INFO CSndfileEncoder::describe(const SPcmFormat& format) const {
    constexpr std::array<int, 3> kWidths{SF_FORMAT_PCM_16, SF_FORMAT_PCM_24, SF_FORMAT_PCM_32};
    SF_INFO info{};
    info.samplerate = format.rate;
    info.channels = format.channels;
    info.format = m_container.format;
    if (format.isFloat)
        info.format |= format.bytesPerSample == 4 ? SF_FORMAT_FLOAT : SF_FORMAT_DOUBLE;
    else if (format.bytesPerSample == 1)
        info.format |= m_container.signed8 ? SF_FORMAT_PCM_S8 : SF_FORMAT_PCM_U8;
    else
        info.format |= kWidths[static_cast<size_t>(format.bytesPerSample - 2)];
    return info;
}

bool CSndfileEncoder::accepts(const SPcmFormat& format) const {
    const SF_INFO info = describe(format);
    if (sf_format_check(&info)) return true;
    fail({"sonora2.CSndfileEncoder.formats",
          ".%s files hold up to 1024 channels, not %d channels at %d Hz in %d bits"},
         m_container.extension, format.channels, format.rate, format.bytesPerSample * 8);
}

bool CSndfileEncoder::holdsFloat(const SPcmFormat& format) const {
    const SF_INFO info = describe(format);
    return sf_format_check(&info);
}

void CSndfileEncoder::open(COutputFile& file, const SEncoderSettings& settings) {
    m_file = &file;
    m_format = settings.format;
    m_bytes = 0;
    SF_INFO info = describe(m_format);
    SOpenedSndfile opened =
        openSndfile({getLength, seekTo, readNothing, writeBytes, getPosition}, SFM_WRITE, info, &file);
    m_handle = std::move(opened.handle);
    file.throwFailure();
    if (!m_handle)
        fail({"sonora2.plugins.write", "could not write %s: %s"}, file.getFile().getDisplayName(),
             peru::CString::fromUTF8(opened.reason));
    sf_command(m_handle.get(), SFC_SET_ADD_PEAK_CHUNK, nullptr, SF_FALSE);
    m_swapped = sf_command(m_handle.get(), SFC_RAW_DATA_NEEDS_ENDSWAP, nullptr, 0) == SF_TRUE;
}

void CSndfileEncoder::write(const uint8_t* pcm, int frames) {
    const int64_t bytes = int64_t{frames} * m_format.frameBytes();
    const size_t samples = static_cast<size_t>(frames) * m_format.channels;
    if (m_container.below4GiB && m_bytes + bytes + m_container.getHeaderBytes(m_format) >= kFourGiB)
        fail({"sonora2.CSndfileEncoder.tooLarge", "%s would grow beyond 4 GiB, which its format cannot hold"},
             m_file->getFile().getDisplayName());
    SNDFILE* handle = m_handle.get();
    bool written = false;
    if (m_format.bytesPerSample == 1 && m_container.signed8) {
        m_signed8.assign(pcm, pcm + bytes);
        pcm::flipSign8(m_signed8.data(), m_signed8.size());
        written = sf_write_raw(handle, m_signed8.data(), bytes) == bytes;
    } else if (m_format.bytesPerSample == 1 || !m_swapped) {
        written = sf_write_raw(handle, pcm, bytes) == bytes;
    } else if (m_format.isFloat) {
        written = m_format.bytesPerSample == 4
                      ? sf_writef_float(handle, reinterpret_cast<const float*>(pcm), frames) == frames
                      : sf_writef_double(handle, reinterpret_cast<const double*>(pcm), frames) == frames;
    } else if (m_format.bytesPerSample == 2) {
        written = sf_writef_short(handle, reinterpret_cast<const short*>(pcm), frames) == frames;
    } else if (m_format.bytesPerSample == 4) {
        written = sf_writef_int(handle, reinterpret_cast<const int*>(pcm), frames) == frames;
    } else {
        m_integers.resize(samples);
        pcm::unpack(pcm, 3, m_integers.data(), samples);
        for (int32_t& sample : m_integers) sample <<= 8;
        written = sf_writef_int(handle, m_integers.data(), frames) == frames;
    }
    m_bytes += bytes;
    if (written) return;
    m_file->throwFailure();
    fail({"sonora2.plugins.write", "could not write %s: %s"}, m_file->getFile().getDisplayName(),
         peru::CString::fromUTF8(sf_strerror(handle)));
}

void CSndfileEncoder::update() {
    sf_command(m_handle.get(), SFC_UPDATE_HEADER_NOW, nullptr, 0);
    m_file->throwFailure();
}

void CSndfileEncoder::finish() {
    if (sf_close(m_handle.release()) != 0) {
        m_file->throwFailure();
        fail({"sonora2.CSndfileEncoder.finish", "could not complete %s"}, m_file->getFile().getDisplayName());
    }
    if (m_bytes % 2 != 0) correctSizes();
}

// The library counts the padding byte of an odd length as sound; readers would find one sample too many.
void CSndfileEncoder::correctSizes() {
    constexpr int kAiffFrames = 22; // offsets of the counts in the library's headers
    constexpr int kAiffDataSize = 42;
    constexpr int kCafDataSize = 4084;
    const auto put = [this](int64_t at, uint64_t value, int bytes) {
        std::array<uint8_t, 8> bigEndian{};
        for (int i = bytes - 1; i >= 0; --i, value >>= 8)
            bigEndian[static_cast<size_t>(i)] = static_cast<uint8_t>(value);
        m_file->seek(at);
        m_file->write(bigEndian.data(), static_cast<size_t>(bytes));
    };
    if (m_container.format == SF_FORMAT_AIFF) {
        put(kAiffFrames, static_cast<uint64_t>(m_bytes / m_format.frameBytes()), 4);
        put(kAiffDataSize, static_cast<uint64_t>(m_bytes + 8), 4);
    } else if (m_container.format == SF_FORMAT_CAF) {
        put(kCafDataSize, static_cast<uint64_t>(m_bytes + 4), 8);
    }
}

int64_t CSndfileEncoder::estimateBytes(double seconds, const SEncoderSettings& settings) const {
    const int64_t samples = std::llround(seconds * settings.format.rate) * settings.format.frameBytes();
    const int64_t alignment = m_container.alignment;
    return m_container.getHeaderBytes(settings.format) + (samples + alignment - 1) / alignment * alignment;
}

} // namespace sonora2::plugins::wav
