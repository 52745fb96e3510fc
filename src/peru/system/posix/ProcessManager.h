// Starts processes.
#pragma once

#include "peru/Object.h"
#include "peru/system/IDynamicLibrary.h"

namespace peru::posix {

// The child gets the three standard files, default signals and the parent's environment. Where the parent
// runs with less than normal priority and may not raise it, the child does too.
class CProcessManager : public CObject, public IProcessManager {
public:
    P<IProcess> start(const P<IURI>& executable, const std::vector<P<IString>>& arguments) override;
    int64_t getCurrentProcessId() const override;
};

} // namespace peru::posix
