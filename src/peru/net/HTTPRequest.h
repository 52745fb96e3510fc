// HTTP requests.
#pragma once

#include "peru/Object.h"
#include "peru/net/HTTPHeaders.h"
#include "peru/streams/IStreams.h"
#include "peru/uri/IURI.h"

namespace peru::net {

class PERU_API CHTTPRequest : public CObject {
public:
    static constexpr const char* kProtocol = "HTTP/1.1";

    // Throws CInvalidArgError for a method that is not a token, CURITypeNotSupportedError unless the URI has
    // the scheme "http" and a host.
    CHTTPRequest(const CStringArg& method, const P<IURI>& uri, const P<IInStream>& body = nullptr);
    ~CHTTPRequest() override;

    // Whether the client can exchange a request for this URI.
    static bool isSupported(const P<IURI>& uri);

    const std::string& getMethod() const { return m_method; }
    const P<IURI>& getURI() const { return m_uri; }
    // The body ends with the stream. Its length is taken from a "Content-Length" header, otherwise from the
    // stream if that is seekable; a body of unknown length is sent in chunks.
    const P<IInStream>& getBody() const { return m_body; }
    // Prepares the body, if any, to be sent again. Throws CInvalidObjectStateError if its stream cannot be
    // reset.
    void rewindBody();
    // Besides these, the client adds "Host", "Connection" and what the body and the proxy need.
    CHTTPHeaders& getHeaders() { return m_headers; }
    const CHTTPHeaders& getHeaders() const { return m_headers; }

    // The same request for the target of a redirection. Credentials stay with the host they were meant for. A
    // request for "another resource" (303) becomes a GET without a body.
    P<CHTTPRequest> redirect(const P<IURI>& uri, bool otherResource) const;

private:
    std::string m_method;
    P<IURI> m_uri;
    P<IInStream> m_body;
    CHTTPHeaders m_headers;
};

// What precedes the body on the wire.
struct SHTTPRequestHead {
    std::string bytes;
    int64_t bodySize = 0; // -1: unknown, to be sent in chunks
};

// `proxy` is empty for a direct connection.
PERU_API SHTTPRequestHead composeRequestHead(const CHTTPRequest& request, const P<IURI>& proxy);

} // namespace peru::net
