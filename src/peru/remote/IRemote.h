// Calls of procedures in another process.
#pragma once

#include "peru/Exception.h"
#include "peru/remote/RemoteProcs.h"

namespace peru {

class PERU_API IRemote : public virtual IBase {
public:
    // Offers a procedure to the other end; one of the same name is replaced. The object is used by the
    // thread that serves, for one call at a time.
    virtual void addProc(const P<CRemoteProc>& proc) = 0;
    // Sends a request with the parameters of `proc` and, for a function, waits for the answer and reads it
    // into the results of `proc`. Throws CRemoteException if the other end does not have the procedure,
    // reports an error or answers something else, and the exception of a stream that fails.
    virtual void call(const P<CRemoteProc>& proc) = 0;
};

// Called on the serving thread as the last thing it does, whoever ends it. `error` is null unless the
// connection has failed. The thread may not be stopped by waiting for it from here.
class PERU_API IRemoteListener : public virtual IBase {
public:
    virtual void onWorkEnded(IRemote* remote, const CException* error) = 0;
};

} // namespace peru
