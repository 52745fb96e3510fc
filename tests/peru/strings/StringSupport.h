// Text in every encoding, for the tests of strings.
#pragma once

#include "peru/strings/CharEncodingRules.h"
#include "peru/strings/String.h"

#include <random>
#include <string>
#include <vector>

namespace tests {

using peru::CString;
using peru::ICharEncoding;
using peru::IString;
using peru::P;
using peru::SStringPos;

inline std::vector<P<ICharEncoding>> getAllEncodings() {
    return {peru::getLatin1CharEncoding(), peru::getUTF8CharEncoding(), peru::getUTF16CharEncoding(),
            peru::getUTF32CharEncoding(), peru::getCPCharEncoding()};
}

inline bool canEncode(const P<ICharEncoding>& encoding, const std::u32string& text) {
    for (char32_t ch : text)
        if (encoding->getEncodedSize(ch) == 0) return false;
    return true;
}

// Bytes that the encoding's decoder skips anywhere between characters.
inline std::string getNoise(const P<ICharEncoding>& encoding, std::mt19937& random) {
    static const char* const kNoise[] = {"\xFF", "\xA9", "\xC0", "\xE0\xA0\x80", "\xF8\x88"};
    const uint32_t id = encoding->getId();
    if (id == ICharEncoding::kUTF8) return kNoise[random() % std::size(kNoise)];
    if (id == ICharEncoding::kUTF16) return std::string("\x00\xDC", 2);
    if (id == ICharEncoding::kUTF32) return std::string("\x00\x00\x11\x00", 4);
    return id == ICharEncoding::kCodePage ? "\xFF" : "";
}

inline P<IString> encode(const P<ICharEncoding>& encoding, const std::u32string& text,
                         std::mt19937* noise = nullptr) {
    std::string bytes;
    for (char32_t ch : text) {
        if (noise && (*noise)() % 4 == 0) bytes += getNoise(encoding, *noise);
        uint8_t buffer[16];
        int32_t end = encoding->encodeChar(ch, buffer, sizeof(buffer), 0);
        bytes.append(reinterpret_cast<const char*>(buffer), static_cast<size_t>(end));
    }
    if (noise && (*noise)() % 4 == 0) bytes += getNoise(encoding, *noise);
    return peru::make<CString>(encoding, bytes.data(), static_cast<int32_t>(bytes.size()));
}

inline std::u32string decode(const P<IString>& text) {
    std::u32string result;
    for (SStringPos pos = peru::kStringBegin; pos.index < text->getLength();)
        result.push_back(text->getCharAndAdvance(pos));
    return result;
}

inline std::string bytesOf(const P<IString>& text) {
    return {reinterpret_cast<const char*>(text->getData()), static_cast<size_t>(text->getDataSize())};
}

} // namespace tests
