#include "peru/net/HTTPRequest.h"

#include "peru/Errors.h"
#include "peru/net/posix/AddressText.h"
#include "peru/streams/Base64Streams.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/uri/URIEscapes.h"

#include <charconv>

namespace peru::net {

namespace {

enum class EDefaultPort { omit, keep };

std::string toAuthority(const P<IURI>& uri, EDefaultPort defaultPort) {
    std::string host = posix::getNetworkHost(uri);
    if (host.find(':') != std::string::npos) host = "[" + host.substr(0, host.find('%')) + "]";
    if (uri->hasPort() && (uri->getPort() != 80 || defaultPort == EDefaultPort::keep))
        host += ":" + std::to_string(uri->getPort());
    return host;
}

std::string toHostHeader(const P<IURI>& uri) {
    return toAuthority(uri, EDefaultPort::omit);
}

std::string toPathAndQuery(const P<IURI>& uri) {
    std::string target = CString::toStdString(uri->getPath());
    if (!target.starts_with('/')) target.insert(0, "/");
    if (uri->hasQuery()) target += "?" + CString::toStdString(uri->getQuery());
    return target;
}

std::string toBasic(const P<IURI>& uri) {
    const std::string user = uri::unescapeBytes(CString::toStdString(uri->getUserInfo()));
    const P<CMemoryIOStream> memory = make<CMemoryIOStream>();
    const P<CBase64OutStream> encoder = make<CBase64OutStream>(memory);
    encoder->write(user.data(), static_cast<int64_t>(user.size()));
    encoder->finish();
    memory->seek(0);
    std::string text = readAll(*memory);
    text.append((4 - text.size() % 4) % 4, '=');
    return "Basic " + text;
}

int64_t getBodySize(const CHTTPRequest& request) {
    if (!request.getBody()) return 0;
    if (const auto given = request.getHeaders().find("Content-Length")) {
        int64_t size = -1;
        const char* end = given->data() + given->size();
        const auto [stop, error] = std::from_chars(given->data(), end, size);
        if (error != std::errc() || stop != end || size < 0)
            throw CInvalidArgError("Content-Length", "CHTTPRequest");
        return size;
    }
    const P<ISeekableInStream> seekable = tryCast<ISeekableInStream>(request.getBody());
    return seekable ? seekable->getSize() - seekable->getPosition() : -1;
}

} // namespace

CHTTPRequest::CHTTPRequest(const CStringArg& method, const P<IURI>& uri, const P<IInStream>& body)
    : m_method(CString::toStdString(method)), m_uri(uri), m_body(body) {
    if (!isHTTPToken(m_method)) throw CInvalidArgError("method", "CHTTPRequest");
    if (!isSupported(uri)) throw CURITypeNotSupportedError(uri);
}

CHTTPRequest::~CHTTPRequest() = default;

bool CHTTPRequest::isSupported(const P<IURI>& uri) {
    return uri && uri->getScheme()->equalsIgnoreCase("http") && !posix::getNetworkHost(uri).empty();
}

P<CHTTPRequest> CHTTPRequest::redirect(const P<IURI>& uri, bool otherResource) const {
    const bool keep = !otherResource || m_method == "HEAD";
    const P<CHTTPRequest> request =
        make<CHTTPRequest>(keep ? m_method.c_str() : "GET", uri, keep ? m_body : nullptr);
    request->m_headers = m_headers;
    if (!keep)
        for (const char* name : {"Content-Length", "Content-Type", "Transfer-Encoding"})
            request->m_headers.remove(name);
    if (!equalsIgnoreCase(toHostHeader(uri), toHostHeader(m_uri)))
        for (const char* name : {"Authorization", "Cookie", "Host"}) request->m_headers.remove(name);
    return request;
}

SHTTPRequestHead composeRequestHead(const CHTTPRequest& request, const P<IURI>& proxy) {
    const P<IURI>& uri = request.getURI();
    CHTTPHeaders headers = request.getHeaders();
    if (!headers.find("Host")) headers.set("Host", toHostHeader(uri).c_str());
    headers.set("Connection", "close");
    if (uri->hasUserInfo() && !headers.find("Authorization"))
        headers.set("Authorization", toBasic(uri).c_str());
    if (proxy && proxy->hasUserInfo()) headers.set("Proxy-Authorization", toBasic(proxy).c_str());

    SHTTPRequestHead head;
    head.bodySize = getBodySize(request);
    if (head.bodySize < 0)
        headers.set("Transfer-Encoding", "chunked");
    else if (request.getBody() || request.getMethod() == "POST" || request.getMethod() == "PUT")
        headers.set("Content-Length", std::to_string(head.bodySize).c_str());

    // A proxy gets the port as the caller wrote it.
    const std::string origin = proxy ? "http://" + toAuthority(uri, EDefaultPort::keep) : "";
    head.bytes =
        request.getMethod() + " " + origin + toPathAndQuery(uri) + " " + CHTTPRequest::kProtocol + "\r\n";
    for (const CHTTPHeaders::SHeader& header : headers)
        head.bytes += header.name + ": " + header.value + "\r\n";
    head.bytes += "\r\n";
    return head;
}

void CHTTPRequest::rewindBody() {
    if (!getBody()) return;
    const P<IResetableInStream> body = tryCast<IResetableInStream>(getBody());
    if (!body)
        throw CInvalidObjectStateError(
            localize("peru.net.CHTTPOperation.cannotReset.requestBodyStreamNotResetable",
                     "Cannot reset HTTP operation because the request body stream is not resetable."),
            P<IBase>::share(this));
    body->reset();
}

} // namespace peru::net
