// Streams over strings.
#pragma once

#include "peru/streams/StreamTools.h"
#include "peru/strings/String.h"

namespace peru {

// Reads the bytes of a string in the string's own encoding.
class PERU_API CStringInStream : public CObject, public ISeekableInStream {
public:
    explicit CStringInStream(const P<IString>& text);
    ~CStringInStream() override;

    void close() override;
    P<IURI> getURI() const override;
    bool isAtEnd() override;
    void read(void* buffer, int64_t size) override;
    int64_t readSome(void* buffer, int64_t size) override;
    void skip(int64_t size) override;
    void reset() override;
    int64_t getPosition() const override;
    void seek(int64_t position) override;
    int64_t getSize() const override;
    P<IStreamMarker> createMarker() override;

private:
    void checkOpen() const;

    P<IString> m_text;
    int64_t m_position = 0;
    bool m_closed = false;
};

// Collects bytes and returns them as a string.
class PERU_API CStringOutStream : public CObject, public IResetableOutStream {
public:
    CStringOutStream(); // UTF-8
    explicit CStringOutStream(const P<ICharEncoding>& encoding);
    ~CStringOutStream() override;

    // The bytes written so far as text in the encoding; also works on a closed stream. Throws CStreamError
    // for 2 GiB or more, the limit of a string.
    P<IString> getString() const;

    void close() override;
    P<IURI> getURI() const override;
    bool isAtEnd() override; // always true: the position is always the end
    void write(const void* buffer, int64_t size) override;
    void flush() override;
    void reset() override; // discards what was written
    int64_t getPosition() const override;

private:
    void checkOpen() const;

    P<ICharEncoding> m_encoding;
    std::string m_bytes;
    bool m_closed = false;
};

} // namespace peru
