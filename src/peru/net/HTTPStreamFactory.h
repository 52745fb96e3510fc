// Streams over HTTP resources.
#pragma once

#include "peru/streams/StreamFactory.h"

namespace peru::net {

// Supports reading URIs with the scheme "http". The stream is returned before the server has answered, since
// the stream manager opens one stream at a time; the first operation on it waits for the response and throws
// what goes wrong, CHTTPError for a resource that does not exist.
class PERU_API CHTTPStreamFactory : public CStreamFactory {
public:
    ~CHTTPStreamFactory() override;
    P<IInStream> tryGetInStream(const P<IURI>& uri) override;
};

} // namespace peru::net
