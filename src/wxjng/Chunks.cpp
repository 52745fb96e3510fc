#include "wxjng/Chunks.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <zlib.h>

namespace wxjng {

namespace {

uint32_t getCheckSum(std::string_view bytes) {
    return static_cast<uint32_t>(
        crc32(0, reinterpret_cast<const Bytef*>(bytes.data()), static_cast<uInt>(bytes.size())));
}

} // namespace

std::vector<SChunk> readChunks(std::string_view bytes, std::string_view signature, std::string_view end,
                               const char* kind) {
    if (!bytes.starts_with(signature)) failDamaged(kind);
    std::vector<SChunk> chunks;
    for (size_t at = signature.size(); at + 12 <= bytes.size();) {
        const size_t length = readBigEndian(bytes, at);
        if (length > bytes.size() - at - 12) break;
        const std::string_view body = bytes.substr(at + 4, length + 4);
        if (readBigEndian(bytes, at + 8 + length) != getCheckSum(body)) break;
        chunks.push_back({body.substr(0, 4), body.substr(4)});
        if (chunks.back().type == end) return chunks;
        at += 12 + length;
    }
    failDamaged(kind);
}

std::string join(const std::vector<SChunk>& chunks, std::string_view type) {
    std::string joined;
    for (const SChunk& chunk : chunks)
        if (chunk.type == type) joined += chunk.data;
    return joined;
}

std::string makeChunk(std::string_view type, std::string_view data) {
    std::string chunk = makeBigEndian(static_cast<uint32_t>(data.size()));
    chunk.append(type).append(data);
    return chunk + makeBigEndian(getCheckSum(std::string_view(chunk).substr(4)));
}

uint32_t readBigEndian(std::string_view bytes, size_t offset) {
    uint32_t value = 0;
    for (size_t i = 0; i < 4; ++i) value = value << 8 | static_cast<uint8_t>(bytes[offset + i]);
    return value;
}

std::string makeBigEndian(uint32_t value) {
    std::string bytes;
    for (const int shift : {24, 16, 8, 0}) bytes += static_cast<char>(value >> shift);
    return bytes;
}

void failDamaged(const char* kind) {
    throw peru::CError(peru::localize("graphics.WxImages.Damaged", "The %FORMAT% picture is damaged.",
                                      {{"%FORMAT%", kind}}));
}

} // namespace wxjng
