// The state machine of an HTTP exchange.
#pragma once

#include "peru/collections/FrailArray.h"
#include "peru/net/HTTPRequest.h"
#include "peru/net/HTTPResponse.h"
#include "peru/net/IConnection.h"
#include "peru/net/IHTTPListener.h"
#include "peru/net/INetNameResolver.h"
#include "peru/net/IProxyManager.h"

#include <chrono>

namespace peru::net {

// Limits of an exchange; 0 means none. Times are in milliseconds.
struct SHTTPSettings {
    bool followRedirections = true;
    uint32_t maxRedirections = 20;
    // From the start, or from a redirection, until the connection is established.
    uint32_t connectTimeout = 10'000;
    // Without a byte while a request is sent or a body is read, and for the whole head of the response.
    uint32_t silenceTimeout = 30'000;
    uint32_t totalTimeout = 0; // for everything, the body included
    size_t maxHeadSize = 64 * 1024;
    int64_t maxBodySize = 0;
    P<IProxyManager> proxies; // empty: getProxyManager()
};

// Drives one exchange, redirections included. Used by one thread at a time; `cancel` may be set by any. After
// a failure or a cancel the client is closed, with nothing left open.
class PERU_API CHTTPClient : public CObject {
public:
    CHTTPClient(const P<CHTTPRequest>& request, const SHTTPSettings& settings, const P<INetEvent>& cancel,
                const P<TFrailArray<IHTTPListener>>& listeners);
    ~CHTTPClient() override;

    // Goes on until the head of the response is complete, and returns true then. With `wait` false it returns
    // false where it would have to wait. Throws CURIError, CSocketError, CError for an illegal response,
    // CAbortedError on a cancel and CStreamClosedError once closed.
    bool advance(bool wait);
    // Reads up to `size` bytes of the body, which must be more than 0: 0 at its end, empty if it would have
    // to wait. Throws like advance(), and CEndOfStreamError for a body that is shorter than announced.
    std::optional<int64_t> readBody(void* buffer, int64_t size, bool wait);
    void close();

    EHTTPStep getStep() const { return m_step; }
    const P<IURI>& getURI() const { return m_request->getURI(); } // of the last redirection
    const P<CHTTPResponse>& getResponse() const { return m_response; }

private:
    using Clock = std::chrono::steady_clock;

    bool runStep(bool wait);
    bool chooseTarget(const SNetWait& wait);
    bool resolve(const SNetWait& wait);
    void startConnection();
    void startRequest();
    bool sendRequest(const SNetWait& wait);
    bool fillOutput();
    bool receiveHead(const SNetWait& wait);
    void finishHead();
    void redirect(const P<IURI>& uri);
    std::optional<int64_t> readDecoded(char* buffer, size_t size, const SNetWait& wait);
    std::optional<int64_t> readChunked(char* buffer, size_t size, const SNetWait& wait);
    std::optional<int64_t> readRaw(char* buffer, size_t size, const SNetWait& wait);
    std::optional<int64_t> receive(char* buffer, size_t size, const SNetWait& wait);
    void finishBody();

    void enter(EHTTPStep step);
    void notify() const;
    void checkUsable() const;
    void checkTimes();
    SNetWait getWait(bool wait) const;
    void disconnect();

    P<CHTTPRequest> m_request;
    SHTTPSettings m_settings;
    P<INetEvent> m_cancel;
    P<TFrailArray<IHTTPListener>> m_listeners;
    EHTTPStep m_step = EHTTPStep::chooseTarget;
    uint32_t m_redirections = 0;

    std::optional<Clock::time_point> m_totalEnd;
    std::optional<Clock::time_point> m_stepEnd;    // of connecting and of the head
    std::optional<Clock::time_point> m_silenceEnd; // counts from the first unsuccessful attempt on

    P<IProxyLookUp> m_proxyLookUp;
    P<IURI> m_proxy;
    P<INetNameResolution> m_resolution;
    P<IConnection> m_connection;
    P<INetInStream> m_in;
    P<INetOutStream> m_out;

    std::string m_output; // composed and not sent yet
    size_t m_sent = 0;
    int64_t m_bodyToSend = 0; // -1: in chunks until the stream ends
    int m_sendError = 0;

    P<CHTTPResponse> m_response;
    EHTTPBody m_bodyMode = EHTTPBody::none;
    std::optional<CHTTPChunkDecoder> m_decoder;
    std::string m_input; // holds what was received and not delivered yet between the two offsets
    size_t m_inputStart = 0;
    size_t m_inputEnd = 0;
    int64_t m_bodySize = -1; // announced
    int64_t m_received = 0;
};

} // namespace peru::net
