// The errors of remote calls.
#pragma once

#include "peru/Exception.h"
#include "peru/strings/String.h"

namespace peru {

// The message is the title; the description is empty.
class PERU_API CRemoteException : public CException {
    PERU_EXCEPTION(CRemoteException)
    explicit CRemoteException(const P<IString>& message);
};

} // namespace peru
