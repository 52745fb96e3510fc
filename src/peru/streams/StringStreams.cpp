#include "peru/streams/StringStreams.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/uri/IURI.h"

#include <algorithm>
#include <cstring>
#include <limits>

namespace peru {

CStringInStream::CStringInStream(const P<IString>& text) : m_text(text ? text : CString::empty()) {}

CStringInStream::~CStringInStream() = default;

void CStringInStream::checkOpen() const {
    if (m_closed) throw CStreamClosedError();
}

void CStringInStream::close() {
    m_closed = true;
}

P<IURI> CStringInStream::getURI() const {
    return nullptr;
}

bool CStringInStream::isAtEnd() {
    checkOpen();
    return m_position >= m_text->getDataSize();
}

void CStringInStream::read(void* buffer, int64_t size) {
    readFully(*this, buffer, size);
}

int64_t CStringInStream::readSome(void* buffer, int64_t size) {
    checkOpen();
    checkStreamSize(size, "CStringInStream::readSome");
    const int64_t count = std::clamp<int64_t>(m_text->getDataSize() - m_position, 0, size);
    if (count > 0) std::memcpy(buffer, m_text->getData() + m_position, static_cast<size_t>(count));
    m_position += count;
    return count;
}

void CStringInStream::skip(int64_t size) {
    checkOpen();
    checkStreamSize(size, "CStringInStream::skip");
    if (size > m_text->getDataSize() - m_position) throw CEndOfStreamError();
    m_position += size;
}

void CStringInStream::reset() {
    seek(0);
}

int64_t CStringInStream::getPosition() const {
    checkOpen();
    return m_position;
}

void CStringInStream::seek(int64_t position) {
    checkOpen();
    if (position < 0) throw CInvalidArgError("position", "CStringInStream::seek");
    m_position = position;
}

int64_t CStringInStream::getSize() const {
    checkOpen();
    return m_text->getDataSize();
}

P<IStreamMarker> CStringInStream::createMarker() {
    return make<CPositionMarker>(P<ISeekableStream>::share(this));
}

CStringOutStream::CStringOutStream() : CStringOutStream(getUTF8CharEncoding()) {}

CStringOutStream::CStringOutStream(const P<ICharEncoding>& encoding) : m_encoding(encoding) {}

CStringOutStream::~CStringOutStream() = default;

void CStringOutStream::checkOpen() const {
    if (m_closed) throw CStreamClosedError();
}

P<IString> CStringOutStream::getString() const {
    if (m_bytes.size() >= static_cast<size_t>(std::numeric_limits<int32_t>::max()))
        throw CStreamError(localize("peru.CStringOutStream.tooLong", "The text is too long."), nullptr);
    return make<CString>(m_encoding, m_bytes.data(), static_cast<int32_t>(m_bytes.size()));
}

void CStringOutStream::close() {
    m_closed = true;
}

P<IURI> CStringOutStream::getURI() const {
    return nullptr;
}

bool CStringOutStream::isAtEnd() {
    checkOpen();
    return true;
}

void CStringOutStream::write(const void* buffer, int64_t size) {
    checkOpen();
    checkStreamSize(size, "CStringOutStream::write");
    m_bytes.append(static_cast<const char*>(buffer), static_cast<size_t>(size));
}

void CStringOutStream::flush() {
    checkOpen();
}

void CStringOutStream::reset() {
    checkOpen();
    m_bytes.clear();
}

int64_t CStringOutStream::getPosition() const {
    checkOpen();
    return static_cast<int64_t>(m_bytes.size());
}

} // namespace peru
