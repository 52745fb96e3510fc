#include "sonora2_wav/WavEncoder.h"

#include <array>
#include <cmath>
#include <cstring>

namespace sonora2::plugins::wav {

namespace {

constexpr int kPlainFormatBytes = 16;
constexpr int kExtensibleFormatBytes = 40;
constexpr int kSizesBytes = 28;                           // of the chunk that holds the sizes of RF64
constexpr int kFixedBytes = 12 + 8 + kSizesBytes + 8 + 8; // header size without the format
constexpr int kFactBytes = 4; // the number of frames, which only files of integers may omit
constexpr uint16_t kPcm = 1;
constexpr uint16_t kFloat = 3;
constexpr uint16_t kExtensible = 0xFFFE;
constexpr uint32_t kInSizesChunk = 0xFFFFFFFF;

// The usual speaker mask for each number of channels; more channels have none.
constexpr std::array<uint32_t, 9> kSpeakers{0, 0x4, 0x3, 0x7, 0x33, 0x37, 0x3F, 0x70F, 0x63F};
// The subformat GUIDs of integers and floating-point samples without their first two bytes.
constexpr std::array<uint8_t, 14> kSubformat{0, 0, 0, 0, 0x10, 0, 0x80, 0, 0, 0xAA, 0, 0x38, 0x9B, 0x71};

bool isExtensible(const SPcmFormat& format) {
    return format.channels > 2 || format.bytesPerSample > 2;
}

int getHeaderBytes(const SPcmFormat& format) {
    return kFixedBytes + (isExtensible(format) ? kExtensibleFormatBytes : kPlainFormatBytes) +
           (format.isFloat ? 8 + kFactBytes : 0);
}

bool fits(const SPcmFormat& format) {
    return format.channels <= UINT16_MAX / format.bytesPerSample &&
           int64_t{format.rate} * format.frameBytes() <= UINT32_MAX;
}

class CHeader {
public:
    void put(const char (&id)[5]) { append(id, 4); }
    void put16(int64_t value) { putInteger(static_cast<uint16_t>(value)); }
    void put32(int64_t value) { putInteger(static_cast<uint32_t>(value)); }
    void put64(int64_t value) { putInteger(value); }
    void append(const void* data, size_t size) {
        std::memcpy(m_bytes.data() + m_size, data, size);
        m_size += size;
    }
    const uint8_t* getData() const { return m_bytes.data(); }
    size_t getSize() const { return m_size; }

private:
    template <class T> void putInteger(T value) { append(&value, sizeof(value)); }

    std::array<uint8_t, kFixedBytes + kExtensibleFormatBytes + 8 + kFactBytes> m_bytes{};
    size_t m_size = 0;
};

} // namespace

bool CWavEncoder::accepts(const SPcmFormat& format) const {
    if (fits(format)) return true;
    fail({"sonora2.CWavEncoder.formats", "WAV files hold frames of up to 65535 bytes and up to 4 GiB per "
                                         "second, not %d channels at %d Hz in %d bits"},
         format.channels, format.rate, format.bytesPerSample * 8);
}

bool CWavEncoder::holdsFloat(const SPcmFormat& format) const {
    return fits(format);
}

void CWavEncoder::open(COutputFile& file, const SEncoderSettings& settings) {
    m_file = &file;
    m_format = settings.format;
    m_dataBytes = 0;
    writeHeader();
}

void CWavEncoder::write(const uint8_t* pcm, int frames) {
    const size_t bytes = static_cast<size_t>(frames) * m_format.frameBytes();
    m_file->write(pcm, bytes);
    m_dataBytes += static_cast<int64_t>(bytes);
}

void CWavEncoder::update() {
    const int64_t end = m_file->tell();
    m_file->seek(0);
    writeHeader();
    m_file->seek(end);
}

void CWavEncoder::finish() {
    if (m_dataBytes % 2 != 0) m_file->write("", 1); // chunks are aligned to even offsets
    m_file->seek(0);
    writeHeader();
}

void CWavEncoder::writeHeader() {
    const int64_t padded = m_dataBytes + m_dataBytes % 2;
    const int64_t riffBytes = getHeaderBytes(m_format) + padded - 8;
    const bool large = riffBytes >= kInSizesChunk;
    CHeader header;
    if (large)
        header.put("RF64");
    else
        header.put("RIFF");
    header.put32(large ? kInSizesChunk : riffBytes);
    header.put("WAVE");

    if (large)
        header.put("ds64");
    else
        header.put("JUNK");
    header.put32(kSizesBytes);
    header.put64(large ? riffBytes : 0);
    header.put64(large ? m_dataBytes : 0);
    header.put64(large ? m_dataBytes / m_format.frameBytes() : 0);
    header.put32(0); // the table of other chunks is empty

    const bool extensible = isExtensible(m_format);
    header.put("fmt ");
    header.put32(extensible ? kExtensibleFormatBytes : kPlainFormatBytes);
    header.put16(extensible ? kExtensible : kPcm);
    header.put16(m_format.channels);
    header.put32(m_format.rate);
    header.put32(int64_t{m_format.rate} * m_format.frameBytes());
    header.put16(m_format.frameBytes());
    header.put16(m_format.bytesPerSample * 8);
    if (extensible) {
        const size_t channels = static_cast<size_t>(m_format.channels);
        header.put16(kExtensibleFormatBytes - kPlainFormatBytes - 2);
        header.put16(m_format.bytesPerSample * 8);
        header.put32(channels < kSpeakers.size() ? kSpeakers[channels] : 0);
        header.put16(m_format.isFloat ? kFloat : kPcm);
        header.append(kSubformat.data(), kSubformat.size());
    }
    if (m_format.isFloat) {
        header.put("fact");
        header.put32(kFactBytes);
        header.put32(large ? kInSizesChunk : m_dataBytes / m_format.frameBytes());
    }
    header.put("data");
    header.put32(large ? kInSizesChunk : m_dataBytes);
    m_file->write(header.getData(), header.getSize());
}

int64_t CWavEncoder::estimateBytes(double seconds, const SEncoderSettings& settings) const {
    const int64_t data = std::llround(seconds * settings.format.rate) * settings.format.frameBytes();
    return getHeaderBytes(settings.format) + data + data % 2;
}

} // namespace sonora2::plugins::wav
