// The structure of JNG and MNG files: chunks with a type, data and a checksum.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace wxjng {

inline constexpr std::string_view kPngSignature("\x89PNG\r\n\x1A\n", 8);
inline constexpr std::string_view kJngSignature("\x8BJNG\r\n\x1A\n", 8);
inline constexpr std::string_view kMngSignature("\x8AMNG\r\n\x1A\n", 8);

struct SChunk {
    std::string_view type; // four letters
    std::string_view data;
};

// The chunks behind the signature, including the one of the given type that ends the file. They refer to
// `bytes`. Throws CError for another signature and for damaged, missing or cut off chunks. `kind` is the name
// of the format in messages.
std::vector<SChunk> readChunks(std::string_view bytes, std::string_view signature, std::string_view end,
                               const char* kind);

// The data of all chunks of a type, joined.
std::string join(const std::vector<SChunk>& chunks, std::string_view type);

// A chunk with its length and checksum.
std::string makeChunk(std::string_view type, std::string_view data);

uint32_t readBigEndian(std::string_view bytes, size_t offset); // four bytes
std::string makeBigEndian(uint32_t value);

// Throws the CError of a damaged picture.
[[noreturn]] void failDamaged(const char* kind);

} // namespace wxjng
