#include "peru/remote/MessageInStream.h"

#include "peru/remote/RemoteException.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"

namespace peru {

namespace {

[[noreturn]] void refuse(int64_t limit) {
    throw CRemoteException(
        localize("peru.CMessageInStream.tooLarge",
                 "The other process has sent more than the %LIMIT% bytes that are allowed.",
                 {{"%LIMIT%", format("%d", limit)}}));
}

} // namespace

class CMessageInStream::CCountedStream : public CObject, public IInStream {
public:
    explicit CCountedStream(const P<IInStream>& source) : m_source(source) {}

    void setLimit(int64_t limit) { m_limit = limit; }
    void restart() { m_count = 0; }

    void close() override { m_source->close(); }
    P<IURI> getURI() const override { return m_source->getURI(); }
    bool isAtEnd() override { return m_source->isAtEnd(); }
    void read(void* buffer, int64_t size) override {
        require(size);
        m_source->read(buffer, size);
        m_count += size;
    }
    int64_t readSome(void* buffer, int64_t size) override {
        require(size);
        const int64_t count = m_source->readSome(buffer, size);
        m_count += count;
        return count;
    }
    void skip(int64_t size) override {
        require(size);
        m_source->skip(size);
        m_count += size;
    }

private:
    void require(int64_t size) const {
        if (m_limit > 0 && size > m_limit - m_count) refuse(m_limit);
    }

    P<IInStream> m_source;
    int64_t m_limit = 0;
    int64_t m_count = 0; // bytes of the current message
};

CMessageInStream::CMessageInStream(const P<IInStream>& source)
    : CMessageInStream(make<CCountedStream>(source)) {}

CMessageInStream::CMessageInStream(const P<CCountedStream>& counted)
    : CDataInStream(counted), m_counted(counted) {}

CMessageInStream::~CMessageInStream() = default;

void CMessageInStream::setLimits(int64_t message, int32_t text) {
    m_counted->setLimit(message);
    m_longestText = text;
}

void CMessageInStream::startMessage() {
    m_counted->restart();
}

P<IString> CMessageInStream::readString() {
    if (m_longestText == 0) return CDataInStream::readString();
    P<IString> text = detail::readString(*m_counted, m_longestText);
    if (!text) refuse(m_longestText);
    return text;
}

} // namespace peru
