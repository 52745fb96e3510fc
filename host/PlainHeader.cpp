#include "PlainHeader.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <fstream>
#include <string>

namespace host {

namespace {

// The format stands at the start; some writers put small chunks before it.
constexpr size_t kHeaderBytes = 64 * 1024;
constexpr int kMaxChannels = 1024;

class CBytes {
public:
    explicit CBytes(std::string bytes) : m_bytes(std::move(bytes)) {}

    bool has(size_t at, std::string_view text) const {
        return at <= m_bytes.size() && std::string_view(m_bytes).substr(at, text.size()) == text;
    }
    // Of up to 8 bytes; 0 behind the end.
    uint64_t little(size_t at, size_t width) const {
        uint64_t value = 0;
        for (size_t i = width; i-- > 0;) value = value << 8 | byte(at + i);
        return value;
    }
    uint64_t big(size_t at, size_t width) const {
        uint64_t value = 0;
        for (size_t i = 0; i < width; ++i) value = value << 8 | byte(at + i);
        return value;
    }
    size_t size() const { return m_bytes.size(); }

private:
    uint8_t byte(size_t at) const { return at < m_bytes.size() ? static_cast<uint8_t>(m_bytes[at]) : 0; }

    std::string m_bytes;
};

std::optional<SSampleFormat> makeFormat(double rate, uint64_t channels, uint64_t bits) {
    if (!(rate >= 1 && rate <= 1e6) || channels < 1 || channels > kMaxChannels) return std::nullopt;
    // Compressed samples have no width of their own.
    const int bytes = bits == 0 ? 2 : static_cast<int>(std::clamp<uint64_t>((bits + 7) / 8, 1, 4));
    return SSampleFormat{static_cast<int>(std::lround(rate)), static_cast<int>(channels), bytes};
}

// "fmt " of the RIFF family, at its content.
std::optional<SSampleFormat> readFormatChunk(const CBytes& bytes, size_t at) {
    return makeFormat(static_cast<double>(bytes.little(at + 4, 4)), bytes.little(at + 2, 2),
                      bytes.little(at + 14, 2));
}

std::optional<SSampleFormat> readAU(const CBytes& bytes) {
    static constexpr uint64_t kBits[] = {0, 16, 8, 16, 24, 32, 32, 32}; // by encoding; 1 is 8-bit mu-law
    const uint64_t encoding = bytes.big(12, 4);
    return makeFormat(static_cast<double>(bytes.big(16, 4)), bytes.big(20, 4),
                      encoding < std::size(kBits) ? kBits[encoding] : 16);
}

std::optional<SSampleFormat> readCAF(const CBytes& bytes) {
    if (!bytes.has(8, "desc")) return std::nullopt; // is always the first
    return makeFormat(std::bit_cast<double>(bytes.big(20, 8)), bytes.big(44, 4), bytes.big(48, 4));
}

std::optional<SSampleFormat> readRF64(const CBytes& bytes) {
    for (size_t at = 12; at + 8 < bytes.size();) {
        if (bytes.has(at, "fmt ")) return readFormatChunk(bytes, at + 8);
        const uint64_t size = bytes.little(at + 4, 4);
        at += 8 + size + size % 2;
    }
    return std::nullopt;
}

// Identifiers of 16 bytes, sizes of 8 that count these 24 as well, all aligned to 8.
std::optional<SSampleFormat> readW64(const CBytes& bytes) {
    for (size_t at = 40; at + 24 < bytes.size();) {
        if (bytes.has(at, "fmt ")) return readFormatChunk(bytes, at + 24);
        const uint64_t size = bytes.little(at + 16, 8);
        if (size < 24 || size > bytes.size()) break;
        at += (size + 7) / 8 * 8;
    }
    return std::nullopt;
}

} // namespace

std::optional<SSampleFormat> readPlainHeader(const std::filesystem::path& file) {
    std::string start(kHeaderBytes, '\0');
    std::ifstream in(file, std::ios::binary);
    in.read(start.data(), static_cast<std::streamsize>(start.size()));
    start.resize(static_cast<size_t>(std::max<std::streamsize>(in.gcount(), 0)));
    const CBytes bytes(std::move(start));
    if (bytes.has(0, ".snd")) return readAU(bytes);
    if (bytes.has(0, "caff")) return readCAF(bytes);
    if (bytes.has(0, "RF64")) return readRF64(bytes);
    if (bytes.has(0, "riff")) return readW64(bytes);
    return std::nullopt;
}

} // namespace host
