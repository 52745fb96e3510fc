// Base64 filters over other streams.
#pragma once

#include "peru/Object.h"
#include "peru/streams/StreamTools.h"

#include <array>

namespace peru {

// Standard alphabet without line breaks and without padding: n bytes give exactly (8n + 5) / 6 characters.
class PERU_API CBase64OutStream : public CObject, public IOutStream {
public:
    explicit CBase64OutStream(const P<IOutStream>& target);
    ~CBase64OutStream() override; // loses the last one or two bytes unless finish() or close() was called

    // Writes the last group and ends this stream; the target stays open.
    void finish();

    void close() override; // finishes and closes the target
    P<IURI> getURI() const override;
    bool isAtEnd() override;
    void write(const void* buffer, int64_t size) override;
    void flush() override; // whole groups only; an incomplete group stays buffered

private:
    void checkOpen() const;

    P<IOutStream> m_target;
    std::array<uint8_t, 3> m_group; // an incomplete group
    size_t m_groupSize = 0;
    bool m_finished = false;
    bool m_closed = false;
};

// Decodes that form. Throws CParseError for any other character and for a single trailing character.
class PERU_API CBase64InStream : public CObject, public IInStream {
public:
    explicit CBase64InStream(const P<IInStream>& source);
    ~CBase64InStream() override;

    void close() override; // closes the source as well
    P<IURI> getURI() const override;
    bool isAtEnd() override;
    void read(void* buffer, int64_t size) override;
    int64_t readSome(void* buffer, int64_t size) override;
    void skip(int64_t size) override;

private:
    void checkOpen() const;
    bool decodeByte(); // false at the end; otherwise the top 8 of m_bits are the next byte

    P<IInStream> m_source;
    std::array<uint8_t, 4096> m_characters;
    int64_t m_begin = 0;
    int64_t m_end = 0;
    int64_t m_position = 0; // of the next character in the source
    uint32_t m_bits = 0;
    int m_bitCount = 0;
    bool m_closed = false;
};

} // namespace peru
