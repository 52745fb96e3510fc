// HTTP responses.
#pragma once

#include "peru/Object.h"
#include "peru/net/HTTPHeaders.h"
#include "peru/uri/IURI.h"

namespace peru::net {

enum class EHTTPBody {
    none,
    chunked,
    length,   // as many bytes as "Content-Length" says
    untilEnd, // ends with the connection
};

// The head of a response, parsed as it arrives.
class PERU_API CHTTPResponse : public CObject {
public:
    // A head of more than `maxHeadSize` bytes is illegal; heads of interim responses count as well.
    explicit CHTTPResponse(size_t maxHeadSize);
    ~CHTTPResponse() override;

    // Takes the bytes that have arrived. Returns true once the head is complete; takeRest() then returns what
    // follows it. Interim responses (1xx) are skipped. Throws CError for an illegal response.
    bool parse(std::string_view bytes);
    bool isComplete() const { return m_complete; }
    bool hasBytes() const { return m_headSize > 0 || !m_buffer.empty(); }
    std::string takeRest() { return std::move(m_buffer); }

    int32_t getStatus() const { return m_status; } // 0 before the head is complete
    P<IString> getReason() const { return CString::fromUTF8(m_reason); }
    P<IString> getProtocol() const { return CString::fromUTF8(m_protocol); }
    const CHTTPHeaders& getHeaders() const { return m_headers; }
    // How the body of a response to this method ends. Throws CError for an illegal or contradictory length.
    EHTTPBody getBodyMode(std::string_view method) const;
    int64_t getContentLength() const; // -1 if absent

    bool isSuccess() const { return m_status >= 200 && m_status < 300; }
    // The target of a redirection that can be followed, otherwise empty.
    P<IURI> getRedirection(const P<IURI>& current) const;

private:
    bool parseHead();
    void parseFirstLine(std::string_view line);
    void parseHeader(std::string_view line);

    size_t m_maxHeadSize;
    size_t m_headSize = 0; // of interim heads
    std::string m_buffer;  // the head as far as it has arrived, later the bytes after it
    size_t m_searched = 0; // no end of the head before this offset
    bool m_complete = false;
    int32_t m_status = 0;
    std::string m_protocol;
    std::string m_reason;
    CHTTPHeaders m_headers;
};

// Undoes the chunked transfer encoding. Extensions and trailers are dropped.
class PERU_API CHTTPChunkDecoder {
public:
    // `maxExtraSize` limits the bytes of all size lines of one chunk and of the trailers.
    explicit CHTTPChunkDecoder(size_t maxExtraSize) : m_maxExtraSize(maxExtraSize) {}

    // Decodes from the front of `bytes`, which it shortens, into the buffer. Returns the number of bytes
    // written; 0 if more input is needed or the end was reached. Throws CError for illegal bytes, once the
    // data before them has been delivered.
    size_t decode(std::string_view& bytes, char* buffer, size_t size);
    bool isAtEnd() const { return m_state == EState::end; }

private:
    enum class EState { size, extension, data, dataEnd, trailer, end };

    bool take(char c);
    bool takeLineEnd();
    bool takeSizeCharacter(char c);
    void takeTrailerCharacter(char c);

    EState m_state = EState::size;
    int64_t m_rest = 0; // of the chunk
    int m_digits = 0;
    bool m_carriageReturn = false;
    bool m_lineIsEmpty = true;
    size_t m_maxExtraSize;
    size_t m_extraSize = 0;
};

} // namespace peru::net
