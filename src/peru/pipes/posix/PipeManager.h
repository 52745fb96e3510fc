// Creates pipes over sockets.
#pragma once

#include "peru/Object.h"
#include "peru/pipes/IPipeManager.h"

namespace peru::posix {

class CPipeManager : public CObject, public IPipeManager {
public:
    P<IPipeServer> createServer(const P<IString>& name) override;
    P<IPipeClient> createClient(const P<IString>& name) override;
};

} // namespace peru::posix
