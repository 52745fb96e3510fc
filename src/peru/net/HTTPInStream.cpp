#include "peru/net/HTTPInStream.h"

#include "peru/net/HTTPError.h"
#include "peru/streams/StreamTools.h"

namespace peru::net {

CHTTPInStream::CHTTPInStream(const P<CHTTPClient>& client, EStatus status)
    : m_client(client), m_status(status) {}
CHTTPInStream::~CHTTPInStream() = default;

void CHTTPInStream::close() {
    m_client->close();
}

P<IURI> CHTTPInStream::getURI() const {
    return m_client->getURI();
}

void CHTTPInStream::checkStatus() {
    const P<CHTTPResponse> response = m_client->getResponse();
    if (m_status == EStatus::any || response->isSuccess()) return;
    m_client->close();
    throw CHTTPError(response->getStatus(), response->getReason(), getURI());
}

std::optional<int64_t> CHTTPInStream::read(void* buffer, int64_t size, bool wait) {
    checkStreamSize(size, "IInStream::readSome");
    if (!m_client->advance(wait)) return std::nullopt;
    checkStatus();
    if (size == 0) return 0;
    if (!m_peeked) return m_client->readBody(buffer, size, wait);
    *static_cast<uint8_t*>(buffer) = *m_peeked;
    m_peeked.reset();
    return 1;
}

bool CHTTPInStream::isAtEnd() {
    uint8_t next = 0;
    if (!m_peeked && readSome(&next, 1) == 1) m_peeked = next;
    return !m_peeked;
}

void CHTTPInStream::read(void* buffer, int64_t size) {
    readFully(*this, buffer, size);
}

int64_t CHTTPInStream::readSome(void* buffer, int64_t size) {
    return *read(buffer, size, true);
}

void CHTTPInStream::skip(int64_t size) {
    skipByReading(*this, size);
}

std::optional<int64_t> CHTTPInStream::tryRead(void* buffer, int64_t size) {
    return read(buffer, size, false);
}

} // namespace peru::net
