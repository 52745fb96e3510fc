// Creates both ends of pipes.
#pragma once

#include "peru/pipes/IPipeServer.h"

namespace peru {

// Pipes connect processes of one user on one machine. A short name has 1 to 80 bytes and contains no
// separators and control characters and no "." at its start; otherwise both operations throw
// CInvalidArgError.
class PERU_API IPipeManager : public virtual IBase {
public:
    virtual P<IPipeServer> createServer(const P<IString>& name) = 0;
    virtual P<IPipeClient> createClient(const P<IString>& name) = 0;
};

PERU_API P<IPipeManager> getPipeManager();

} // namespace peru
