#include "peru/streams/Base64Streams.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"
#include "peru/uri/IURI.h"

namespace peru {

namespace {

constexpr char kAlphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
constexpr int8_t kNoCharacter = -1;

constexpr std::array<int8_t, 256> makeValues() {
    std::array<int8_t, 256> values;
    values.fill(kNoCharacter);
    for (int8_t i = 0; i < 64; ++i) values[static_cast<uint8_t>(kAlphabet[i])] = i;
    return values;
}

constexpr std::array<int8_t, 256> kValues = makeValues();

void encodeGroup(const uint8_t* bytes, char* characters) {
    const uint32_t bits = uint32_t{bytes[0]} << 16 | uint32_t{bytes[1]} << 8 | bytes[2];
    for (int i = 0; i < 4; ++i) characters[i] = kAlphabet[bits >> (18 - 6 * i) & 63];
}

} // namespace

CBase64OutStream::CBase64OutStream(const P<IOutStream>& target) : m_target(target) {}

CBase64OutStream::~CBase64OutStream() = default;

void CBase64OutStream::checkOpen() const {
    if (m_finished) throw CStreamClosedError(m_target->getURI());
}

P<IURI> CBase64OutStream::getURI() const {
    return m_target->getURI();
}

bool CBase64OutStream::isAtEnd() {
    checkOpen();
    return m_target->isAtEnd();
}

void CBase64OutStream::write(const void* buffer, int64_t size) {
    checkOpen();
    checkStreamSize(size, "CBase64OutStream::write");
    const uint8_t* bytes = static_cast<const uint8_t*>(buffer);
    std::array<char, 4096> characters;
    size_t count = 0;
    const auto emit = [&](const uint8_t* group) {
        encodeGroup(group, characters.data() + count);
        count += 4;
        if (count < characters.size()) return;
        m_target->write(characters.data(), static_cast<int64_t>(count));
        count = 0;
    };

    while (m_groupSize > 0 && size > 0) {
        m_group[m_groupSize++] = *bytes++;
        --size;
        if (m_groupSize < 3) continue;
        emit(m_group.data());
        m_groupSize = 0;
    }
    for (; size >= 3; bytes += 3, size -= 3) emit(bytes);
    while (size-- > 0) m_group[m_groupSize++] = *bytes++;
    if (count > 0) m_target->write(characters.data(), static_cast<int64_t>(count));
}

void CBase64OutStream::flush() {
    checkOpen();
    m_target->flush();
}

void CBase64OutStream::finish() {
    if (m_finished) return;
    m_finished = true;
    if (m_groupSize == 0) return;
    for (size_t i = m_groupSize; i < 3; ++i) m_group[i] = 0;
    char characters[4];
    encodeGroup(m_group.data(), characters);
    m_target->write(characters, static_cast<int64_t>(m_groupSize + 1));
}

void CBase64OutStream::close() {
    if (m_closed) return;
    m_closed = true;
    finish();
    m_target->close();
}

CBase64InStream::CBase64InStream(const P<IInStream>& source) : m_source(source) {}

CBase64InStream::~CBase64InStream() = default;

void CBase64InStream::checkOpen() const {
    if (m_closed) throw CStreamClosedError(m_source->getURI());
}

void CBase64InStream::close() {
    if (m_closed) return;
    m_closed = true;
    m_source->close();
}

P<IURI> CBase64InStream::getURI() const {
    return m_source->getURI();
}

bool CBase64InStream::decodeByte() {
    while (m_bitCount < 8) {
        if (m_begin == m_end) {
            m_begin = 0;
            m_end = m_source->readSome(m_characters.data(), static_cast<int64_t>(m_characters.size()));
            if (m_end == 0) {
                if (m_bitCount < 6) return false;
                throw CParseError(localize("peru.CBase64InStream.incomplete",
                                           "Error parsing base64 data: the last group is incomplete."));
            }
        }
        const uint8_t character = m_characters[static_cast<size_t>(m_begin)];
        if (kValues[character] == kNoCharacter)
            throw CParseError(localize(
                "peru.CBase64InStream.badCharacter",
                "Error parsing base64 data: the character %CODE% at position %POSITION% is not allowed.",
                {{"%CODE%", format("0x%02X", static_cast<unsigned>(character))},
                 {"%POSITION%", format("%d", m_position)}}));
        m_bits = m_bits << 6 | static_cast<uint32_t>(kValues[character]);
        m_bitCount += 6;
        ++m_begin;
        ++m_position;
    }
    return true;
}

bool CBase64InStream::isAtEnd() {
    checkOpen();
    return !decodeByte();
}

void CBase64InStream::read(void* buffer, int64_t size) {
    checkOpen();
    readFully(*this, buffer, size);
}

int64_t CBase64InStream::readSome(void* buffer, int64_t size) {
    checkOpen();
    checkStreamSize(size, "CBase64InStream::readSome");
    uint8_t* target = static_cast<uint8_t*>(buffer);
    int64_t done = 0;
    while (done < size && decodeByte()) {
        m_bitCount -= 8;
        target[done++] = static_cast<uint8_t>(m_bits >> m_bitCount);
    }
    return done;
}

void CBase64InStream::skip(int64_t size) {
    skipByReading(*this, size);
}

} // namespace peru
