// Failures of HTTP exchanges.
#pragma once

#include "peru/Errors.h"

namespace peru::net {

// A status that reports a failure.
class PERU_API CHTTPError : public CURIError {
    PERU_EXCEPTION(CHTTPError)
    CHTTPError(int32_t status, const CStringArg& reason, const P<IURI>& uri);
    int32_t getStatus() const { return m_status; }

private:
    int32_t m_status;
};

// The error for bytes that are not an HTTP response.
PERU_API CError makeIllegalResponseError();

} // namespace peru::net
