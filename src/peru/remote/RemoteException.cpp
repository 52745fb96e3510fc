#include "peru/remote/RemoteException.h"

namespace peru {

PERU_EXCEPTION_IMPL(CRemoteException)
CRemoteException::CRemoteException(const P<IString>& message) : CException(nullptr, message) {}

} // namespace peru
