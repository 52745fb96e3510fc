// Resolution of host names by the system.
#pragma once

#include "peru/net/INetNameResolver.h"
#include "peru/net/posix/BackgroundTask.h"

namespace peru::net::posix {

// Addresses in the URI are taken at once, names are looked up on a thread of their own, since the system's
// look-up cannot be polled or cancelled.
class CTCPUDPNameResolver : public CObject, public INetNameResolver {
public:
    class CResolution;

    CTCPUDPNameResolver();
    ~CTCPUDPNameResolver() override;

    P<INetNameResolution> tryStart(const P<IURI>& uri) override;
};

class CTCPUDPNameResolver::CResolution : public CObject, public INetNameResolution {
public:
    using CTask = TBackgroundTask<std::vector<P<INetAddress>>>;

    explicit CResolution(const P<CTask>& task);
    ~CResolution() override;

    bool isDone(const SNetWait& wait) override;
    std::vector<P<INetAddress>> getAddresses() const override;

private:
    P<CTask> m_task;
};

} // namespace peru::net::posix
