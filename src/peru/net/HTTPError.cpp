#include "peru/net/HTTPError.h"

#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"
#include "peru/uri/IURI.h"

namespace peru::net {

PERU_EXCEPTION_IMPL(CHTTPError)
CHTTPError::CHTTPError(int32_t status, const CStringArg& reason, const P<IURI>& uri)
    : CURIError("", uri), m_status(status) {
    m_description = format("%s %d (%s)", localize("peru.net.CHTTPError.msg", "HTTP error"), status,
                           reason.isEmpty() ? CStringArg("unknown") : reason);
}

CError makeIllegalResponseError() {
    return CError(localize("peru.net.CHTTPResponse.IllegalResponse",
                           "The response received from the HTTP server does not have the expected format."));
}

} // namespace peru::net
