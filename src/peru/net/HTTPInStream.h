// The body of an HTTP response as a stream.
#pragma once

#include "peru/net/HTTPClient.h"

namespace peru::net {

// Undoes the transfer encoding. The operations of IInStream wait, also for a response that has not begun.
class PERU_API CHTTPInStream : public CObject, public IInStream {
public:
    enum class EStatus { any, success };

    // With EStatus::success a status outside of 200 to 299 makes reading throw CHTTPError.
    explicit CHTTPInStream(const P<CHTTPClient>& client, EStatus status = EStatus::any);
    ~CHTTPInStream() override;

    void close() override;
    P<IURI> getURI() const override;
    bool isAtEnd() override;
    void read(void* buffer, int64_t size) override;
    int64_t readSome(void* buffer, int64_t size) override;
    void skip(int64_t size) override;
    // Reads without waiting: empty if nothing has arrived, 0 at the end.
    std::optional<int64_t> tryRead(void* buffer, int64_t size);

private:
    std::optional<int64_t> read(void* buffer, int64_t size, bool wait);
    void checkStatus();

    P<CHTTPClient> m_client;
    EStatus m_status;
    std::optional<uint8_t> m_peeked; // read ahead by isAtEnd()
};

} // namespace peru::net
