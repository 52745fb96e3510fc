// Failures of sockets.
#pragma once

#include "peru/Errors.h"

namespace peru::net {

class PERU_API CSocketError : public CError {
    PERU_EXCEPTION(CSocketError)
    explicit CSocketError(int code); // an errno value
    int getCode() const { return m_code; }

private:
    int m_code;
};

} // namespace peru::net
