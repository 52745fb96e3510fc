// A request and its exchange, as a caller uses them.
#pragma once

#include "peru/net/HTTPInStream.h"

#include <mutex>

namespace peru::net {

// Driven by one thread at a time: a worker thread that waits, or slices of a thread that polls. cancel() may
// be called by any thread and ends a waiting call at once, which then throws CAbortedError.
class PERU_API CHTTPOperation : public CObject {
public:
    explicit CHTTPOperation(const P<CHTTPRequest>& request, const SHTTPSettings& settings = {});
    ~CHTTPOperation() override;

    // Not counted: a listener must be removed before it is destroyed.
    void addListener(IHTTPListener* listener) { m_listeners->add(listener); }
    bool removeListener(IHTTPListener* listener) { return m_listeners->remove(listener); }

    // See CHTTPClient::advance.
    bool advance(bool wait) { return m_client->advance(wait); }
    EHTTPStep getStep() const { return m_client->getStep(); }
    P<IURI> getURI() const { return m_client->getURI(); } // of the last redirection
    // Empty before advance() has returned true.
    P<CHTTPResponse> getResponse() const;
    // Throws CHTTPError if the response reports a failure (400 and above).
    void checkStatus() const;
    // The body of the response.
    P<CHTTPInStream> getInStream() const { return m_stream; }

    void cancel();
    bool isCancelled() const;
    void close() { m_client->close(); }
    // Prepares the operation to start again, also after a cancel. Throws CInvalidObjectStateError if the
    // request's body cannot be read again.
    void reset();

private:
    void start();

    P<CHTTPRequest> m_request;
    SHTTPSettings m_settings;
    P<TFrailArray<IHTTPListener>> m_listeners = make<TFrailArray<IHTTPListener>>();
    mutable std::mutex m_mutex; // guards m_cancel, which reset() replaces
    P<INetEvent> m_cancel;
    P<CHTTPClient> m_client;
    P<CHTTPInStream> m_stream;
};

} // namespace peru::net
