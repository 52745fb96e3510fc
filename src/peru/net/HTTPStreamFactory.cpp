#include "peru/net/HTTPStreamFactory.h"

#include "peru/net/HTTPInStream.h"

namespace peru::net {

CHTTPStreamFactory::~CHTTPStreamFactory() = default;

P<IInStream> CHTTPStreamFactory::tryGetInStream(const P<IURI>& uri) {
    if (!CHTTPRequest::isSupported(uri)) return nullptr;
    const P<CHTTPClient> client =
        make<CHTTPClient>(make<CHTTPRequest>("GET", uri), SHTTPSettings(), nullptr, nullptr);
    client->advance(false);
    return make<CHTTPInStream>(client, CHTTPInStream::EStatus::success);
}

} // namespace peru::net
