#include "peru/net/HTTPResponse.h"

#include "peru/net/HTTPError.h"
#include "peru/net/HTTPRequest.h"
#include "peru/uri/URI.h"

#include <algorithm>
#include <charconv>
#include <limits>

namespace peru::net {

namespace {

constexpr std::string_view kHeadEnd = "\r\n\r\n";

// Decimal digits only.
int64_t parseNumber(std::string_view text) {
    int64_t number = -1;
    const char* end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, number);
    if (text.empty() || text.front() == '-' || error != std::errc() || stop != end)
        throw makeIllegalResponseError();
    return number;
}

} // namespace

CHTTPResponse::CHTTPResponse(size_t maxHeadSize) : m_maxHeadSize(maxHeadSize) {}
CHTTPResponse::~CHTTPResponse() = default;

bool CHTTPResponse::parse(std::string_view bytes) {
    m_buffer.append(bytes);
    while (!m_complete && parseHead()) {
    }
    return m_complete;
}

// Parses one head if it is there.
bool CHTTPResponse::parseHead() {
    const size_t end = m_buffer.find(kHeadEnd, m_searched);
    const size_t size = end == std::string::npos ? m_buffer.size() : end + kHeadEnd.size();
    if (m_maxHeadSize != 0 && m_headSize + size > m_maxHeadSize) throw makeIllegalResponseError();
    if (end == std::string::npos) {
        m_searched = m_buffer.size() - std::min(m_buffer.size(), kHeadEnd.size() - 1);
        return false;
    }
    m_searched = 0;
    m_headSize += size;
    m_headers = CHTTPHeaders();
    std::string_view head = std::string_view(m_buffer).substr(0, end);
    for (bool first = true; first || !head.empty(); first = false) {
        const size_t lineEnd = std::min(head.find("\r\n"), head.size());
        const std::string_view line = head.substr(0, lineEnd);
        if (first)
            parseFirstLine(line);
        else
            parseHeader(line);
        head.remove_prefix(std::min(lineEnd + 2, head.size()));
    }
    m_buffer.erase(0, size);
    // 101 would end the protocol; it is never requested and stands as it is.
    m_complete = m_status >= 200 || m_status == 101;
    return true;
}

void CHTTPResponse::parseFirstLine(std::string_view line) {
    const size_t blank = line.find(' ');
    if (!line.starts_with("HTTP/") || blank == std::string_view::npos) throw makeIllegalResponseError();
    m_protocol = line.substr(0, blank);
    const std::string_view rest = trimBlanks(line.substr(blank));
    const std::string_view code = rest.substr(0, rest.find(' '));
    if (code.size() != 3) throw makeIllegalResponseError();
    m_status = static_cast<int32_t>(parseNumber(code));
    if (m_status < 100) throw makeIllegalResponseError();
    m_reason = trimBlanks(rest.substr(code.size()));
}

void CHTTPResponse::parseHeader(std::string_view line) {
    if (line.starts_with(' ') || line.starts_with('\t')) {
        m_headers.extendLast(trimBlanks(line));
        return;
    }
    // A line without a ":" means nothing and harms nothing.
    const size_t colon = line.find(':');
    if (colon == std::string_view::npos) return;
    m_headers.addReceived(trimBlanks(line.substr(0, colon)), trimBlanks(line.substr(colon + 1)));
}

int64_t CHTTPResponse::getContentLength() const {
    int64_t length = -1;
    for (const CHTTPHeaders::SHeader& header : m_headers) {
        if (!equalsIgnoreCase(header.name, "Content-Length")) continue;
        // Proxies may join repeated headers to a list.
        for (std::string_view list = header.value;;) {
            const size_t comma = list.find(',');
            const int64_t number = parseNumber(trimBlanks(list.substr(0, comma)));
            if (length >= 0 && number != length) throw makeIllegalResponseError();
            length = number;
            if (comma == std::string_view::npos) break;
            list.remove_prefix(comma + 1);
        }
    }
    return length;
}

EHTTPBody CHTTPResponse::getBodyMode(std::string_view method) const {
    if (method == "HEAD" || m_status < 200 || m_status == 204 || m_status == 304) return EHTTPBody::none;
    if (equalsIgnoreCase(m_headers.find("Transfer-Encoding").value_or("identity"), "chunked"))
        return EHTTPBody::chunked;
    return getContentLength() >= 0 ? EHTTPBody::length : EHTTPBody::untilEnd;
}

P<IURI> CHTTPResponse::getRedirection(const P<IURI>& current) const {
    if (m_status != 301 && m_status != 302 && m_status != 303 && m_status != 307) return nullptr;
    const std::string_view location = m_headers.find("Location").value_or("");
    if (location.empty()) return nullptr;
    try {
        P<IURI> uri = make<CURI>(CString::fromUTF8(location));
        if (uri->isRelative() && !uri->hasAuthority() && uri->getPath()->isEmpty()) {
            // A query or fragment alone refers to the current resource, not to its directory.
            std::string text = CString::toStdString(current->getAsString());
            text.resize(std::min(text.size(), text.find_first_of(location.starts_with('#') ? "#" : "?#")));
            uri = make<CURI>(CString::fromUTF8(text + CString::toStdString(uri->getAsString())));
        } else if (uri->isRelative()) {
            uri = uri->resolveAgainst(current);
        }
        return CHTTPRequest::isSupported(uri) ? uri : nullptr;
    } catch (const CURIError&) {
        return nullptr;
    }
}

size_t CHTTPChunkDecoder::decode(std::string_view& bytes, char* buffer, size_t size) {
    size_t written = 0;
    while (!bytes.empty() && m_state != EState::end) {
        if (m_state == EState::data) {
            const size_t count = static_cast<size_t>(
                std::min<int64_t>(m_rest, static_cast<int64_t>(std::min(bytes.size(), size - written))));
            if (count == 0) break; // the buffer is full
            std::copy_n(bytes.data(), count, buffer + written);
            bytes.remove_prefix(count);
            written += count;
            m_rest -= static_cast<int64_t>(count);
            if (m_rest == 0) m_state = EState::dataEnd;
            continue;
        }
        if (!take(bytes.front())) {
            if (written > 0) break; // the next call throws
            throw makeIllegalResponseError();
        }
        bytes.remove_prefix(1);
    }
    return written;
}

// Returns false for a character that is illegal, and again if it is tried again.
bool CHTTPChunkDecoder::take(char c) {
    if (m_maxExtraSize != 0 && ++m_extraSize > m_maxExtraSize) return false;
    if (m_state == EState::trailer) {
        takeTrailerCharacter(c);
        return true;
    }
    // Some servers end lines with a line feed alone.
    if (c == '\n') return takeLineEnd();
    if (m_carriageReturn) return false;
    if (c == '\r') {
        m_carriageReturn = true;
        return true;
    }
    return m_state == EState::extension || (m_state == EState::size && takeSizeCharacter(c));
}

// The end of a size line, or the one after the data.
bool CHTTPChunkDecoder::takeLineEnd() {
    m_carriageReturn = false;
    if (m_state == EState::dataEnd) {
        m_state = EState::size;
        m_digits = 0;
        m_extraSize = 0;
        return true;
    }
    if (m_digits == 0) return false;
    m_state = m_rest > 0 ? EState::data : EState::trailer;
    return true;
}

bool CHTTPChunkDecoder::takeSizeCharacter(char c) {
    const char lower = static_cast<char>(c | 0x20);
    const int digit = c >= '0' && c <= '9' ? c - '0' : lower >= 'a' && lower <= 'f' ? lower - 'a' + 10 : -1;
    if (digit < 0) {
        if (m_digits == 0 || (c != ';' && c != ' ' && c != '\t')) return false;
        m_state = EState::extension;
        return true;
    }
    if (m_rest > std::numeric_limits<int64_t>::max() >> 4) return false;
    m_rest = m_rest << 4 | digit;
    ++m_digits;
    return true;
}

void CHTTPChunkDecoder::takeTrailerCharacter(char c) {
    if (c == '\n') {
        if (m_lineIsEmpty) m_state = EState::end;
        m_lineIsEmpty = true;
    } else if (c != '\r') {
        m_lineIsEmpty = false;
    }
}

} // namespace peru::net
